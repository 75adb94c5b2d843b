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
    if (count_ < 1 || !NeedsBuffer())
        return;
    if (count_ > kLargestRange) {
        status_ = B_NO_MEMORY;
        return;
    }
    buffer_.reset(new (std::nothrow) int16_t[size_t(count_)]);
    if (buffer_ == nullptr)
        status_ = B_NO_MEMORY;
}

RangeTransformer::~RangeTransformer() = default;

bool RangeTransformer::InPlace(Channel* channel) const
{
    return channel->Data() != nullptr && start_ >= channel->FirstFrame()
        && end_ < channel->FirstFrame() + channel->FrameCount();
}

bool RangeTransformer::NeedsBuffer() const
{
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (channel->IsSelected() && !InPlace(channel))
            return true;
    }
    return false;
}

int16_t* RangeTransformer::RangeOf(Channel* channel) const
{
    return channel->Data() + (start_ - channel->FirstFrame());
}

void RangeTransformer::Fill(Channel* channel)
{
    if (channel->FillBuffer(buffer_.get(), start_, count_)) {
        contents_ = buffer_.get();
        return;
    }
    if (contents_ == nullptr)
        std::memset(buffer_.get(), 0, size_t(count_) * sizeof(int16_t));
    else if (contents_ != buffer_.get())
        std::memcpy(buffer_.get(), contents_, size_t(count_) * sizeof(int16_t));
    contents_ = buffer_.get();
}

void RangeTransformer::TransformSelected(const Transform& transform)
{
    if (status_ != B_OK || count_ < 1)
        return;
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        if (InPlace(channel)) {
            int16_t* range = RangeOf(channel);
            transform(range, count_);
            contents_ = range;
            continue;
        }
        Fill(channel);
        transform(buffer_.get(), count_);
        channel->ReplaceFrames(buffer_.get(), count_, start_, end_);
    }
}

void RangeTransformer::InspectSelected(const Inspector& inspector)
{
    if (status_ != B_OK || count_ < 1)
        return;
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        if (InPlace(channel)) {
            contents_ = RangeOf(channel);
        } else {
            Fill(channel);
        }
        inspector(contents_, count_);
    }
}

}  // namespace glimmet
