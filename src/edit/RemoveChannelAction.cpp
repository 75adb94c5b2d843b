#include "edit/RemoveChannelAction.h"

#include "edit/EditContext.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

RemoveChannelAction::~RemoveChannelAction() = default;

status_t RemoveChannelAction::SetTo(ChannelManager* manager, EditContext* context)
{
    if (manager == nullptr || context == nullptr)
        return B_BAD_VALUE;
    BindDocument(manager, context);
    return B_OK;
}

void RemoveChannelAction::RemoveAtIndex()
{
    owned_ = Manager()->RemoveChannel(Manager()->ChannelAt(index_));
    removedOne_ = true;
}

status_t RemoveChannelAction::Go()
{
    if (Manager() == nullptr || Context() == nullptr)
        return B_ERROR;
    const int32_t focus = Context()->FocusIndex();
    if (focus >= 0 && focus < Manager()->CountChannels()) {
        index_ = focus;
        RemoveAtIndex();
    }
    return B_OK;
}

status_t RemoveChannelAction::Undo()
{
    if (Manager() == nullptr || Context() == nullptr)
        return B_ERROR;
    // A removal that found no focused view has nothing to put back.
    if (owned_ == nullptr)
        return B_OK;
    // Refused (the document has fewer channels now), it stays with the
    // action rather than being lost.
    owned_ = Manager()->AddChannel(std::move(owned_), index_);
    return B_OK;
}

status_t RemoveChannelAction::Redo()
{
    if (Manager() == nullptr || Context() == nullptr)
        return B_ERROR;
    if (!removedOne_)
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
