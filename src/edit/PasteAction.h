#pragma once

#include "edit/Action.h"
#include "sound/SampleSlice.h"

namespace glimmet {

class CopyBuffer;

/// "Paste": puts a copy buffer (the application's) into the document, over the
/// range of the selected channels when there is a valid range, otherwise in
/// front of the cursor into the focused channel and those after it.
///
/// Go works without taking the document lock (each channel operation locks
/// its channel) and ends with one ChannelManager::Unlock that it never
/// took; the document lock ignores an unlock by a thread that does not hold
/// it. The redo is the base one: the buffer is pasted again as it is then.
class PasteAction : public Action {
public:
    /// copyBuffer is what Go pastes; not owned, and null pastes nothing.
    PasteAction(MessageTarget* window, const CopyBuffer* copyBuffer);

    /// Replaces the buffer a later Go or Redo pastes from.
    void SetCopyBuffer(const CopyBuffer* copyBuffer) { copyBuffer_ = copyBuffer; }

    /// B_ERROR when not bound; B_OK otherwise, also when there is nothing to
    /// paste (the empty paste is still recorded).
    status_t Go() override;
    /// Removes inserted frames, or puts the replaced range back.
    status_t Undo() override;
    const char* Name() override;

    int64_t PasteStart() const { return pasteStart_; }
    int64_t PasteEnd() const { return pasteEnd_; }
    int32_t FirstChannel() const { return firstChannel_; }
    int32_t PastedChannelCount() const { return pastedChannelCount_; }

private:
    int32_t FirstSelectedChannel();
    bool ReplaceMode() const;
    void PasteOverRange(const std::vector<SampleSlice>& buffers, int64_t frames);
    void InsertAtCursor(const std::vector<SampleSlice>& buffers, int64_t frames);
    void RemoveInsertedFrames();

    const CopyBuffer* copyBuffer_;
    // Written by Go, read by Undo; all start at 0 except the first channel.
    int64_t pasteStart_ = 0;
    int64_t pasteEnd_ = 0;
    int32_t firstChannel_ = -1;
    int32_t pastedChannelCount_ = 0;
    /// Whether the last Go had a buffer to paste. An empty paste still
    /// enters the history; its undo must then leave the samples alone
    /// instead of writing the snapshot over frames it never pasted.
    bool pasted_ = false;
};

}  // namespace glimmet
