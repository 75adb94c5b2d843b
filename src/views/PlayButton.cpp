#include "views/PlayButton.h"

namespace glimmet {

PlayButton::PlayButton(const char* name, const Message& leftMessage, const Message& rightMessage,
    MessageTarget* target, int32_t mode, QWidget* parent)
    : TransportButton(name, target, QSize(38, 21), parent),
      mode_(mode),
      leftMessage_(leftMessage),
      rightMessage_(rightMessage)
{
}

void PlayButton::SetMode(int32_t mode)
{
    if (mode == mode_)
        return;
    mode_ = mode;
    DropPicture();
}

// The backward pictures are not among the resources: mode 1 draws nothing.
QString PlayButton::PictureName() const
{
    QString stem;
    if (mode_ == kForward)
        stem = QStringLiteral("ForwardFromBeginning-");
    else if (mode_ == kBackward)
        stem = QStringLiteral("BackwardFromBeginning-");
    else
        return {};
    if (!IsEnabled())
        return stem + QStringLiteral("disabled");
    return stem + (IsPushed() ? QStringLiteral("pushed") : QStringLiteral("normal"));
}

void PlayButton::Pressed(Qt::MouseButtons buttons)
{
    if (buttons & Qt::LeftButton)
        Send(leftMessage_);
    else if (buttons & Qt::RightButton)
        Send(rightMessage_);
}

}  // namespace glimmet
