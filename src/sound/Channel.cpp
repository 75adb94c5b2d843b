#include "sound/Channel.h"

#include <algorithm>
#include <atomic>
#include <cstring>
#include <new>

#include "support/Diagnostics.h"

namespace glimmet {

namespace {

void FillZeros(int16_t* destination, int64_t count)
{
    if (count > 0)
        std::memset(destination, 0, size_t(count) * sizeof(int16_t));
}

void CopySamples(int16_t* destination, const int16_t* source, int64_t count)
{
    if (count > 0)
        std::memcpy(destination, source, size_t(count) * sizeof(int16_t));
}

uint64_t NextChannelId()
{
    static std::atomic<uint64_t> next{1};
    return next.fetch_add(1, std::memory_order_relaxed);
}

}  // namespace

Channel::Channel() : id_(NextChannelId()) {}
Channel::~Channel() = default;

SampleAllocator::Array Channel::Allocate(int64_t count)
{
    if (count < 0 || count > int64_t(UINT32_MAX))
        return nullptr;
    return SampleAllocator::Shared().Allocate(size_t(count));
}

void Channel::Install(SampleArray samples, int64_t count)
{
    samples_ = std::move(samples);
    count_ = count;
}

bool Channel::SetTo(int16_t* samples, int64_t count)
{
    if (samples == nullptr || count <= 0)
        return false;
    std::lock_guard guard(lock_);
    // A fresh pointer with a fresh deleter: reset() would keep the deleter of
    // the array it replaces.
    samples_ = SampleArray(samples, SampleAllocator::Deleter());
    count_ = count;
    return true;
}

bool Channel::SetTo(SampleAllocator::Array samples, int64_t count)
{
    if (samples == nullptr || count <= 0)
        return false;
    std::lock_guard guard(lock_);
    Install(std::move(samples), count);
    return true;
}

bool Channel::FillBuffer(int16_t* buffer, int64_t start, int64_t count)
{
    std::lock_guard guard(lock_);
    if (buffer == nullptr)
        return false;
    const int16_t* samples = nullptr;
    int64_t offset = 0;
    int64_t length = 0;
    if (!FindSamples(start, count, &samples, &offset, &length))
        return false;
    FillZeros(buffer, offset);
    CopySamples(buffer + offset, samples, length);
    FillZeros(buffer + offset + length, count - offset - length);
    return true;
}

bool Channel::FindSamples(int64_t start, int64_t count, const int16_t** samples, int64_t* offset,
    int64_t* length) const
{
    *samples = nullptr;
    *offset = 0;
    *length = 0;
    const int64_t end = End();
    const int64_t last = start + count - 1;
    int64_t index = 0;
    if (start >= first_ && start < end) {
        // A request running past the data reads silence there, one ending
        // exactly one frame past it included.
        index = start - first_;
    } else if (start >= first_ && start > end) {
        return true;
    } else if (start == end) {
        Diagnostics::Print("what the....?\n");
        return false;
    } else if (last <= first_) {
        // Also when the request ends exactly on the first frame: that frame
        // reads as silence.
        return true;
    } else {
        *offset = first_ - start;
    }
    if (samples_ == nullptr)
        return true;
    *length = std::max<int64_t>(0, std::min(count - *offset, count_ - index));
    if (*length > 0)
        *samples = samples_.get() + index;
    return true;
}

status_t Channel::InsertFrames(const int16_t* frames, int64_t count, int64_t at)
{
    if (frames == nullptr || count <= 0)
        return B_BAD_VALUE;
    std::lock_guard guard(lock_);
    if (samples_ == nullptr)
        return ReplaceAll(frames, count, at);
    return InsertIntoData(frames, count, at);
}

status_t Channel::InsertIntoData(const int16_t* frames, int64_t count, int64_t at)
{
    const int64_t end = End();
    if (at >= first_ && at < end) {
        SampleArray fresh = Allocate(count_ + count);
        if (fresh == nullptr)
            return B_NO_MEMORY;
        const int64_t head = at - first_;
        CopySamples(fresh.get(), samples_.get(), head);
        CopySamples(fresh.get() + head, frames, count);
        CopySamples(fresh.get() + head + count, samples_.get() + head, count_ - head);
        Install(std::move(fresh), count_ + count);
    } else if (at >= end) {
        const int64_t length = (at - first_) + count;
        SampleArray fresh = Allocate(length);
        if (fresh == nullptr)
            return B_NO_MEMORY;
        CopySamples(fresh.get(), samples_.get(), count_);
        FillZeros(fresh.get() + count_, at - end);
        CopySamples(fresh.get() + (at - first_), frames, count);
        Install(std::move(fresh), length);
    } else {
        // Inserting before the data: the gap in front of the old data moves
        // right together with it.
        const int64_t gap = first_ - at;
        const int64_t length = gap + count + count_;
        SampleArray fresh = Allocate(length);
        if (fresh == nullptr)
            return B_NO_MEMORY;
        CopySamples(fresh.get(), frames, count);
        FillZeros(fresh.get() + count, gap);
        CopySamples(fresh.get() + count + gap, samples_.get(), count_);
        Install(std::move(fresh), length);
        first_ = at;
    }
    return B_OK;
}

status_t Channel::ReplaceAll(const int16_t* frames, int64_t count, int64_t first)
{
    SampleArray fresh = Allocate(count);
    if (fresh == nullptr)
        return B_NO_MEMORY;
    CopySamples(fresh.get(), frames, count);
    Install(std::move(fresh), count);
    first_ = first;
    return B_OK;
}

status_t Channel::ReplaceFrames(const int16_t* frames, int64_t count, int64_t from, int64_t to)
{
    if (frames == nullptr || count <= 0 || from > to || from < 0)
        return B_BAD_VALUE;
    std::lock_guard guard(lock_);
    if (samples_ == nullptr)
        return ReplaceAll(frames, count, from);
    return ReplaceInData(frames, count, from, to);
}

status_t Channel::ReplaceInData(const int16_t* frames, int64_t count, int64_t from, int64_t to)
{
    const int64_t end = End();
    if (from >= first_ && from < end) {
        const int64_t head = from - first_;
        if (to >= end) {
            Diagnostics::Print("  ending outside data\n");
        }
        const int64_t tailIndex = std::min(to - first_ + 1, count_);
        const int64_t tail = count_ - tailIndex;
        const int64_t length = head + count + tail;
        SampleArray fresh = Allocate(length);
        if (fresh == nullptr)
            return B_NO_MEMORY;
        CopySamples(fresh.get(), samples_.get(), head);
        CopySamples(fresh.get() + head, frames, count);
        CopySamples(fresh.get() + head + count, samples_.get() + tailIndex, tail);
        Install(std::move(fresh), length);
        return B_OK;
    }
    if (from >= end) {
        const int64_t length = from - first_ + count;
        SampleArray fresh = Allocate(length);
        if (fresh == nullptr)
            return B_NO_MEMORY;
        CopySamples(fresh.get(), samples_.get(), count_);
        FillZeros(fresh.get() + count_, from - end);
        CopySamples(fresh.get() + (from - first_), frames, count);
        Install(std::move(fresh), length);
        return B_OK;
    }
    // from lies before the data.
    if (to >= end)
        return ReplaceAll(frames, count, from);
    if (to >= first_) {
        const int64_t tailIndex = to - first_ + 1;
        const int64_t length = count + count_ - tailIndex;
        SampleArray fresh = Allocate(length);
        if (fresh == nullptr)
            return B_NO_MEMORY;
        CopySamples(fresh.get(), frames, count);
        CopySamples(fresh.get() + count, samples_.get() + tailIndex, count_ - tailIndex);
        Install(std::move(fresh), length);
        first_ = from;
        return B_OK;
    }
    const int64_t gap = first_ - to - 1;
    const int64_t length = count + gap + count_;
    SampleArray fresh = Allocate(length);
    if (fresh == nullptr)
        return B_NO_MEMORY;
    CopySamples(fresh.get(), frames, count);
    FillZeros(fresh.get() + count, gap);
    CopySamples(fresh.get() + count + gap, samples_.get(), count_);
    Install(std::move(fresh), length);
    first_ = from;
    return B_OK;
}

status_t Channel::RemoveFrames(int64_t from, int64_t to)
{
    if (from < 0 || from > to)
        return B_BAD_VALUE;
    std::lock_guard guard(lock_);
    const int64_t end = End();
    if (from > end)
        return B_OK;
    if (to >= end)
        to = end - 1;
    if (first_ <= from) {
        // With from == end the range is empty after clamping and the array is
        // merely rebuilt at the same length.
        const int64_t head = from - first_;
        const int64_t tailIndex = std::max(to - first_ + 1, head);
        const int64_t length = head + (count_ - tailIndex);
        SampleArray fresh = Allocate(length);
        if (fresh == nullptr)
            return B_ERROR;
        CopySamples(fresh.get(), samples_.get(), head);
        CopySamples(fresh.get() + head, samples_.get() + tailIndex, count_ - tailIndex);
        Install(std::move(fresh), length);
    } else if (to >= first_) {
        // The head goes, but the kept part starts at the sample at `to`
        // itself: the last old sample does not fit the new array and is lost.
        const int64_t length = count_ - (to - first_ + 1);
        SampleArray fresh = Allocate(length);
        if (fresh == nullptr)
            return B_NO_MEMORY;
        CopySamples(fresh.get(), samples_.get() + (to - first_), length);
        Install(std::move(fresh), length);
        first_ = from;
    } else {
        first_ -= to - from + 1;
    }
    return B_OK;
}

bool Channel::IsMuted()
{
    std::lock_guard guard(lock_);
    return muted_;
}

void Channel::SetMuted(bool muted)
{
    std::lock_guard guard(lock_);
    muted_ = muted;
}

bool Channel::IsSelected()
{
    std::lock_guard guard(lock_);
    return selected_;
}

void Channel::SetSelected(bool selected)
{
    std::lock_guard guard(lock_);
    selected_ = selected;
}

int8_t Channel::PanPosition()
{
    std::lock_guard guard(lock_);
    return pan_;
}

void Channel::SetPanPosition(int8_t pan)
{
    std::lock_guard guard(lock_);
    pan_ = (pan == kPanLeft || pan == kPanRight) ? pan : kPanMiddle;
}

int64_t Channel::FirstFrame()
{
    std::lock_guard guard(lock_);
    return first_;
}

void Channel::SetStartFrameOffset(int64_t first)
{
    std::lock_guard guard(lock_);
    first_ = std::clamp<int64_t>(first, 0, kLastFirstFrame);
}

float Channel::FrameRate()
{
    std::lock_guard guard(lock_);
    return frameRate_;
}

void Channel::SetFrameRate(float rate)
{
    std::lock_guard guard(lock_);
    frameRate_ = rate;
}

void Channel::SetFrameCount(int64_t count)
{
    std::lock_guard guard(lock_);
    if (count != count_)
        samples_.reset();
    count_ = count;
}

int64_t Channel::FrameCount()
{
    std::lock_guard guard(lock_);
    return count_;
}

int64_t Channel::EndFrame()
{
    std::lock_guard guard(lock_);
    return End();
}

void Channel::GetMixSettings(bool* muted, int8_t* pan)
{
    std::lock_guard guard(lock_);
    *muted = muted_;
    *pan = pan_;
}

int16_t* Channel::Data()
{
    std::lock_guard guard(lock_);
    return samples_.get();
}

}  // namespace glimmet
