#include "edit/MoveSampleAction.h"

#include "edit/ChannelView.h"
#include "sound/Channel.h"

namespace glimmet {

status_t MoveSampleAction::InitCheck()
{
    return channel_ != nullptr && view_ != nullptr ? B_OK : B_ERROR;
}

status_t MoveSampleAction::SetTo(ChannelManager*, ChannelContainer*)
{
    return B_ERROR;
}

status_t MoveSampleAction::SetTo(Channel* channel, ChannelView* view, int64_t offset)
{
    if (channel == nullptr || view == nullptr)
        return B_BAD_VALUE;
    channel_ = channel;
    view_ = view;
    offset_ = offset;
    return B_OK;
}

status_t MoveSampleAction::Go()
{
    return B_OK;
}

status_t MoveSampleAction::Shift(int64_t frames)
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    channel_->SetStartFrameOffset(channel_->FirstFrame() + frames);
    view_->Update();
    return B_OK;
}

status_t MoveSampleAction::Undo()
{
    return Shift(offset_);
}

status_t MoveSampleAction::Redo()
{
    return Shift(-offset_);
}

const char* MoveSampleAction::Name()
{
    return "Move Sample";
}

const char* MoveSampleAction::PreferredMenu()
{
    return "";
}

}  // namespace glimmet
