#pragma once

#include <cstddef>
#include <cstdint>

#include "playback/MediaKit.h"

namespace glimmet {

/// The arithmetic of the producer's buffers: how many frames one holds, how
/// long it lasts, how many a connection needs, and where frames fall in
/// performance time. Pure functions, safe on the audio thread.
class BufferPlan {
public:
    /// A consumer may suggest any buffer size and a device any latency;
    /// beyond these a connection is refused buffers rather than allowed to
    /// allocate without bound.
    static constexpr uint32_t kLargestBufferSize = 16u << 20;
    static constexpr int64_t kMostBuffers = 64;

    /// Microseconds that frames last at frameRate; 0 without a rate.
    static int64_t MicrosOfFrames(int64_t frames, float frameRate);
    /// Frames the mixer writes into one buffer of bufferSize bytes.
    static int64_t MixFramesPerBuffer(uint32_t bufferSize, uint32_t channelCount);
    /// Frames the mixer is prepared for, for the buffers of the format.
    static int64_t MixerFrames(const MediaFormat& format);
    /// Microseconds one buffer of the format lasts; 0 without a rate.
    static int64_t BufferDuration(const MediaFormat& format);
    /// Buffers a group needs to cover the downstream latency with buffers of
    /// the given duration. Without a duration a group gets none, or the two
    /// any group has when no positive duration is required.
    static int64_t BufferCount(const MediaFormat& format, int64_t duration, int64_t downstreamLatency,
        bool requirePositiveDuration);
    /// Floats each buffer holds beyond the format's size, so that the mixer
    /// may write its stereo frames into a buffer of fewer channels.
    static size_t SpareFloats(const MediaFormat& format);
};

}  // namespace glimmet
