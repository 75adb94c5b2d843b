#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <mutex>

#include "sound/BlockList.h"
#include "sound/SampleAllocator.h"
#include "sound/SampleSlice.h"
#include "support/Locker.h"
#include "support/Status.h"

namespace glimmet {

class BlockBuilder;

/// One mono track of the document: signed 16-bit samples placed on the
/// timeline at a first frame, with its own mute flag, selection flag and pan.
///
/// Every operation takes the channel's own lock, so the audio thread may read
/// a channel while the GUI thread edits it. The samples live in a list of
/// immutable shared blocks: an edit builds a new list that shares every
/// block it leaves alone, copies only the blocks it cuts, and swaps the list
/// in. Nothing is ever written in place.
class Channel {
public:
    static constexpr int8_t kPanLeft = -128;
    static constexpr int8_t kPanMiddle = 0;
    static constexpr int8_t kPanRight = 127;

    Channel();
    ~Channel();

    /// Never shared with another channel while the program runs, so the
    /// history can refer to a channel by it and find out whether that
    /// channel is still in the document instead of keeping a pointer that
    /// may outlive it.
    uint64_t Id() const { return id_; }
    Channel(const Channel&) = delete;
    Channel& operator=(const Channel&) = delete;

    /// Takes samples (allocated with new[]) as this channel's data; false,
    /// changing nothing, for a null pointer or a count below 1. Meant for a
    /// freshly made channel: the first frame is left as it is. An array of
    /// up to a block is kept as it is; a longer one is cut into blocks and
    /// freed.
    bool SetTo(int16_t* samples, int64_t count);
    /// Takes an array from a SampleAllocator: cut into blocks, then given
    /// back; otherwise as above (a null array or a count below 1 changes
    /// nothing and frees the array).
    bool SetTo(SampleAllocator::Array samples, int64_t count);
    /// Takes blocks as this channel's data, as the loader builds them; false,
    /// changing nothing, for an empty list.
    bool SetTo(BlockList blocks);

    /// Writes count samples of the channel's timeline from start into buffer:
    /// zeros where the channel is silent. False for a null buffer, and for a
    /// request that starts exactly at the end of the data ("what the....?").
    bool FillBuffer(int16_t* buffer, int64_t start, int64_t count);

    status_t InsertFrames(const int16_t* frames, int64_t count, int64_t at);
    status_t ReplaceFrames(const int16_t* frames, int64_t count, int64_t from, int64_t to);
    status_t RemoveFrames(int64_t from, int64_t to);

    /// The same edits with kept samples: the slice's blocks are shared, not
    /// copied, and its silence is written as silence. The result is that of
    /// the array versions with the slice's samples laid out in an array.
    status_t InsertFrames(const SampleSlice& frames, int64_t at);
    status_t ReplaceFrames(const SampleSlice& frames, int64_t from, int64_t to);

    /// What FillBuffer would write for the same request, kept as shared
    /// blocks (only the blocks cut at the edges are new). B_ERROR, after
    /// printing what FillBuffer prints, when FillBuffer would fail: *slice
    /// is then silence, as a buffer cleared beforehand would be.
    /// B_NO_MEMORY when a block cannot be had or count is not a length a
    /// channel can hold (0 to 2^32 - 1).
    status_t ReadSlice(int64_t start, int64_t count, SampleSlice* slice);

    /// Calls f(const SampleSpan&) for the samples of data index index ..
    /// index + count - 1 (clipped to the data), in order, while holding the
    /// lock. The spans stay valid only during the call.
    template <typename F>
    void ReadSpans(int64_t index, int64_t count, F&& f)
    {
        std::lock_guard guard(lock_);
        blocks_.ForEachSpan(index, count, f);
    }

    bool IsMuted();
    void SetMuted(bool muted);
    bool IsSelected();
    void SetSelected(bool selected);
    int8_t PanPosition();
    /// Stores -128, 0 or 127 as given; any other value becomes 0.
    void SetPanPosition(int8_t pan);

    int64_t FirstFrame();
    /// A negative offset is stored as 0, one beyond kLastFirstFrame as
    /// kLastFirstFrame.
    void SetStartFrameOffset(int64_t first);

    /// The latest first frame a channel can have: about 790 years at 44.1 kHz,
    /// and far enough from the end of int64_t that a channel's end frame,
    /// the document's length and any range over them can be computed
    /// without overflow.
    static constexpr int64_t kLastFirstFrame = int64_t(1) << 40;
    float FrameRate();
    int64_t FrameCount();
    /// First frame + frame count, read under one lock.
    int64_t EndFrame();
    /// Mute flag and pan position, read under one lock (the mixer asks for
    /// both once per buffer).
    void GetMixSettings(bool* muted, int8_t* pan);

