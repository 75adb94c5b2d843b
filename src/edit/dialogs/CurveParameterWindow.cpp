#include "edit/dialogs/CurveParameterWindow.h"

#include <QHBoxLayout>
#include <QVBoxLayout>

#include "views/SplineControl.h"

namespace glimmet {

CurveParameterWindow::CurveParameterWindow(QWidget* parent, MessageTarget* target, const Kind& kind)
    : ParameterDialog(parent, target, kind.title)
{
    control_ = new SplineControl(kind.controlName, kind.controlTitle, kind.controlLabel, kind.y0, kind.y1, this);
    column_ = new QVBoxLayout(this);
    column_->setContentsMargins(5, 5, 5, 5);
    column_->addWidget(control_, 1);
    column_->addLayout(ButtonRow());
}

CurveParameterWindow::~CurveParameterWindow() = default;

double CurveParameterWindow::ValueAt(double x) const
{
    return 1.0 - control_->ValueAt(x);
}

int32_t CurveParameterWindow::NumPasses() const
{
    return 0;
}

void CurveParameterWindow::AddRowAboveButtons(QLayout* row)
{
    column_->insertLayout(column_->count() - 1, row);
}

}  // namespace glimmet
