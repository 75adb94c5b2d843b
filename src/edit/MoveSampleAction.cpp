#include "edit/MoveSampleAction.h"

#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

status_t MoveSampleAction::InitCheck()
{
    return channelId_ != 0 && Manager() != nullptr ? B_OK : B_ERROR;
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
    channelId_ = channel->Id();
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
    Channel* channel = Manager()->ChannelWithId(channelId_);
    if (channel == nullptr)
        return B_ERROR;
    channel->SetStartFrameOffset(channel->FirstFrame() + frames);
    Manager()->ChannelChanged(channel);
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
