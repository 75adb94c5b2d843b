#include "edit/dialogs/CurveParameterWindow.h"

#include <QCloseEvent>
#include <QHBoxLayout>
#include <QPushButton>
#include <QVBoxLayout>

#include "support/MessageCodes.h"
#include "support/MessageTarget.h"
#include "views/SplineControl.h"

namespace glimmet {

namespace {

// Where a new dialog appears on the screen, and the size it starts from
// before its contents ask for more.
constexpr QPoint kHome(200, 200);
constexpr QSize kStartSize(101, 101);

}  // namespace

CurveParameterWindow::CurveParameterWindow(QWidget* parent, MessageTarget* target, const Kind& kind)
    : QDialog(parent), target_(target)
{
    setWindowTitle(kind.title);
    setWindowModality(Qt::WindowModal);
    setWindowFlag(Qt::WindowMaximizeButtonHint, false);
    setWindowFlag(Qt::WindowContextHelpButtonHint, false);
    setAttribute(Qt::WA_DeleteOnClose, false);

    control_ = new SplineControl(kind.controlName, kind.controlTitle, kind.controlLabel, kind.y0, kind.y1, this);
    cancel_ = new QPushButton(QStringLiteral("Cancel"), this);
    ok_ = new QPushButton(QStringLiteral("Ok"), this);
    ok_->setDefault(true);
    ok_->setAutoDefault(true);
    cancel_->setAutoDefault(false);
    connect(cancel_, &QPushButton::clicked, this, [this] { Answer(kMsgActionCancel); });
    connect(ok_, &QPushButton::clicked, this, [this] { Answer(kMsgActionGo); });

    auto* buttons = new QHBoxLayout;
    buttons->addWidget(cancel_, 1);
    buttons->addWidget(ok_, 1);
    column_ = new QVBoxLayout(this);
    column_->setContentsMargins(5, 5, 5, 5);
    column_->addWidget(control_, 1);
    column_->addLayout(buttons);
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

void CurveParameterWindow::ShowAtHome()
{
    move(kHome);
    resize(kStartSize.expandedTo(minimumSizeHint()));
    show();
}

void CurveParameterWindow::Answer(uint32_t what)
{
    if (target_ != nullptr)
        target_->PostMessage(what);
}

void CurveParameterWindow::closeEvent(QCloseEvent* event)
{
    // The close box cancels; the window goes when its action does.
    event->ignore();
    Answer(kMsgActionCancel);
}

void CurveParameterWindow::reject()
{
    // Escape is the keyboard's close box.
    Answer(kMsgActionCancel);
}

}  // namespace glimmet
