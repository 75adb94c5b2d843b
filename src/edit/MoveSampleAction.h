#pragma once

#include "edit/Action.h"

namespace glimmet {

/// "Move Sample": records a channel the user has dragged along the time
/// axis. The drag itself moved the channel; Go does nothing, undo and redo
/// shift the channel's first frame by the recorded offset. Listed in no menu.
class MoveSampleAction : public Action {
public:
    using Action::Action;

    /// B_OK when a document and one of its channels are bound, else B_ERROR.
    status_t InitCheck() override;
    /// Moves are bound with the other SetTo: this one always fails.
    status_t SetTo(ChannelManager* manager, EditContext* context) override;
    /// offset is the channel's first frame before the move minus its first
    /// frame after it. B_BAD_VALUE for a null document or channel.
    status_t SetTo(ChannelManager* manager, Channel* channel, int64_t offset);
    status_t Go() override;
    status_t Undo() override;
    status_t Redo() override;
    const char* Name() override;
    const char* PreferredMenu() override;

    int64_t Offset() const { return offset_; }

private:
    /// Moves the channel back by the recorded offset (undo) or forward
    /// again (redo); B_ERROR, changing nothing, when it has left the
    /// document, and the history then drops the move.
    status_t Shift(bool back);

    /// The moved channel by its id: a pointer could outlive the channel
    /// when the document loses it by a path the history does not see.
    uint64_t channelId_ = 0;
    int64_t offset_ = 0;
};

}  // namespace glimmet
