#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "sound/SampleAllocator.h"
#include "sound/SampleSlice.h"
#include "support/Status.h"

namespace glimmet {

class Channel;
class ChannelManager;
class EditContext;
class MessageTarget;
struct PieceTransform;

/// One undoable change to a document.
///
/// SetTo binds the action to a document and takes a snapshot of the range of
/// every selected channel; the base Undo writes that snapshot back and the
/// base Redo restores range and selection and runs Go again. Actions run in
/// the window's thread; everything that touches sound data takes the
/// document lock (ChannelManager::Lock) for its sample work.
class Action {
public:
    /// window receives the messages of the action's parameter dialog; it is
    /// not owned and may be null for actions without a dialog.
    explicit Action(MessageTarget* window);
    virtual ~Action();
    Action(const Action&) = delete;
    Action& operator=(const Action&) = delete;

    /// B_OK once SetTo bound a document and an edit context, else B_NO_INIT.
    virtual status_t InitCheck();
    /// Binds the action to the document and to where the user edits it (not
    /// owned; both outlive the action), and snapshots the range of every
    /// selected channel. B_BAD_VALUE, changing nothing, when either pointer
    /// is null.
    virtual status_t SetTo(ChannelManager* manager, EditContext* context);
    /// Performs the action; the base version does nothing and fails.
    virtual status_t Go();
    /// Writes the snapshot back and restores range and selection.
    virtual status_t Undo();
    /// Restores range and selection, then runs Go again; for an action whose
    /// result depends on the range's samples alone (RedoPutsResultBack), the
    /// result the undo took away is put back instead when that is what Go
    /// would compute.
    virtual status_t Redo();
    virtual const char* Name();
    /// The menu the window lists the action's command under.
    virtual const char* PreferredMenu();
    /// True when the action asks for parameters in a dialog before it runs.
    virtual bool SupportsConfiguration();

    MessageTarget* Window() const { return window_; }
    ChannelManager* Manager() const { return manager_; }
    EditContext* Context() const { return context_; }
    int64_t RangeStart() const { return rangeStart_; }
    int64_t RangeEnd() const { return rangeEnd_; }
    int64_t Cursor() const { return cursor_; }
    /// Frames in the range as stored at SetTo (range end - range start + 1).
    int64_t FrameCount() const { return frameCount_; }
    int32_t SavedChannelCount() const { return int32_t(savedChannels_.size()); }
    /// Bytes of sample data the snapshot keeps beyond what the channels
    /// share with it: the blocks cut at the range's edges, and the silence
    /// outside the data at two bytes a frame (it takes no memory, but it is
    /// what the undo writes back that no channel holds). Blocks the snapshot
    /// shares with a channel count nothing.
    int64_t SnapshotBytes() const;

    /// Calls visit once for every block list the action keeps for its undo
    /// and redo. The history counts their references to find the blocks only
    /// it holds; a list left out only keeps its blocks in memory.
    using ListVisitor = std::function<void(const BlockList& list)>;
    virtual void VisitKeptLists(const ListVisitor& visit) const;

    /// An uninitialised sample array of count samples, or null when count is
    /// not a size a channel can hold (below 1 or above 2^32 - 1) or memory
    /// is short.
    /// Comes from the shared SampleAllocator: a long range gets one mapping
    /// faulted in at once instead of page by page as it is copied.
    static SampleAllocator::Array AllocateSamples(int64_t count);

protected:
    /// True for actions whose Go rewrites only the ranges of the selected
    /// channels, from their samples alone: a redo may then put back what Go
    /// made instead of computing it again. Actions that read a dialog at
    /// every run keep the default (false).
    virtual bool RedoPutsResultBack() const { return false; }

    /// One selected channel's range as it was at SetTo.
    struct SavedChannel {
        /// The range as FillBuffer gives it, kept as shared blocks.
        SampleSlice data;
        bool held = false;  // false when it could not be had
        int32_t index = 0;  // position in the manager
        /// True when the range lay inside the channel's data at SetTo: the
        /// transforms then change nothing but the range, and undo gives the
        /// range back exactly.
        bool inside = false;
        /// The range as the last Go's transform left it, for a redo that
        /// puts it back instead of computing it again.
        SampleSlice redo;
        /// True while redo and undone are good: the last Go transformed
        /// exactly the recorded channels, each inside its data, and every
        /// undo since found redo still in place.
        bool redoHeld = false;
        uint64_t redoChannel = 0;  // the channel they were taken from
        /// The range as the last Go's transform read it: a redo puts the
        /// result back only while the range holds these samples again.
        SampleSlice undone;
    };

    /// Keeps the channel's range in record: its blocks, shared.
    void SnapshotChannel(Channel* channel, SavedChannel& record) const;

    /// Called for each recorded channel met by WalkRecordedChannels with the
    /// channel and the position of its record.
    using RecordVisitor = std::function<void(Channel* channel, size_t record)>;

    /// Walks the channels in index order against recorded channel indexes
    /// (ascending): a recorded channel is selected and handed to visit, any
    /// other channel met before the last record is deselected; channels
    /// after it keep their state. Caller holds the document lock.
    void WalkRecordedChannels(const std::vector<int32_t>& indexes, const RecordVisitor& visit);
    /// The walk over the snapshot's records, with visit (may be empty) for
    /// each recorded channel.
    void RestoreSelection(const RecordVisitor& visit);
    void RestoreRange();

    /// Binds document and context without a snapshot (actions that keep
    /// their own undo data).
    void BindDocument(ChannelManager* manager, EditContext* context);
    /// Copies the document's range and the context's cursor, as SetTo does.
    void CopyRangeAndCursor();

    const std::vector<SavedChannel>& SavedChannels() const { return savedChannels_; }

    /// Runs transform over the stored range of every selected channel, in
    /// channel order, under the document lock (see RangeTransformer).
    /// B_NO_MEMORY, changing nothing, when no working buffer can be had.
    status_t TransformSelectedRanges(const std::function<void(int16_t*, int64_t)>& transform);
    /// The same a piece at a time, in memory bounded by a block per
    /// channel whatever the range's length.
    status_t TransformSelectedRanges(const PieceTransform& transform);

    /// For a Go that runs its own RangeTransformer instead of
    /// TransformSelectedRanges: call RecordGoInput before the transformer
    /// reads anything and RecordGoOutput (with what it returned, and false
    /// when the transformer failed) once it wrote its results, both under
    /// the document lock, so that a redo can put those results back.
    /// RecordGoInput is true when the result can be put back later.
    bool RecordGoInput();
    /// Keeps what the transform made when recorded, else forgets the record.
    void RecordGoOutput(bool recorded);

private:
    void TakeSnapshot();
    /// Puts back the results the last Go made; false, changing nothing,
    /// unless every recorded channel holds again what that Go read.
    bool PutResultBack();
    void ForgetGoRecord();
    bool RangeInside(Channel* channel) const;

    MessageTarget* window_;
    ChannelManager* manager_ = nullptr;
    EditContext* context_ = nullptr;
    int64_t rangeStart_ = 0;
    int64_t rangeEnd_ = 0;
    int64_t cursor_ = 0;
    std::vector<SavedChannel> savedChannels_;
    int64_t frameCount_ = 0;
};

}  // namespace glimmet
