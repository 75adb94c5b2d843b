#pragma once

namespace glimmet {

/// What the engine needs of the view that draws one channel (SampleView
/// implements it): whether it has the keyboard focus, and a full redraw.
class ChannelView {
public:
    virtual ~ChannelView() = default;

    virtual bool IsFocus() const = 0;
    /// Redraws the whole view from the channel's data.
    virtual void Update() = 0;
};

}  // namespace glimmet
