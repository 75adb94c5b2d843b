#pragma once

#include "views/TransportButton.h"

namespace glimmet {

/// The play/pause button of the transport bar, 46 x 21. A click (press and
/// release inside) toggles the mode and sends the template with "when",
/// "source" and the new "mode".
///
/// Modes: 0 playing forward, 1 paused forward, 2 playing backward, 3 paused
/// backward. GUI thread only.
class PlayModeButton : public TransportButton {
    Q_OBJECT

public:
    enum Mode : int32_t { kPlaying = 0, kPaused = 1, kPlayingBackward = 2, kPausedBackward = 3 };

    /// target is not owned; the template is copied.
    PlayModeButton(const char* name, const Message& message, MessageTarget* target, int32_t mode,
        QWidget* parent = nullptr);

    int32_t Mode() const { return mode_; }
    /// When changed: stores it and redraws. Sends nothing.
    void SetMode(int32_t mode);

    QString PictureName() const override;

    /// The mode a click moves to: 0 and 1 swap, 2 and 3 swap, any other
    /// value becomes 1.
    static int32_t ToggledMode(int32_t mode);

protected:
    void ReleasedInside() override;

private:
    int32_t mode_;
    Message message_;
};

}  // namespace glimmet
