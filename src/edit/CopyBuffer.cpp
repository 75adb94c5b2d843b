#include "edit/CopyBuffer.h"

#include "sound/BlockBuilder.h"
#include "sound/Channel.h"

namespace glimmet {

bool CopyBuffer::SetSlices(std::vector<SampleSlice> channels, int64_t frames)
{
    if (channels.empty() || frames < 1)
        return false;
    for (const SampleSlice& slice : channels) {
        if (slice.Count() != frames)
            return false;
    }
    std::lock_guard guard(lock_);
    channels_ = std::move(channels);
    frames_ = frames;
    arrays_.clear();
    return true;
}

bool CopyBuffer::GetSlices(std::vector<SampleSlice>& channels, int64_t& frames) const
{
    std::lock_guard guard(lock_);
    if (frames_ < 1 || channels_.empty())
        return false;
    channels = channels_;
    frames = frames_;
    return true;
}

bool CopyBuffer::SetCopyBuffer(std::vector<Samples> channels, int64_t frames)
{
    if (channels.empty() || frames < 1)
        return false;
    std::vector<SampleSlice> slices;
    for (Samples& samples : channels) {
        if (samples == nullptr)
            return false;
        BlockBuilder builder;
        builder.AppendSamples(samples.get(), frames);
        samples.reset();
        if (!builder.Ok())
            return false;
        SampleSlice slice;
        slice.blocks = builder.Finish();
        slices.push_back(std::move(slice));
    }
    return SetSlices(std::move(slices), frames);
}

bool CopyBuffer::GetCopyBuffer(std::vector<const int16_t*>& channels, int32_t& count, int64_t& frames) const
{
    std::lock_guard guard(lock_);
    if (frames_ < 1 || channels_.empty())
        return false;
    if (arrays_.empty()) {
        std::vector<Samples> arrays;
        for (const SampleSlice& slice : channels_) {
            Samples samples = Channel::Allocate(frames_);
            if (samples == nullptr)
                return false;
            slice.CopyTo(samples.get());
            arrays.push_back(std::move(samples));
        }
        arrays_ = std::move(arrays);
    }
    count = int32_t(channels_.size());
    frames = frames_;
    channels.clear();
    for (const Samples& samples : arrays_)
        channels.push_back(samples.get());
    return true;
}

}  // namespace glimmet
