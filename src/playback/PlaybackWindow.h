#pragma once

#include <cstdint>

namespace glimmet {

/// What the PlaybackController needs of the document window and its views.
/// The document window implements it; every call comes on the window thread
/// from inside PlaybackController::MessageReceived.
class PlaybackWindow {
public:
    virtual ~PlaybackWindow() = default;

    /// ChannelContainerView::SetPlaymarkFrame: move the play mark to frame.
    /// The view answers with 'pmup' when it has drawn it (also when it
    /// rejects the frame).
    virtual void SetPlaymarkFrame(int64_t frame) = 0;
    /// ChannelContainerView::SetPlaymarkToCursor: the play position becomes
    /// the edit cursor's frame.
    virtual void SetPlaymarkToCursor() = 0;
    /// PlayModeButton::SetMode: 0 shows the running state, 1 the stopped one.
    virtual void SetPlayModeButtonMode(int32_t mode) = 0;
    /// The index of the first marked item of the "Play" popup (0 "All",
    /// 1 "Range", 2 "Visible"), or -1 when no item is marked.
    virtual int32_t MarkedPlayModeIndex() = 0;
    /// Whether the "Loop" box is checked.
    virtual bool IsLoopChecked() = 0;
};

}  // namespace glimmet