    /// What a mix takes from the channel for one request, read under one
    /// hold of the lock. The samples arrive in pieces, one per block.
    struct MixSource {
        bool muted = false;
        int8_t pan = kPanMiddle;
        /// Samples FillBuffer would copy for the same request, which belong
        /// at index offset of the request on; every index outside the
        /// pieces is silence. Null, with length 0, when nothing would be
        /// copied.
        const int16_t* samples = nullptr;
        int64_t offset = 0;
        int64_t length = 0;
        /// How many samples of the same block follow the piece.
        int64_t following = 0;
        /// The request's first and last piece (both for a request that
        /// copies nothing).
        bool firstPiece = true;
        bool lastPiece = true;
    };

    /// Calls mix(const MixSource&) for each piece of count frames of the
    /// timeline from start, in order, while holding the channel's lock, so
    /// the samples stay valid and unchanged during the call: the mixer sums
    /// them where they lie instead of copying them out. No reference count
    /// is touched and nothing is allocated. Returns what FillBuffer would
    /// return for the request, and prints what it would print.
    template <typename Mix>
    bool ReadForMix(int64_t start, int64_t count, Mix&& mix)
    {
        std::lock_guard guard(lock_);
        MixSource source;
        source.muted = muted_;
        source.pan = pan_;
        int64_t index = 0;
        int64_t length = 0;
        const bool filled = FindSamples(start, count, &index, &source.offset, &length);
        if (length <= 0) {
            mix(static_cast<const MixSource&>(source));
            return filled;
        }
        int64_t done = 0;
        blocks_.ForEachSpan(index, length, [&](const SampleSpan& span) {
            source.samples = span.samples;
            source.length = span.count;
            source.following = span.block->Count() - span.offset - span.count;
            source.firstPiece = done == 0;
            done += span.count;
            source.lastPiece = done == length;
            mix(static_cast<const MixSource&>(source));
            source.offset += span.count;
        });
        return filled;
    }

    /// An uninitialised array of count samples from the shared allocator, or
    /// null when it cannot be had: arrays hold 0 to 2^32 - 1 samples. Every
    /// array that may become a channel's, or a copy of one, comes from here.
    static SampleAllocator::Array Allocate(int64_t count);

    /// Loading from a track stores the decoded rate here.
    void SetFrameRate(float rate);
    /// Loading from a track stores the counted length here before it knows
    /// whether the samples can be had, and keeps it when they cannot.
    /// Samples held already stay only when they have that length, so the
    /// count never promises more samples than the array holds.
    void SetFrameCount(int64_t count);

private:
    /// Appends the new samples of an insert or replace to a builder.
    using Source = std::function<void(BlockBuilder&)>;

    /// Which samples a request of count frames of the timeline from start
    /// copies: *length samples from data index *index on go to index
    /// *offset of the request, the rest of it is silence. False, after
    /// printing "what the....?", for a request that starts exactly at the
    /// end of the data. The lock is held.
    bool FindSamples(int64_t start, int64_t count, int64_t* index, int64_t* offset, int64_t* length) const;
    /// Builds the new data of length samples with build and installs it
    /// with first frame first; failure, changing nothing, when length is
    /// not one a channel can hold or a block cannot be had.
    status_t Rebuild(int64_t length, int64_t first, const std::function<void(BlockBuilder&)>& build,
        status_t failure = B_NO_MEMORY);
    status_t Insert(const Source& frames, int64_t count, int64_t at);
    status_t Replace(const Source& frames, int64_t count, int64_t from, int64_t to);
    status_t InsertIntoData(const Source& frames, int64_t count, int64_t at);
    status_t ReplaceInData(const Source& frames, int64_t count, int64_t from, int64_t to);
    int64_t End() const { return first_ + count_; }

    const uint64_t id_;
    // All other fields are guarded by lock_. hasData_ tells an empty channel from
    // one whose data was cut down to nothing; without data blocks_ is empty
    // (count_ may still hold a length loading counted).
    BlockList blocks_;
    bool hasData_ = false;
    int64_t count_ = 0;
    int64_t first_ = 0;
    float frameRate_ = 0;
    bool selected_ = false;
    bool muted_ = false;
    int8_t pan_ = kPanMiddle;
    Locker lock_;
};

}  // namespace glimmet
