#include "edit/AddChannelAction.h"

#include "edit/ChannelContainer.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

AddChannelAction::~AddChannelAction() = default;

status_t AddChannelAction::SetTo(ChannelManager* manager, ChannelContainer* container)
{
    if (manager == nullptr || container == nullptr)
        return B_BAD_VALUE;
    BindDocument(manager, container);
    return B_OK;
}

status_t AddChannelAction::Go()
{
    if (Manager() == nullptr || Container() == nullptr)
        return B_ERROR;
    channel_ = new Channel();
    Manager()->AddChannel(channel_);
    view_ = Container()->AddChannel(channel_);
    return B_OK;
}

status_t AddChannelAction::Undo()
{
    if (Manager() == nullptr)
        return B_ERROR;
    owned_ = Manager()->RemoveChannel(channel_);
    if (Container() != nullptr && view_ != nullptr)
        Container()->RemoveSampleView(view_);
    view_ = nullptr;
    return B_OK;
}

status_t AddChannelAction::Redo()
{
    if (Manager() == nullptr)
        return B_ERROR;
    if (owned_ == nullptr)
        return B_OK;  // the channel never left the document
    Manager()->AddChannel(owned_.release());
    view_ = Container()->AddChannel(channel_);
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
