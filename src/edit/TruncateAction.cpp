#include "edit/TruncateAction.h"

#include <cstring>
#include <mutex>

#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

namespace {

// The frames as FillBuffer gives them, kept as shared blocks (silence where
// the read fails); false only when memory is short or count is out of
// reach.
bool KeepRange(Channel* channel, int64_t start, int64_t count, SampleSlice* slice)
{
    return channel->ReadSlice(start, count, slice) != B_NO_MEMORY;
}

}  // namespace

status_t TruncateAction::SetTo(ChannelManager* manager, EditContext* context)
{
    if (manager == nullptr || context == nullptr)
        return B_BAD_VALUE;
    BindDocument(manager, context);
    CopyRangeAndCursor();
    std::lock_guard guard(manager->DocumentLock());
    records_.clear();
    for (int32_t i = 0; Channel* channel = manager->ChannelAt(i); i++) {
        if (channel->IsSelected())
            records_.push_back(Record(channel, i));
    }
    return B_OK;
}

TruncateAction::KeptChannel TruncateAction::Record(Channel* channel, int32_t index)
{
    KeptChannel record;
    record.firstFrame = channel->FirstFrame();
    record.index = index;
    if (record.firstFrame <= RangeStart()) {
        record.headCount = RangeStart() - record.firstFrame;
        record.hasHead = KeepRange(channel, record.firstFrame, record.headCount, &record.head);
    }
    const int64_t tailCount = record.firstFrame + channel->FrameCount() - RangeEnd() - 1;
    if (tailCount > 0) {
        record.tailCount = tailCount;
        record.hasTail = KeepRange(channel, RangeEnd() + 1, tailCount, &record.tail);
    }
    return record;
}

status_t TruncateAction::Go()
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    std::lock_guard guard(Manager()->DocumentLock());
    for (int32_t i = 0; Channel* channel = Manager()->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        channel->RemoveFrames(RangeEnd() + 1, channel->FirstFrame() + channel->FrameCount() - 1);
        // From frame 0, not from the channel's first frame.
        channel->RemoveFrames(0, RangeStart() - 1);
        channel->SetSelected(false);
    }
    return B_OK;
}

std::vector<int32_t> TruncateAction::RecordedIndexes() const
{
    std::vector<int32_t> indexes;
    for (const KeptChannel& record : records_)
        indexes.push_back(record.index);
    return indexes;
}

void TruncateAction::PutBack(Channel* channel, const KeptChannel& record)
{
    channel->SetStartFrameOffset(record.firstFrame);
    if (record.hasHead)
        channel->InsertFrames(record.head, record.firstFrame);
    if (record.hasTail)
        channel->InsertFrames(record.tail, RangeEnd() + 1);
}

status_t TruncateAction::Undo()
{
    if (Manager() == nullptr)
        return B_ERROR;
    std::lock_guard guard(Manager()->DocumentLock());
    WalkRecordedChannels(RecordedIndexes(),
        [this](Channel* channel, size_t record) { PutBack(channel, records_[record]); });
    RestoreRange();
    return B_OK;
}

status_t TruncateAction::Redo()
{
    if (Manager() == nullptr)
        return B_ERROR;
    {
        std::lock_guard guard(Manager()->DocumentLock());
        RestoreRange();
        WalkRecordedChannels(RecordedIndexes(), nullptr);
    }
    return Go();
}

const char* TruncateAction::Name()
{
    return "Truncate";
}

void TruncateAction::VisitKeptLists(const ListVisitor& visit) const
{
    Action::VisitKeptLists(visit);
    for (const KeptChannel& record : records_) {
        for (const SampleSlice* slice : {&record.head, &record.tail}) {
            visit(slice->blocks);
        }
    }
}

}  // namespace glimmet
