#pragma once

#include "views/TransportButton.h"

namespace glimmet {

/// The play-from-the-beginning button of the transport bar, 38 x 21. It
/// sends at the press itself: the left template for the left button, the
/// right template for the right button without the left, each with "when"
/// and "source"; the release sends nothing.
///
/// Modes: 0 forward, 1 backward. GUI thread only.
class PlayButton : public TransportButton {
    Q_OBJECT

public:
    enum Mode : int32_t { kForward = 0, kBackward = 1 };

    /// target is not owned; the templates are copied.
    PlayButton(const char* name, const Message& leftMessage, const Message& rightMessage, MessageTarget* target,
        int32_t mode, QWidget* parent = nullptr);

    int32_t Mode() const { return mode_; }
    /// When changed: stores it and redraws. Sends nothing.
    void SetMode(int32_t mode);

    QString PictureName() const override;

protected:
    void Pressed(Qt::MouseButtons buttons) override;

private:
    int32_t mode_;
    Message leftMessage_;
    Message rightMessage_;
};

}  // namespace glimmet
