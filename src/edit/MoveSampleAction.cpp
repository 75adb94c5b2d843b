#include "edit/MoveSampleAction.h"

#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/FrameArithmetic.h"

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

status_t MoveSampleAction::Shift(bool back)
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    Channel* channel = Manager()->ChannelWithId(channelId_);
    if (channel == nullptr)
        return B_ERROR;
    const int64_t first = channel->FirstFrame();
    // Redo subtracts rather than adding the negated offset, which does not
    // exist for the most negative one.
    channel->SetStartFrameOffset(back ? SaturatingAdd(first, offset_) : SaturatingSubtract(first, offset_));
    Manager()->ChannelChanged(channel);
    return B_OK;
}

status_t MoveSampleAction::Undo()
{
    return Shift(true);
}

status_t MoveSampleAction::Redo()
{
    return Shift(false);
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
