#include "edit/dialogs/FParameterWindow.h"

#include <QHBoxLayout>
#include <QLabel>

#include <cmath>

#include "edit/dialogs/SpinButton.h"

namespace glimmet {

namespace {

const CurveParameterWindow::Kind kFilter{QStringLiteral("FIR Filter"), QStringLiteral("filter func"),
    QStringLiteral("Filter Function"), QStringLiteral("1.0"), 0.85f, 1.0f};

// The tap count a filter starts with.
constexpr double kDefaultPasses = 10.0;

}  // namespace

FParameterWindow::FParameterWindow(QWidget* parent, MessageTarget* target)
    : CurveParameterWindow(parent, target, kFilter)
{
    passes_ = new SpinButton(this);
    passes_->setValue(kDefaultPasses);
    auto* label = new QLabel(QStringLiteral("Filter passes:"), this);
    label->setBuddy(passes_);
    auto* row = new QHBoxLayout;
    row->addStretch(1);
    row->addWidget(label);
    row->addWidget(passes_);
    row->addStretch(1);
    AddRowAboveButtons(row);
}

int32_t FParameterWindow::NumPasses() const
{
    // The field holds no more than int32 can take, so the truncation fits.
    return int32_t(std::trunc(passes_->value()));
}

}  // namespace glimmet
