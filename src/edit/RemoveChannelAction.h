#pragma once

#include <memory>

#include "edit/Action.h"

namespace glimmet {

/// "Remove Channel": removes the channel whose view has the keyboard focus.
/// With no focused view it does nothing, and so do its undo and redo.
class RemoveChannelAction : public Action {
public:
    using Action::Action;
    ~RemoveChannelAction() override;

    /// Binds without a snapshot; B_BAD_VALUE for a null pointer.
    status_t SetTo(ChannelManager* manager, EditContext* context) override;
    status_t Go() override;
    /// Puts the channel back at its old position.
    status_t Undo() override;
    /// Removes the channel at that position again.
    status_t Redo() override;
    const char* Name() override;
    const char* PreferredMenu() override;

    /// The channel the last Go or Redo took out while the action holds it,
    /// else null.
    Channel* RemovedChannel() const { return owned_.get(); }
    int32_t Index() const { return index_; }

private:
    void RemoveAtIndex();

    /// Whether Go found a channel to remove; Redo removes again only then.
    bool removedOne_ = false;
    int32_t index_ = 0;
    /// Holds the channel while it is outside the document, so that it is
    /// freed with the action rather than lost.
    std::unique_ptr<Channel> owned_;
};

}  // namespace glimmet
