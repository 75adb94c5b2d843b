#pragma once

#include <cstdint>

namespace glimmet {

class Channel;
class ChannelView;

/// What actions and loading need of the view that stacks one ChannelView per
/// channel (ChannelContainerView implements it), so that the engine and its
/// tests need no widgets. View i shows channel i of the channel manager.
class ChannelContainer {
public:
    virtual ~ChannelContainer() = default;

    /// The edit cursor's frame.
    virtual int64_t CursorFrame() = 0;
    /// Index of the first channel view that has the focus; 0 when none has.
    virtual int32_t FocusedChannel() = 0;

    virtual int32_t CountChannelViews() = 0;
    /// Null when index is out of range.
    virtual ChannelView* ChannelViewAt(int32_t index) = 0;

    /// Appends a view for the channel and returns it (owned by the container).
    virtual ChannelView* AddChannel(Channel* channel) = 0;
    /// Inserts a view for the channel at index.
    virtual void AddChannelAt(Channel* channel, int32_t index) = 0;
    virtual void RemoveSampleView(ChannelView* view) = 0;
    virtual void RemoveSampleViewAt(int32_t index) = 0;
    /// Redraws every channel view.
    virtual void UpdateAll() = 0;
};

}  // namespace glimmet
