#include "edit/dialogs/ParameterDialog.h"

#include <QCloseEvent>
#include <QHBoxLayout>
#include <QPushButton>

#include "support/MessageCodes.h"
#include "support/MessageTarget.h"

namespace glimmet {

namespace {

// Where a new dialog appears on the screen, and the size it starts from
// before its contents ask for more.
constexpr QPoint kHome(200, 200);
constexpr QSize kStartSize(101, 101);

}  // namespace

ParameterDialog::ParameterDialog(QWidget* parent, MessageTarget* target, const QString& title)
    : QDialog(parent), target_(target)
{
    setWindowTitle(title);
    setWindowModality(Qt::WindowModal);
    setWindowFlag(Qt::WindowMaximizeButtonHint, false);
    setWindowFlag(Qt::WindowContextHelpButtonHint, false);
    setAttribute(Qt::WA_DeleteOnClose, false);

    cancel_ = new QPushButton(QStringLiteral("Cancel"), this);
    ok_ = new QPushButton(QStringLiteral("Ok"), this);
    ok_->setDefault(true);
    ok_->setAutoDefault(true);
    cancel_->setAutoDefault(false);
    connect(cancel_, &QPushButton::clicked, this, [this] { Answer(kMsgActionCancel); });
    connect(ok_, &QPushButton::clicked, this, [this] { Answer(kMsgActionGo); });
    buttons_ = new QHBoxLayout;
    buttons_->addWidget(cancel_, 1);
    buttons_->addWidget(ok_, 1);
}

ParameterDialog::~ParameterDialog() = default;

void ParameterDialog::ShowAtHome()
{
    move(kHome);
    resize(kStartSize.expandedTo(minimumSizeHint()));
    show();
}

void ParameterDialog::QuitLater()
{
    hide();
    deleteLater();
}

void ParameterDialog::Answer(uint32_t what)
{
    if (target_ != nullptr)
        target_->PostMessage(what);
}

void ParameterDialog::closeEvent(QCloseEvent* event)
{
    // The close box cancels; the window goes when its action does.
    event->ignore();
    Answer(kMsgActionCancel);
}

void ParameterDialog::reject()
{
    // Escape is the keyboard's close box.
    Answer(kMsgActionCancel);
}

}  // namespace glimmet
