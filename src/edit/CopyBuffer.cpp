#include "edit/CopyBuffer.h"

namespace glimmet {

bool CopyBuffer::SetCopyBuffer(std::vector<Samples> channels, int64_t frames)
{
    if (channels.empty() || frames < 1)
        return false;
    std::lock_guard guard(lock_);
    channels_ = std::move(channels);
    frames_ = frames;
    return true;
}

bool CopyBuffer::GetCopyBuffer(std::vector<const int16_t*>& channels, int32_t& count, int64_t& frames) const
{
    std::lock_guard guard(lock_);
    if (frames_ < 1 || channels_.empty())
        return false;
    count = int32_t(channels_.size());
    frames = frames_;
    channels.clear();
    for (const Samples& samples : channels_)
        channels.push_back(samples.get());
    return true;
}

}  // namespace glimmet
