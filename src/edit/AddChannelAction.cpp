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
    channel_ = Manager()->AddChannel(std::make_unique<Channel>());
    return B_OK;
}

status_t AddChannelAction::Undo()
{
    if (Manager() == nullptr)
        return B_ERROR;
    owned_ = Manager()->RemoveChannel(channel_);
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
