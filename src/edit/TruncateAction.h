#pragma once

#include <memory>
#include <vector>

#include "edit/Action.h"
#include "sound/SampleSlice.h"

namespace glimmet {

/// "Truncate": keeps only the range of every selected channel, deleting
/// what lies before and after it. It keeps its own records of the deleted
/// head and tail instead of the base snapshot.
class TruncateAction : public Action {
public:
    using Action::Action;

    /// Records, per selected channel, the frames before and after the
    /// range and the channel's first frame. B_BAD_VALUE for a null pointer.
    status_t SetTo(ChannelManager* manager, EditContext* context) override;
    /// B_ERROR when not bound. The range is left as it was.
    status_t Go() override;
    status_t Undo() override;
    status_t Redo() override;
    const char* Name() override;
    void VisitKeptLists(const ListVisitor& visit) const override;

    int32_t KeptChannelCount() const { return int32_t(records_.size()); }

private:
    /// What truncating took from one selected channel.
    struct KeptChannel {
        SampleSlice head;  // shared blocks, not copies
        bool hasHead = false;  // false when the channel starts after the range start
        int64_t headCount = 0;
        SampleSlice tail;
        bool hasTail = false;  // false when nothing follows the range
        int64_t tailCount = 0;
        int64_t firstFrame = 0;
        int32_t index = 0;
    };

    KeptChannel Record(Channel* channel, int32_t index);
    std::vector<int32_t> RecordedIndexes() const;
    void PutBack(Channel* channel, const KeptChannel& record);

    std::vector<KeptChannel> records_;
};

}  // namespace glimmet
