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
    const bool recorded = RecordGoInput();
    RangeTransformer transformer(manager_, rangeStart_, rangeEnd_);
    transformer.TransformSelected(transform);
    RecordGoOutput(recorded && transformer.InitCheck() == B_OK);
    return transformer.InitCheck();
}

status_t Action::TransformSelectedRanges(const PieceTransform& transform)
{
    std::lock_guard guard(manager_->DocumentLock());
    const bool recorded = RecordGoInput();
    RangeTransformer transformer(manager_, rangeStart_, rangeEnd_);
    transformer.TransformSelected(transform);
    RecordGoOutput(recorded && transformer.InitCheck() == B_OK);
    return transformer.InitCheck();
}

void Action::ForgetGoRecord()
{
    for (SavedChannel& saved : savedChannels_) {
        saved.redoHeld = false;
        saved.redo = SampleSlice();
        saved.undone = SampleSlice();
    }
}

bool Action::RecordGoInput()
{
    ForgetGoRecord();
    if (!RedoPutsResultBack() || savedChannels_.empty() || frameCount_ < 1)
        return false;
    // The transform reads every selected channel; its result is a function
    // of the recorded channels' ranges alone only when exactly those are
    // selected and every range lies inside its channel's data (a channel
    // the read refuses would get the previous channel's samples).
    size_t next = 0;
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        if (next >= savedChannels_.size() || savedChannels_[next].index != i || !RangeInside(channel))
            return false;
        SavedChannel& saved = savedChannels_[next++];
        saved.redoChannel = channel->Id();
        if (channel->ReadSlice(rangeStart_, frameCount_, &saved.undone) != B_OK)
            return false;
    }
    return next == savedChannels_.size();
}

void Action::RecordGoOutput(bool recorded)
{
    if (!recorded) {
        ForgetGoRecord();
        return;
    }
    for (SavedChannel& saved : savedChannels_) {
        Channel* channel = manager_->ChannelAt(saved.index);
        if (channel == nullptr || channel->ReadSlice(rangeStart_, frameCount_, &saved.redo) != B_OK) {
            ForgetGoRecord();
            return;
        }
    }
    for (SavedChannel& saved : savedChannels_)
        saved.redoHeld = true;
}

bool Action::RangeInside(Channel* channel) const
{
    return channel->FirstFrame() <= rangeStart_ && rangeEnd_ < channel->EndFrame();
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
    // What the last Go made stays good for a redo only while the channel
    // still shows it: an undo since of a later action need not have given
    // the range back exactly.
    bool keepResult = RedoPutsResultBack();
    size_t visited = 0;
    RestoreSelection([this, &keepResult, &visited](Channel* channel, size_t record) {
        visited++;
        SavedChannel& saved = savedChannels_[record];
        SampleSlice now;
        keepResult = keepResult && saved.redoHeld && channel->Id() == saved.redoChannel && RangeInside(channel) &&
            channel->ReadSlice(rangeStart_, frameCount_, &now) == B_OK && now.SameSamples(saved.redo);
        if (saved.held)
            channel->ReplaceFrames(saved.data, rangeStart_, rangeEnd_);
    });
    if (!keepResult || visited != savedChannels_.size())
        ForgetGoRecord();
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
        // Go would compute what it kept only from the samples it read then.
        SampleSlice now;
        if (!RangeInside(channel) || channel->ReadSlice(rangeStart_, frameCount_, &now) != B_OK ||
            !now.SameSamples(saved.undone))
            return false;
    }
    // Go works on every selected channel: one selected since, after the
    // last recorded one (the selection walk leaves those alone), would be
    // transformed too.
    for (int32_t i = savedChannels_.back().index + 1; Channel* channel = manager_->ChannelAt(i); i++) {
        if (channel->IsSelected())
            return false;
    }
    // The same channels hold, inside their data, what the last Go read:
    // Go would compute what it made then. The record stays for the next
    // undo and redo.
    RestoreSelection([this](Channel* channel, size_t record) {
        channel->ReplaceFrames(savedChannels_[record].redo, rangeStart_, rangeEnd_);
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
    if (!putBack) {
        // A Go that does not reach the transform keeps no record.
        ForgetGoRecord();
        RestoreSelection(nullptr);
    }
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

void Action::VisitKeptLists(const ListVisitor& visit) const
{
    for (const SavedChannel& record : savedChannels_) {
        for (const SampleSlice* slice : {&record.data, &record.redo, &record.undone}) {
            visit(slice->blocks);
        }
    }
}

}  // namespace glimmet
