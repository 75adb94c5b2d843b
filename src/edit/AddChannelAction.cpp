#include "edit/AddChannelAction.h"

#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

AddChannelAction::~AddChannelAction() = default;

status_t AddChannelAction::SetTo(ChannelManager* manager, EditContext* context)
{
    if (manager == nullptr || context == nullptr)
        return B_BAD_VALUE;
    BindDocument(manager, context);
    return B_OK;
}

status_t AddChannelAction::Go()
{
    if (Manager() == nullptr || Context() == nullptr)
        return B_ERROR;
    Channel* channel = Manager()->AddChannel(std::make_unique<Channel>());
    channelId_ = channel != nullptr ? channel->Id() : 0;
    return B_OK;
}

Channel* AddChannelAction::AddedChannel() const
{
    if (owned_ != nullptr)
        return owned_.get();
    if (Manager() == nullptr || channelId_ == 0)
        return nullptr;
    return Manager()->ChannelWithId(channelId_);
}

status_t AddChannelAction::Undo()
{
    if (Manager() == nullptr)
        return B_ERROR;
    // A channel that has already left the document (it was replaced by an
    // opened file, say) is not found and nothing is taken out.
    if (channelId_ != 0)
        owned_ = Manager()->RemoveChannel(Manager()->ChannelWithId(channelId_));
    return B_OK;
}

status_t AddChannelAction::Redo()
{
    if (Manager() == nullptr)
        return B_ERROR;
    if (owned_ == nullptr)
        return B_OK;  // the channel never left the document
    Manager()->AddChannel(std::move(owned_));
    return B_OK;
}

const char* AddChannelAction::Name()
{
    return "Add Channel";
}

const char* AddChannelAction::PreferredMenu()
{
    return "Channel";
}

}  // namespace glimmet
