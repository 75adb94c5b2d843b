#include "playback/BufferPlan.h"

#include <algorithm>
#include <cmath>

namespace glimmet {

int64_t BufferPlan::MicrosOfFrames(int64_t frames, float frameRate)
{
    if (!(frameRate > 0))
        return 0;
    // The frame count is taken as unsigned for the conversion.
    return std::llround(double(uint64_t(frames)) / double(frameRate) * 1000000.0);
}

int64_t BufferPlan::MixFramesPerBuffer(uint32_t bufferSize, uint32_t channelCount)
{
    // The mixer always writes stereo; the count of frames follows the
    // format's channel count as the connection states it.
    if (channelCount == 0)
        return 0;
    return int64_t(bufferSize / 4) / int64_t(channelCount);
}

int64_t BufferPlan::MixerFrames(const MediaFormat& format)
{
    // Buffers beyond the largest size get no buffers at all (see
    // BufferCount), so the mixer need not hold them either.
    const uint32_t bufferSize = std::min(format.bufferSize, kLargestBufferSize);
    return MixFramesPerBuffer(bufferSize, format.channelCount);
}

int64_t BufferPlan::BufferDuration(const MediaFormat& format)
{
    const int64_t samplesPerSecond = std::llround(double(format.channelCount) * double(format.frameRate));
    return samplesPerSecond > 0 ? int64_t(format.bufferSize / 4) * 1000000 / samplesPerSecond : 0;
}

int64_t BufferPlan::BufferCount(const MediaFormat& format, int64_t duration, int64_t downstreamLatency,
    bool requirePositiveDuration)
{
    int64_t count = 0;
    if (duration > 0)
        count = downstreamLatency / duration + 2;
    else if (!requirePositiveDuration)
        count = 2;  // no duration to divide by yet: the two buffers any group has
    count = std::clamp<int64_t>(count, 0, kMostBuffers);
    if (format.bufferSize > kLargestBufferSize)
        count = 0;
    return count;
}

size_t BufferPlan::SpareFloats(const MediaFormat& format)
{
    const int64_t frames = MixFramesPerBuffer(format.bufferSize, format.channelCount);
    const size_t floats = format.bufferSize / 4;
    return size_t(frames) * 2 > floats ? size_t(frames) * 2 - floats : 0;
}

}  // namespace glimmet
