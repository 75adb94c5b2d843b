#include "views/PlayModeButton.h"

namespace glimmet {

PlayModeButton::PlayModeButton(const char* name, const Message& message, MessageTarget* target, int32_t mode,
    QWidget* parent)
    : TransportButton(name, target, QSize(46, 21), parent), mode_(mode), message_(message)
{
}

void PlayModeButton::SetMode(int32_t mode)
{
    if (mode == mode_)
        return;
    mode_ = mode;
    DropPicture();
}

int32_t PlayModeButton::ToggledMode(int32_t mode)
{
    switch (mode) {
    case kPlaying:
        return kPaused;
    case kPaused:
        return kPlaying;
    case kPlayingBackward:
        return kPausedBackward;
    case kPausedBackward:
        return kPlayingBackward;
    default:
        return kPaused;
    }
}

// The backward pictures are not among the resources, so modes 2 and 3 draw
// nothing, as does any other mode.
QString PlayModeButton::PictureName() const
{
    if (!IsEnabled())
        return QStringLiteral("Playbutton-disabled");
    const bool pushed = IsPushed();
    switch (mode_) {
    case kPlaying:
        return pushed ? QStringLiteral("Playbutton-pushedforpause") : QStringLiteral("Playbutton-playing");
    case kPaused:
        return pushed ? QStringLiteral("Playbutton-pushedforplaying") : QStringLiteral("Playbutton-paused");
    case kPlayingBackward:
        return pushed ? QStringLiteral("Playbutton-pushedforpausebackward")
                      : QStringLiteral("Playbutton-playingbackward");
    case kPausedBackward:
        return pushed ? QStringLiteral("Playbutton-pushedforplayingbackward")
                      : QStringLiteral("Playbutton-pausedbackwards");
    default:
        return {};
    }
}

void PlayModeButton::ReleasedInside()
{
    mode_ = ToggledMode(mode_);
    DropPicture();
    Send(message_, mode_);
}

}  // namespace glimmet
