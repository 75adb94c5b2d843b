#include "edit/RangeTransformer.h"

#include <cstring>
#include <new>

#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

namespace {

// Channels hold at most 2^32 - 1 samples; no range can need more.
constexpr int64_t kLargestRange = int64_t(UINT32_MAX);

}  // namespace

RangeTransformer::RangeTransformer(ChannelManager* manager, int64_t start, int64_t end)
    : manager_(manager), start_(start), end_(end), count_(end - start + 1)
{
    // A range that ends before it starts has no frames: every channel
    // operation refuses it and nothing changes.
    if (count_ < 1 || !AnySelected())
        return;
    if (count_ > kLargestRange) {
        status_ = B_NO_MEMORY;
        return;
    }
    buffer_ = Channel::Allocate(count_);
    if (buffer_ == nullptr) {
        status_ = B_NO_MEMORY;
        return;
    }
    std::memset(buffer_.get(), 0, size_t(count_) * sizeof(int16_t));
}

RangeTransformer::~RangeTransformer() = default;

bool RangeTransformer::AnySelected() const
{
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (channel->IsSelected())
            return true;
    }
    return false;
}

void RangeTransformer::TransformSelected(const Transform& transform)
{
    if (status_ != B_OK || count_ < 1 || buffer_ == nullptr)
        return;
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        channel->FillBuffer(buffer_.get(), start_, count_);
        transform(buffer_.get(), count_);
        channel->ReplaceFrames(buffer_.get(), count_, start_, end_);
    }
}

void RangeTransformer::InspectSelected(const Inspector& inspector)
{
    if (status_ != B_OK || count_ < 1 || buffer_ == nullptr)
        return;
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        channel->FillBuffer(buffer_.get(), start_, count_);
        inspector(buffer_.get(), count_);
    }
}

}  // namespace glimmet
