#pragma once

#include <array>
#include <cstdint>
#include <vector>

#include "sound/MixerKernels.h"

namespace glimmet {

class ChannelManager;

/// Turns a document's channels into stereo: 32-bit float for playback,
/// following the play mode, range and loop and moving the play position; and
/// 16-bit for saving, from the play position to the end of the document.
///
/// Every mix holds the document lock for the whole buffer. A mixer's scratch
/// is guarded by that lock too, so one mixer may serve several threads; the
/// audio thread nevertheless has its own, prepared when the producer is
/// connected, so that a save can never make it wait for memory.
///
/// Nothing in the scratch depends on the number of channels: up to
/// kExactIntegerSumLimit channels are summed where their samples lie (the
/// per-channel state is a fixed array of that size), and a document with
/// more is mixed one channel at a time through a buffer-sized scratch. So
/// channels added during playback need nothing new.
class Mixer {
public:
    /// How long the playback mix tries the window's lock in the visible mode.
    static constexpr int64_t kWindowLockTimeoutMicros = 100;

    /// kPrepared: only Prepare sizes the scratch, and a longer buffer is
    /// refused (for the audio thread, which must not allocate). kGrowing: a
    /// longer buffer grows the scratch first (for callers off that thread).
    enum class Sizing { kPrepared, kGrowing };

    explicit Mixer(ChannelManager* manager, Sizing sizing = Sizing::kPrepared);
    Mixer(const Mixer&) = delete;
    Mixer& operator=(const Mixer&) = delete;

    /// Sizes the scratch for buffers of up to maxFrames frames. Takes the
    /// document lock, so it may run while another thread plays.
    void Prepare(int64_t maxFrames);
    /// The longest buffer the scratch holds now; under the document lock.
    int64_t PreparedFrames() const { return capacity_; }

    /// Playback mix: frames interleaved stereo float frames from the current
    /// frame within the play range, looping at its end or, without the loop,
    /// filling the rest with silence and setting *reachedEnd: the caller then
    /// tells the window to stop. False, writing nothing, when the play range
    /// is shorter than the buffer, and (kPrepared) when the buffer is longer
    /// than prepared. Allocates nothing in kPrepared sizing.
    bool FillBuffer(float* out, int64_t frames, bool* reachedEnd);

    /// Save mix: up to *frames interleaved stereo 16-bit frames from the
    /// current frame to the end of the document; *frames becomes the number
    /// produced, which in kPrepared sizing is also at most the prepared
    /// frames. False when the current frame has reached the end.
    bool FillBuffer(int16_t* out, int64_t* frames);

private:
    /// count frames of the timeline from frame from, mixed into the buffer
    /// from index offset on.
    struct Part {
        int64_t from;
        int64_t offset;
        int64_t count;
    };

    /// The frames played, clamped to the document: all of it, the range or
    /// what the window shows.
    void PlayRange(int64_t total, int64_t* start, int64_t* end);
    /// Whether a buffer of frames fits the scratch, growing it if allowed.
    bool Fits(int64_t frames);
    void Reserve(int64_t frames);
    /// Mixes the parts (which cover the buffer from its start; the rest is
    /// silence) into interleaved stereo frames.
    template <typename Sample>
    void Mix(int32_t channelCount, int64_t frames, const Part* parts, int32_t partCount, Sample* out);
    /// Adds each heard channel's samples for the part straight from the
    /// channel into the integer sums of its sides, under the channel's lock.
    /// The first part of a buffer also notes the sides each channel is heard
    /// on in sides_.
    void AddChannels(int32_t channelCount, const Part& part, bool firstPart);
    /// For documents so crowded that a side may have more contributors than
    /// an integer sum keeps exact: each channel in turn is copied out and
    /// added to the float sums of its sides.
    template <typename Sample>
    void MixInFloat(int32_t channelCount, int64_t frames, const Part* parts, int32_t partCount, Sample* out);
    void FillChannel(int32_t index, int64_t frames, const Part* parts, int32_t partCount);

    ChannelManager* manager_;  // not owned
    Sizing sizing_;

    // Guarded by the document lock.
    int64_t capacity_ = 0;
    std::vector<int16_t> scratch_;
    std::vector<float> leftSum_;
    std::vector<float> rightSum_;
    std::vector<int32_t> integerLeft_;
    std::vector<int32_t> integerRight_;
    std::array<uint8_t, mix::kExactIntegerSumLimit> sides_{};
};

}  // namespace glimmet
