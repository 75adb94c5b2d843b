#include "edit/MoveSampleAction.h"

#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

status_t MoveSampleAction::InitCheck()
{
    return channel_ != nullptr && Manager() != nullptr ? B_OK : B_ERROR;
}

status_t MoveSampleAction::SetTo(ChannelManager*, EditContext*)
{
    return B_ERROR;
}

status_t MoveSampleAction::SetTo(ChannelManager* manager, Channel* channel, int64_t offset)
{
    if (manager == nullptr || channel == nullptr)
        return B_BAD_VALUE;
    BindDocument(manager, nullptr);
    channel_ = channel;
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
    Manager()->ChannelChanged(channel_);
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
