#include "edit/PasteAction.h"

#include <algorithm>

#include "edit/CopyBuffer.h"
#include "edit/EditContext.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/Diagnostics.h"

namespace glimmet {

PasteAction::PasteAction(MessageTarget* window, const CopyBuffer* copyBuffer)
    : Action(window), copyBuffer_(copyBuffer)
{
}

int32_t PasteAction::FirstSelectedChannel()
{
    for (int32_t i = 0; Channel* channel = Manager()->ChannelAt(i); i++) {
        if (channel->IsSelected())
            return i;
    }
    return -1;
}

bool PasteAction::ReplaceMode() const
{
    return firstChannel_ >= 0 && RangeStart() >= 0 && RangeStart() <= RangeEnd();
}

status_t PasteAction::Go()
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    firstChannel_ = FirstSelectedChannel();
    std::vector<SampleSlice> buffers;
    int64_t frames = 0;
    pasted_ = copyBuffer_ != nullptr && copyBuffer_->GetSlices(buffers, frames);
    if (pasted_) {
        pastedChannelCount_ = 0;
        if (ReplaceMode())
            PasteOverRange(buffers, frames);
        else
            InsertAtCursor(buffers, frames);
    }
    // Balances a lock this action never takes: a no-op for the document
    // lock, which only a holder can release.
    Manager()->Unlock();
    return B_OK;
}

void PasteAction::PasteOverRange(const std::vector<SampleSlice>& buffers, int64_t frames)
{
    for (size_t i = 0; i < buffers.size(); i++) {
        Channel* channel = Manager()->ChannelAt(firstChannel_ + int32_t(i));
        if (channel == nullptr)
            break;
        const status_t status = channel->ReplaceFrames(buffers[i], RangeStart(), RangeEnd());
        if (status != B_OK)
            Diagnostics::Print("error replacing frames: %s\n", StatusText(status));
        pastedChannelCount_++;
    }
    pasteStart_ = RangeStart();
    // From the cursor, not the range start: the range end then marks the
    // cursor's length of pasted frames.
    pasteEnd_ = Cursor() + frames - 1;
    Manager()->SetRangeEnd(pasteEnd_);
}

void PasteAction::InsertAtCursor(const std::vector<SampleSlice>& buffers, int64_t frames)
{
    // With no channel focused, the paste starts at the first one.
    firstChannel_ = std::max(Context()->FocusIndex(), 0);
    for (size_t i = 0; i < buffers.size(); i++) {
        Channel* channel = Manager()->ChannelAt(firstChannel_ + int32_t(i));
        if (channel == nullptr)
            break;
        const status_t status = channel->InsertFrames(buffers[i], Cursor());
        if (status != B_OK)
            Diagnostics::Print("error inserting frames: %s\n", StatusText(status));
        channel->SetSelected(true);
        pastedChannelCount_++;
    }
    pasteStart_ = Cursor();
    pasteEnd_ = Cursor() + frames - 1;
    Manager()->SetRangeStart(pasteStart_);
    Manager()->SetRangeEnd(pasteEnd_);
}

void PasteAction::RemoveInsertedFrames()
{
    for (int32_t i = 0; i < pastedChannelCount_; i++) {
        Channel* channel = Manager()->ChannelAt(firstChannel_ + i);
        if (channel == nullptr)
            break;
        const status_t status = channel->RemoveFrames(pasteStart_, pasteEnd_);
        if (status != B_OK)
            Diagnostics::Print("error removing frames while unding paste: %s\n", StatusText(status));
        channel->SetSelected(true);
    }
}

status_t PasteAction::Undo()
{
    if (Manager() == nullptr)
        return B_ERROR;
    Manager()->Lock();
    if (!pasted_) {
        // The last Go found nothing to paste and changed no sample: there is
        // nothing to take back but the range and the selection.
        RestoreSelection(nullptr);
    } else if (SavedChannelCount() == 0) {
        RemoveInsertedFrames();
    } else {
        RestoreSelection([this](Channel* channel, size_t record) {
            const SavedChannel& saved = SavedChannels()[record];
            if (saved.held)
                channel->ReplaceFrames(saved.data, pasteStart_, pasteEnd_);
        });
    }
    Manager()->SetCurrentFrame(RangeStart());
    RestoreRange();
    Manager()->Unlock();
    return B_OK;
}

const char* PasteAction::Name()
{
    return "Paste";
}

}  // namespace glimmet
