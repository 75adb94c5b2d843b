#include "sound/Channel.h"

#include <algorithm>
#include <atomic>
#include <cstring>
#include <new>

#include "sound/BlockBuilder.h"
#include "support/Diagnostics.h"

namespace glimmet {

namespace {

// Channels hold at most 2^32 - 1 samples.
constexpr int64_t kLongestData = int64_t(UINT32_MAX);

void FillZeros(int16_t* destination, int64_t count)
{
    if (count > 0)
        std::memset(destination, 0, size_t(count) * sizeof(int16_t));
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
    if (count < 0 || count > kLongestData)
        return nullptr;
    return SampleAllocator::Shared().Allocate(size_t(count));
}

bool Channel::SetTo(int16_t* samples, int64_t count)
{
    if (samples == nullptr || count <= 0)
        return false;
    std::unique_ptr<int16_t[]> adopted(samples);
    BlockList list;
    if (count <= BlockBuilder::kBlockSamples) {
        list.Append(SampleBlock::Adopt(std::move(adopted), count));
    } else {
        BlockBuilder builder;
        builder.AppendSamples(samples, count);
        list = builder.Finish();
    }
    if (list.Count() != count)
        return false;
    return SetTo(std::move(list));
}

bool Channel::SetTo(SampleAllocator::Array samples, int64_t count)
{
    if (samples == nullptr || count <= 0)
        return false;
    BlockBuilder builder;
    builder.AppendSamples(samples.get(), count);
    samples.reset();
    if (!builder.Ok())
        return false;
    return SetTo(builder.Finish());
}

bool Channel::SetTo(BlockList blocks)
{
    if (blocks.Empty() || !blocks.MakeResident())
        return false;
    std::lock_guard guard(lock_);
    count_ = blocks.Count();
    blocks_ = std::move(blocks);
    hasData_ = true;
    return true;
}

bool Channel::FillBuffer(int16_t* buffer, int64_t start, int64_t count)
{
    std::lock_guard guard(lock_);
    if (buffer == nullptr)
        return false;
    int64_t index = 0;
    int64_t offset = 0;
    int64_t length = 0;
    if (!FindSamples(start, count, &index, &offset, &length))
        return false;
    FillZeros(buffer, offset);
    if (length > 0)
        blocks_.CopyOut(index, length, buffer + offset);
    FillZeros(buffer + offset + length, count - offset - length);
    return true;
}

status_t Channel::ReadSlice(int64_t start, int64_t count, SampleSlice* slice)
{
    std::lock_guard guard(lock_);
    *slice = SampleSlice();
    if (count < 0 || count > kLongestData)
        return B_NO_MEMORY;
    int64_t index = 0;
    int64_t offset = 0;
    int64_t length = 0;
    if (!FindSamples(start, count, &index, &offset, &length)) {
        slice->leading = count;
        return B_ERROR;
    }
    BlockBuilder builder;
    builder.AppendRange(blocks_, index, length);
    if (!builder.Ok())
        return B_NO_MEMORY;
    slice->leading = offset;
    slice->blocks = builder.Finish();
    slice->trailing = count - offset - length;
    slice->newBytes = builder.NewBytes();
    return B_OK;
}

bool Channel::FindSamples(int64_t start, int64_t count, int64_t* index, int64_t* offset, int64_t* length) const
{
    *index = 0;
    *offset = 0;
    *length = 0;
    const int64_t end = End();
    const int64_t last = start + count - 1;
    if (start >= first_ && start < end) {
        // A request running past the data reads silence there, one ending
        // exactly one frame past it included.
        *index = start - first_;
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
    *length = std::max<int64_t>(0, std::min(count - *offset, blocks_.Count() - *index));
    return true;
}

status_t Channel::Rebuild(int64_t length, int64_t first, const std::function<void(BlockBuilder&)>& build,
    status_t failure)
{
    if (length < 0 || length > kLongestData)
        return failure;
    BlockBuilder builder;
    build(builder);
    if (!builder.Ok())
        return failure;
    BlockList fresh = builder.Finish();
    // The old blocks are let go of after the swap; those the new list
    // shares live on.
    std::swap(blocks_, fresh);
    count_ = length;
    hasData_ = true;
    first_ = first;
    return B_OK;
}

status_t Channel::InsertFrames(const int16_t* frames, int64_t count, int64_t at)
{
    if (frames == nullptr || count <= 0)
        return B_BAD_VALUE;
    return Insert([frames, count](BlockBuilder& builder) { builder.AppendSamples(frames, count); }, count, at);
}

status_t Channel::InsertFrames(const SampleSlice& frames, int64_t at)
{
    const int64_t count = frames.Count();
    if (count <= 0)
        return B_BAD_VALUE;
    if (!frames.blocks.MakeResident())
        return B_NO_MEMORY;
    return Insert([&frames](BlockBuilder& builder) {
        builder.AppendZeros(frames.leading);
        builder.AppendRange(frames.blocks, 0, frames.blocks.Count());
        builder.AppendZeros(frames.trailing);
    }, count, at);
}

status_t Channel::Insert(const Source& frames, int64_t count, int64_t at)
{
    std::lock_guard guard(lock_);
    if (!hasData_)
        return Rebuild(count, at, frames);
    return InsertIntoData(frames, count, at);
}

status_t Channel::InsertIntoData(const Source& frames, int64_t count, int64_t at)
{
    const int64_t end = End();
    if (at >= first_ && at < end) {
        const int64_t head = at - first_;
        return Rebuild(count_ + count, first_, [&](BlockBuilder& builder) {
            builder.AppendRange(blocks_, 0, head);
            frames(builder);
            builder.AppendRange(blocks_, head, count_ - head);
        });
    }
    if (at >= end) {
        return Rebuild((at - first_) + count, first_, [&](BlockBuilder& builder) {
            builder.AppendRange(blocks_, 0, count_);
            builder.AppendZeros(at - end);
            frames(builder);
        });
    }
    // Inserting before the data: the gap in front of the old data moves
    // right together with it.
    const int64_t gap = first_ - at;
    return Rebuild(gap + count + count_, at, [&](BlockBuilder& builder) {
        frames(builder);
        builder.AppendZeros(gap);
        builder.AppendRange(blocks_, 0, count_);
    });
}

status_t Channel::ReplaceFrames(const int16_t* frames, int64_t count, int64_t from, int64_t to)
{
    if (frames == nullptr || count <= 0 || from > to || from < 0)
        return B_BAD_VALUE;
    return Replace([frames, count](BlockBuilder& builder) { builder.AppendSamples(frames, count); }, count, from,
        to);
}

status_t Channel::ReplaceFrames(const SampleSlice& frames, int64_t from, int64_t to)
{
    const int64_t count = frames.Count();
    if (count <= 0 || from > to || from < 0)
        return B_BAD_VALUE;
    if (!frames.blocks.MakeResident())
        return B_NO_MEMORY;
    return Replace([&frames](BlockBuilder& builder) {
        builder.AppendZeros(frames.leading);
        builder.AppendRange(frames.blocks, 0, frames.blocks.Count());
        builder.AppendZeros(frames.trailing);
    }, count, from, to);
}

status_t Channel::Replace(const Source& frames, int64_t count, int64_t from, int64_t to)
{
    std::lock_guard guard(lock_);
    if (!hasData_)
        return Rebuild(count, from, frames);
    return ReplaceInData(frames, count, from, to);
}

status_t Channel::ReplaceInData(const Source& frames, int64_t count, int64_t from, int64_t to)
{
    const int64_t end = End();
    if (from >= first_ && from < end) {
        const int64_t head = from - first_;
        if (to >= end)
            Diagnostics::Print("  ending outside data\n");
        const int64_t tailIndex = std::min(to - first_ + 1, count_);
        const int64_t tail = count_ - tailIndex;
        return Rebuild(head + count + tail, first_, [&](BlockBuilder& builder) {
            builder.AppendRange(blocks_, 0, head);
            frames(builder);
            builder.AppendRange(blocks_, tailIndex, tail);
        });
    }
    if (from >= end) {
        return Rebuild(from - first_ + count, first_, [&](BlockBuilder& builder) {
            builder.AppendRange(blocks_, 0, count_);
            builder.AppendZeros(from - end);
            frames(builder);
        });
    }
    // from lies before the data.
    if (to >= end)
        return Rebuild(count, from, frames);
    if (to >= first_) {
        const int64_t tailIndex = to - first_ + 1;
        return Rebuild(count + count_ - tailIndex, from, [&](BlockBuilder& builder) {
            frames(builder);
            builder.AppendRange(blocks_, tailIndex, count_ - tailIndex);
        });
    }
    const int64_t gap = first_ - to - 1;
    return Rebuild(count + gap + count_, from, [&](BlockBuilder& builder) {
        frames(builder);
        builder.AppendZeros(gap);
        builder.AppendRange(blocks_, 0, count_);
    });
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
        // With from == end the range is empty after clamping and the data is
        // merely rebuilt at the same length.
        const int64_t head = from - first_;
        const int64_t tailIndex = std::max(to - first_ + 1, head);
        return Rebuild(head + (count_ - tailIndex), first_, [&](BlockBuilder& builder) {
            builder.AppendRange(blocks_, 0, head);
            builder.AppendRange(blocks_, tailIndex, count_ - tailIndex);
        }, B_ERROR);
    }
    if (to >= first_) {
        // The head goes, but the kept part starts at the sample at `to`
        // itself: the last old sample does not fit the new length and is
        // lost.
        const int64_t length = count_ - (to - first_ + 1);
        return Rebuild(length, from, [&](BlockBuilder& builder) {
            builder.AppendRange(blocks_, to - first_, length);
        });
    }
    first_ -= to - from + 1;
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
    if (count != count_) {
        blocks_.Clear();
        hasData_ = false;
    }
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

}  // namespace glimmet
