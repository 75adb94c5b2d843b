#include "edit/RemoveChannelAction.h"

#include "edit/ChannelContainer.h"
#include "edit/ChannelView.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

RemoveChannelAction::~RemoveChannelAction() = default;

status_t RemoveChannelAction::SetTo(ChannelManager* manager, ChannelContainer* container)
{
    if (manager == nullptr || container == nullptr)
        return B_BAD_VALUE;
    BindDocument(manager, container);
    return B_OK;
}

void RemoveChannelAction::RemoveAtIndex()
{
    channel_ = Manager()->ChannelAt(index_);
    Container()->RemoveSampleViewAt(index_);
    owned_ = Manager()->RemoveChannel(channel_);
}

status_t RemoveChannelAction::Go()
{
    if (Manager() == nullptr || Container() == nullptr)
        return B_ERROR;
    for (int32_t i = 0; i < Container()->CountChannelViews(); i++) {
        ChannelView* view = Container()->ChannelViewAt(i);
        if (view != nullptr && view->IsFocus()) {
            index_ = i;
            RemoveAtIndex();
            return B_OK;
        }
    }
    return B_OK;
}

status_t RemoveChannelAction::Undo()
{
    if (Manager() == nullptr || Container() == nullptr)
        return B_ERROR;
    // A removal that found no focused view has nothing to put back.
    if (owned_ == nullptr)
        return B_OK;
    Manager()->AddChannel(owned_.release(), index_);
    Container()->AddChannelAt(channel_, index_);
    return B_OK;
}

status_t RemoveChannelAction::Redo()
{
    if (Manager() == nullptr || Container() == nullptr)
        return B_ERROR;
    if (channel_ == nullptr)
        return B_OK;
    RemoveAtIndex();
    return B_OK;
}

const char* RemoveChannelAction::Name()
{
    return "Remove Channel";
}

const char* RemoveChannelAction::PreferredMenu()
{
    return "Channel";
}

}  // namespace glimmet
