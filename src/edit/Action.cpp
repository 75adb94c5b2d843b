#include "edit/Action.h"

#include <cstdint>
#include <cstring>
#include <mutex>
#include <new>

#include "edit/EditContext.h"
#include "edit/RangeTransformer.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

Action::Action(MessageTarget* window) : window_(window) {}

Action::~Action() = default;

SampleAllocator::Array Action::AllocateSamples(int64_t count)
{
    if (count < 1)
        return nullptr;
    return Channel::Allocate(count);
}

status_t Action::InitCheck()
{
    if (manager_ == nullptr || context_ == nullptr)
        return B_NO_INIT;
    return B_OK;
}

void Action::BindDocument(ChannelManager* manager, EditContext* context)
{
    manager_ = manager;
    context_ = context;
}

void Action::CopyRangeAndCursor()
{
    rangeStart_ = manager_->RangeStart();
    rangeEnd_ = manager_->RangeEnd();
    cursor_ = context_->CursorFrame();
}

status_t Action::SetTo(ChannelManager* manager, EditContext* context)
{
    if (manager == nullptr || context == nullptr)
        return B_BAD_VALUE;
    BindDocument(manager, context);
    CopyRangeAndCursor();
    frameCount_ = rangeEnd_ - rangeStart_ + 1;
    TakeSnapshot();
    return B_OK;
}

void Action::TakeSnapshot()
{
    manager_->Lock();
    savedChannels_.clear();
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        SavedChannel record;
        record.index = i;
        SnapshotChannel(channel, record);
        savedChannels_.push_back(std::move(record));
    }
    manager_->Unlock();
}

void Action::SnapshotChannel(Channel* channel, SavedChannel& record) const
{
    if (frameCount_ < 1)
        return;
    // A read that fails leaves the snapshot as silence.
    record.held = channel->ReadSlice(rangeStart_, frameCount_, &record.data) != B_NO_MEMORY;
    record.inside = channel->FirstFrame() <= rangeStart_ && rangeEnd_ < channel->EndFrame();
}

int64_t Action::SnapshotBytes() const
{
    int64_t bytes = 0;
    for (const SavedChannel& record : savedChannels_) {
        if (record.held)
            bytes += record.data.newBytes + (record.data.leading + record.data.trailing) * int64_t(sizeof(int16_t));
    }
    return bytes;
}

status_t Action::TransformSelectedRanges(const std::function<void(int16_t*, int64_t)>& transform)
{
    std::lock_guard guard(manager_->DocumentLock());
    RangeTransformer transformer(manager_, rangeStart_, rangeEnd_);
    transformer.TransformSelected(transform);
    return transformer.InitCheck();
}

status_t Action::TransformSelectedRanges(const PieceTransform& transform)
{
    std::lock_guard guard(manager_->DocumentLock());
    RangeTransformer transformer(manager_, rangeStart_, rangeEnd_);
    transformer.TransformSelected(transform);
    return transformer.InitCheck();
}

status_t Action::Go()
{
    return B_ERROR;
}

void Action::WalkRecordedChannels(const std::vector<int32_t>& indexes, const RecordVisitor& visit)
{
    size_t next = 0;
    for (int32_t i = 0; next < indexes.size(); i++) {
        Channel* channel = manager_->ChannelAt(i);
        if (channel == nullptr)
            break;
        if (indexes[next] != i) {
            channel->SetSelected(false);
            continue;
        }
        channel->SetSelected(true);
        if (visit)
            visit(channel, next);
        next++;
    }
}

void Action::RestoreSelection(const RecordVisitor& visit)
{
    std::vector<int32_t> indexes;
    for (const SavedChannel& record : savedChannels_)
        indexes.push_back(record.index);
    WalkRecordedChannels(indexes, visit);
}

void Action::RestoreRange()
{
    manager_->SetRangeStart(rangeStart_);
    manager_->SetRangeEnd(rangeEnd_);
}

status_t Action::Undo()
{
    if (manager_ == nullptr)
        return B_ERROR;
    manager_->Lock();
    const bool keepResult = RedoPutsResultBack();
    RestoreSelection([this, keepResult](Channel* channel, size_t record) {
        SavedChannel& saved = savedChannels_[record];
        saved.redoHeld = keepResult && saved.held && saved.inside &&
            channel->ReadSlice(rangeStart_, frameCount_, &saved.redo) == B_OK;
        if (!saved.redoHeld)
            saved.redo = SampleSlice();
        saved.redoChannel = channel->Id();
        if (saved.held)
            channel->ReplaceFrames(saved.data, rangeStart_, rangeEnd_);
        saved.undone = SampleSlice();
        if (saved.redoHeld)
            saved.redoHeld = channel->ReadSlice(rangeStart_, frameCount_, &saved.undone) == B_OK;
    });
    RestoreRange();
    manager_->Unlock();
    return B_OK;
}

bool Action::PutResultBack()
{
    if (savedChannels_.empty())
        return false;
    for (const SavedChannel& saved : savedChannels_) {
        Channel* channel = manager_->ChannelAt(saved.index);
        if (!saved.redoHeld || channel == nullptr || channel->Id() != saved.redoChannel)
            return false;
        // Other undos and redos since may have changed what Go would read.
        SampleSlice now;
        if (channel->FirstFrame() > rangeStart_ || rangeEnd_ >= channel->EndFrame() ||
            channel->ReadSlice(rangeStart_, frameCount_, &now) != B_OK || !now.SameSamples(saved.undone))
            return false;
    }
    // Go works on every selected channel: one selected since, after the
    // last recorded one (the selection walk leaves those alone), would be
    // transformed too.
    for (int32_t i = savedChannels_.back().index + 1; Channel* channel = manager_->ChannelAt(i); i++) {
        if (channel->IsSelected())
            return false;
    }
    // Every range lay inside its channel's data, so the undo gave each back
    // exactly and Go would compute what it computed before.
    RestoreSelection([this](Channel* channel, size_t record) {
        SavedChannel& saved = savedChannels_[record];
        channel->ReplaceFrames(saved.redo, rangeStart_, rangeEnd_);
        saved.redo = SampleSlice();
        saved.undone = SampleSlice();
        saved.redoHeld = false;
    });
    return true;
}

status_t Action::Redo()
{
    if (manager_ == nullptr)
        return B_ERROR;
    manager_->Lock();
    RestoreRange();
    const bool putBack = RedoPutsResultBack() && PutResultBack();
    if (!putBack)
        RestoreSelection(nullptr);
    manager_->Unlock();
    return putBack ? B_OK : Go();
}

const char* Action::Name()
{
    return "Name of action goes here.";
}

const char* Action::PreferredMenu()
{
    return "Tools";
}

bool Action::SupportsConfiguration()
{
    return false;
}

void Action::VisitKeptBlocks(const BlockVisitor& visit) const
{
    for (const SavedChannel& record : savedChannels_) {
        for (size_t i = 0; i < record.data.blocks.BlockCount(); ++i)
            visit(record.data.blocks.BlockAt(i));
    }
}

}  // namespace glimmet
