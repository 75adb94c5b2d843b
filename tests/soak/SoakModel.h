#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "SoakChannelRules.h"
#include "SoakEffects.h"

namespace glimmet::test {

/// One channel of the model document: samples on a timeline, with the
/// flags the user sets, and whether it ever held data. A channel added by
/// "Add Channel" holds none: the first edit that writes into it places its
/// frames where they were written instead of after silence from frame 0.
struct SoakChannel {
    uint64_t id = 0;
    SoakChannelState state;
    bool hasData = true;
};

/// What the model remembers of one recorded action, enough to take it back
/// and perform it again the way the edit layer does.
struct SoakRecord {
    enum class Kind {
        FadeIn, FadeOut, Maximize, Revert, RevertPhases, Remove, Paste, Truncate,
        Move, AddChannel, RemoveChannel, Filter, Distort, PeakDistort, Envelope, Stretch
    };
    Kind kind = Kind::FadeIn;
    int64_t start = 0;
    int64_t end = 0;
    int64_t cursor = 0;
    int32_t focused = -1;
    /// Channel index and its range at binding time; empty when the range
    /// has no frames or starts before frame 0 for a transform (nothing of it
    /// can be written back there).
    std::vector<std::pair<int32_t, SoakSamples>> snapshot;
    // Paste: what Go found.
    int64_t pasteStart = 0;
    int64_t pasteEnd = 0;
    int32_t firstChannel = -1;
    int32_t pasted = 0;
    bool hadBuffer = false;
    // Truncate: per selected channel, index, first frame, head and tail.
    struct Kept {
        int32_t index;
        int64_t first;
        bool hasHead;
        SoakSamples head;
        SoakSamples tail;
    };
    std::vector<Kept> kept;
    // Move: which channel and by how much the drag moved it back.
    uint64_t channelId = 0;
    int64_t offset = 0;
    // Channel add and remove: the channel while it is out of the document.
    bool removedOne = false;
    int32_t index = 0;
    SoakChannel held;
    // The curve effects: the curve the dialog gives now (Distort, Peak
    // Distort and Envelope read it again at every redo), the filter's tap
    // count, and the session's fake dialog while the action keeps it.
    SoakCurve curve;
    int32_t taps = 0;
    void* dialog = nullptr;
    // Time Stretch: the factor typed.
    float stretch = 0.0f;
};

const char* SoakKindName(SoakRecord::Kind kind);

/// The document as the user expects it after each edit, changed by the
/// edits' own rules written out again over compact samples, with a history of
/// records mirroring the undo and redo stacks.
class SoakModel {
public:
    std::vector<SoakChannel> channels;
    int64_t rangeStart = -1;
    int64_t rangeEnd = -1;
    std::vector<SoakSamples> copyBuffer;
    /// The focused channel when an action runs (-1: none). A paste that
    /// inserts reads it then, also when redone, not when it was bound.
    int32_t focus = -1;
    std::vector<SoakRecord> undo;
    std::vector<SoakRecord> redo;

    int64_t Total() const;
    void SetRangeStart(int64_t frame);
    void SetRangeEnd(int64_t frame);
    SoakChannel* WithId(uint64_t id);

    /// Binds a new action of kind at the present range and selection, runs
    /// it and records it; the redo stack is emptied.
    void Perform(SoakRecord::Kind kind, int64_t cursor, int32_t focused);
    /// A drag has moved channel id from before to after; recorded as a move.
    void RecordMove(uint64_t id, int64_t before, int64_t after);
    /// Adds a fresh channel the way the engine numbers its channels.
    void RecordAddChannel(uint64_t id, int32_t focused);
    /// Binds and runs a curve effect or a stretch with its parameters.
    void PerformWith(SoakRecord record, int64_t cursor, int32_t focused);
    /// False also for a time stretch, which cannot be undone: it leaves the
    /// history, its change staying.
    bool Undo();
    bool Redo();
    /// "Copy": false, keeping the old buffer, with nothing selected or no
    /// frames in the range.
    bool Copy();

    // The channel edits with the data-less case of a fresh channel.
    static void Insert(SoakChannel& c, const SoakSamples& frames, int64_t at);
    static void Replace(SoakChannel& c, const SoakSamples& frames, int64_t from, int64_t to);
    static void Remove(SoakChannel& c, int64_t from, int64_t to);

private:
    SoakRecord Bind(SoakRecord::Kind kind, int64_t cursor, int32_t focused);
    void Go(SoakRecord& r);
    void UndoRecord(SoakRecord& r);
    void RedoRecord(SoakRecord& r);
    void UndoTruncate(const SoakRecord& r);
    void UndoPaste(const SoakRecord& r);
    void Walk(const std::vector<int32_t>& indexes, const std::function<void(SoakChannel&, size_t)>& visit);
    void RestoreRange(const SoakRecord& r);
    void Shift(uint64_t id, int64_t frames, bool back);
};

}  // namespace glimmet::test
