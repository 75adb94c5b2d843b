#pragma once

#include <QWidget>

class QCheckBox;
class QComboBox;
class QHBoxLayout;

namespace glimmet {

class MessageTarget;
class PlayButton;
class PlayModeButton;
class StopButton;
class TextControl;
class TransportButton;

/// The document window's row of controls above the channels, left to
/// right: the play button, the play mode button and the stop button (5
/// pixels apart and 5 before what follows), the "Play" popup, the "Loop"
/// box, a stretch that takes the free width, "Range Start:", 15 pixels,
/// "Range End:". Every control posts its command to the window.
class ControlRow : public QWidget {
    Q_OBJECT

public:
    /// window receives the controls' commands and is not owned.
    explicit ControlRow(MessageTarget* window, QWidget* parent = nullptr);

    PlayButton* Play() const { return play_; }
    PlayModeButton* PlayMode() const { return playMode_; }
    StopButton* Stop() const { return stop_; }
    /// The transport button called name ("play", "play mode", "stop"), or
    /// null.
    TransportButton* TransportButtonNamed(const QString& name) const;
    QComboBox* PlayModePopup() const { return playModePopup_; }
    QCheckBox* LoopBox() const { return loopBox_; }
    TextControl* RangeStartField() const { return rangeStartField_; }
    TextControl* RangeEndField() const { return rangeEndField_; }

private:
    void AddTransportButtons(QHBoxLayout* layout);
    QWidget* CreatePlayModePopup();
    void AddRangeFields(QHBoxLayout* layout);

    MessageTarget* window_;
    PlayButton* play_ = nullptr;
    PlayModeButton* playMode_ = nullptr;
    StopButton* stop_ = nullptr;
    QComboBox* playModePopup_ = nullptr;
    QCheckBox* loopBox_ = nullptr;
    TextControl* rangeStartField_ = nullptr;
    TextControl* rangeEndField_ = nullptr;
};

}  // namespace glimmet
