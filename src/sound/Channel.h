#pragma once

#include <cstdint>
#include <memory>
#include <mutex>

#include "sound/SampleAllocator.h"
#include "support/Locker.h"
#include "support/Status.h"

namespace glimmet {

/// One mono track of the document: signed 16-bit samples placed on the
/// timeline at a first frame, with its own mute flag, selection flag and pan.
///
/// Every operation takes the channel's own lock, so the audio thread may read
/// a channel while the GUI thread edits it. Edits that change the amount of
/// data build a new array and swap it in; nothing is resized in place.
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

    /// Adopts samples (allocated with new[]) as this channel's data; false,
    /// changing nothing, for a null pointer or a count below 1. Meant for a
    /// freshly made channel: the first frame is left as it is.
    bool SetTo(int16_t* samples, int64_t count);
    /// Adopts an array from a SampleAllocator, which takes it back when the
    /// channel lets go of it; otherwise as above (a null array or a count
    /// below 1 changes nothing and frees the array).
    bool SetTo(SampleAllocator::Array samples, int64_t count);

    /// Writes count samples of the channel's timeline from start into buffer:
    /// zeros where the channel is silent. False for a null buffer, and for a
    /// request that starts exactly at the end of the data ("what the....?").
    bool FillBuffer(int16_t* buffer, int64_t start, int64_t count);

    status_t InsertFrames(const int16_t* frames, int64_t count, int64_t at);
    status_t ReplaceFrames(const int16_t* frames, int64_t count, int64_t from, int64_t to);
    status_t RemoveFrames(int64_t from, int64_t to);

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
    /// hold of the lock.
    struct MixSource {
        bool muted = false;
        int8_t pan = kPanMiddle;
        /// The samples FillBuffer would copy for the same request, which
        /// belong at index offset of the request on; every other index is
        /// silence. Null, with length 0, when nothing would be copied.
        const int16_t* samples = nullptr;
        int64_t offset = 0;
        int64_t length = 0;
        /// How many samples of the array follow the copied ones.
        int64_t following = 0;
    };

    /// Calls mix(const MixSource&) for count frames of the timeline from
    /// start while holding the channel's lock, so the samples stay valid and
    /// unchanged during the call: the mixer sums them where they lie instead
    /// of copying them out. Returns what FillBuffer would return for the
    /// request, and prints what it would print.
    template <typename Mix>
    bool ReadForMix(int64_t start, int64_t count, Mix&& mix)
    {
        std::lock_guard guard(lock_);
        MixSource source;
        source.muted = muted_;
        source.pan = pan_;
        const bool filled = FindSamples(start, count, &source.samples, &source.offset, &source.length);
        if (source.length > 0)
            source.following = samples_.get() + count_ - (source.samples + source.length);
        mix(static_cast<const MixSource&>(source));
        return filled;
    }

    /// The sample array itself, valid only while no edit runs (callers hold
    /// the document lock). Null for a channel that never held data.
    int16_t* Data();

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
    /// Frees through the deleter that knows where the memory came from: the
    /// shared SampleAllocator, or delete[] for adopted arrays.
    using SampleArray = SampleAllocator::Array;

    /// Which samples a request of count frames of the timeline from start
    /// copies: *length samples from *samples on go to index *offset of the
    /// request, the rest of it is silence. False, after printing "what
    /// the....?", for a request that starts exactly at the end of the data.
    /// The lock is held.
    bool FindSamples(int64_t start, int64_t count, const int16_t** samples, int64_t* offset, int64_t* length) const;
    void Install(SampleArray samples, int64_t count);
    status_t InsertIntoData(const int16_t* frames, int64_t count, int64_t at);
    status_t ReplaceInData(const int16_t* frames, int64_t count, int64_t from, int64_t to);
    status_t ReplaceAll(const int16_t* frames, int64_t count, int64_t first);
    int64_t End() const { return first_ + count_; }

    const uint64_t id_;
    // All other fields are guarded by lock_.
    SampleArray samples_;
    int64_t count_ = 0;
    int64_t first_ = 0;
    float frameRate_ = 0;
    bool selected_ = false;
    bool muted_ = false;
    int8_t pan_ = kPanMiddle;
    Locker lock_;
};

}  // namespace glimmet
