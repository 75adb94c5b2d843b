#pragma once

#include <memory>

#include "edit/Action.h"

namespace glimmet {

/// "Add Channel": appends a new, empty channel to the document (whose views
/// show it as they hear of it).
class AddChannelAction : public Action {
public:
    using Action::Action;
    ~AddChannelAction() override;

    /// Binds without a snapshot; B_BAD_VALUE for a null pointer.
    status_t SetTo(ChannelManager* manager, EditContext* context) override;
    status_t Go() override;
    /// Takes the channel out of the document; the action owns it until redo.
    status_t Undo() override;
    /// Puts the same channel back at the end.
    status_t Redo() override;
    const char* Name() override;
    const char* PreferredMenu() override;

    /// The added channel while the document or the action holds it, else
    /// null.
    Channel* AddedChannel() const;

private:
    /// The channel by its id, never by a pointer that could outlive it.
    uint64_t channelId_ = 0;
    /// Holds the channel while it is outside the document.
    std::unique_ptr<Channel> owned_;
};

}  // namespace glimmet
