#pragma once

#include <algorithm>
#include <cstdint>
#include <vector>

#include "sound/Channel.h"
#include "sound/SampleBlock.h"

namespace glimmet::test {

/// A channel's data as one array, read span by span as the program reads it.
inline std::vector<int16_t> SamplesOf(Channel& channel)
{
    std::vector<int16_t> samples;
    samples.reserve(size_t(std::max<int64_t>(0, channel.FrameCount())));
    channel.ReadSpans(0, channel.FrameCount(), [&samples](const SampleSpan& span) {
        samples.insert(samples.end(), span.samples, span.samples + span.count);
    });
    return samples;
}

/// The identities of the blocks the channel reads, in order: lets a test see
/// which blocks an edit shared and which it made.
inline std::vector<uint64_t> BlockIdsOf(Channel& channel)
{
    std::vector<uint64_t> ids;
    channel.ReadSpans(0, channel.FrameCount(), [&ids](const SampleSpan& span) { ids.push_back(span.block->Id()); });
    return ids;
}

/// Where the channel's first sample is stored, or null without data: lets a
/// test see whether an operation kept the channel's storage.
inline const int16_t* FirstStoredSample(Channel& channel)
{
    const int16_t* first = nullptr;
    channel.ReadSpans(0, 1, [&first](const SampleSpan& span) {
        if (first == nullptr)
            first = span.samples;
    });
    return first;
}

/// Gives the channel new data of the same first frame. Blocks are never
/// written in place, so views and history that hold the old ones see the
/// change as a change, as they would after an edit; the caller tells the
/// document, when it matters, as an action would.
inline void SetSamples(Channel& channel, const std::vector<int16_t>& samples)
{
    SampleAllocator::Array array = Channel::Allocate(int64_t(samples.size()));
    std::copy(samples.begin(), samples.end(), array.get());
    channel.SetTo(std::move(array), int64_t(samples.size()));
}

/// Sets one sample of the data (index counted from the first frame).
inline void SetSampleAt(Channel& channel, int64_t index, int16_t value)
{
    std::vector<int16_t> samples = SamplesOf(channel);
    samples.at(size_t(index)) = value;
    SetSamples(channel, samples);
}

}  // namespace glimmet::test
