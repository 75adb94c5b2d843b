#include "sound/Mixer.h"

#include <algorithm>
#include <mutex>
#include <type_traits>

#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/DocumentWindow.h"

namespace glimmet {

using mix::kHeardLeft;
using mix::kHeardRight;

Mixer::Mixer(ChannelManager* manager, Sizing sizing) : manager_(manager), sizing_(sizing) {}

void Mixer::Prepare(int64_t maxFrames)
{
    if (manager_ == nullptr)
        return;
    std::lock_guard guard(manager_->DocumentLock());
    Reserve(std::max<int64_t>(maxFrames, 0));
}

void Mixer::Reserve(int64_t frames)
{
    const size_t size = size_t(frames);
    scratch_.resize(size);
    leftSum_.resize(size);
    rightSum_.resize(size);
    integerLeft_.resize(size);
    integerRight_.resize(size);
    capacity_ = frames;
}

bool Mixer::Fits(int64_t frames)
{
    if (frames <= capacity_)
        return true;
    if (sizing_ != Sizing::kGrowing)
        return false;
    Reserve(frames);
    return true;
}

void Mixer::PlayRange(int64_t total, int64_t* start, int64_t* end)
{
    *start = 0;
    *end = total - 1;
    const int32_t mode = manager_->PlayMode();
    DocumentWindow* window = manager_->Window();
    if (mode == ChannelManager::kPlayRange) {
        const int64_t rangeStart = manager_->RangeStart();
        const int64_t rangeEnd = manager_->RangeEnd();
        if (rangeStart >= 0 && rangeStart <= rangeEnd) {
            *start = rangeStart;
            *end = rangeEnd;
        }
    } else if (mode == ChannelManager::kPlayVisible && window != nullptr) {
        // The window thread may be waiting for the document lock that this
        // thread holds, so its lock is only tried, never waited for.
        if (window->LockWithTimeout(kWindowLockTimeoutMicros)) {
            window->GetVisibleFrames(start, end);
            window->UnlockWindow();
        }
    }
    if (*start < 0)
        *start = 0;
    if (*end < 0)
        *end = 0;
    if (*start >= total)
        *start = total - 1;
    if (*end >= total)
        *end = total - 1;
    if (*end < *start)
        *end = *start;
}

bool Mixer::FillBuffer(float* out, int64_t frames, bool* reachedEnd)
{
    *reachedEnd = false;
    if (manager_ == nullptr)
        return false;
    std::lock_guard guard(manager_->DocumentLock());
    const int64_t total = manager_->FrameCountLocked();
    int64_t start = 0;
    int64_t end = 0;
    PlayRange(total, &start, &end);

    int64_t current = manager_->CurrentFrame();
    if (current < start || current > end)
        current = start;

    const int32_t channelCount = manager_->CountChannelsLocked();
    if (frames <= 0)
        return false;
    if (current + frames > end && frames > end - start + 1) {
        manager_->SetCurrentFrame(current);
        return false;
    }
    if (!Fits(frames))
        return false;

    // The buffer in parts of the timeline: one, or the tail of the range and,
    // when looping, its head again. Without the loop the rest is silence.
    Part parts[2];
    int32_t partCount = 1;
    if (current + frames <= end) {
        parts[0] = {current, 0, frames};
        current += frames;
    } else {
        const int64_t head = end - current + 1;
        const int64_t tail = frames - head;
        parts[0] = {current, 0, head};
        if (manager_->Loop()) {
            parts[1] = {start, head, tail};
            partCount = 2;
            current = start + tail;
        } else {
            *reachedEnd = true;
            current = end + 1;
        }
    }
    manager_->SetCurrentFrame(current);

    Mix(channelCount, frames, parts, partCount, out);
    return true;
}

bool Mixer::FillBuffer(int16_t* out, int64_t* frames)
{
    if (manager_ == nullptr)
        return false;
    std::lock_guard guard(manager_->DocumentLock());
    const int64_t total = manager_->FrameCountLocked();
    const int64_t current = manager_->CurrentFrame();
    if (current >= total || *frames <= 0)
        return false;
    if (current + *frames >= total)
        *frames = total - current;
    // A prepared mixer saves what fits; the caller learns how much that was.
    if (!Fits(*frames)) {
        if (capacity_ <= 0)
            return false;
        *frames = capacity_;
    }
    const int64_t count = *frames;

    const Part part{current, 0, count};
    Mix(manager_->CountChannelsLocked(), count, &part, 1, out);
    manager_->SetCurrentFrame(current + count);
    return true;
}

namespace {

void AddOrCopy(const Channel::MixSource& source, bool copy, int32_t* sums)
{
    if (copy)
        mix::CopySamples(source.samples, source.length, sums + source.offset);
    else
        mix::AddSamples(source.samples, source.length, sums + source.offset);
}

}  // namespace

void Mixer::AddChannels(int32_t channelCount, const Part& part, bool firstPart)
{
    int32_t* left = integerLeft_.data() + part.offset;
    int32_t* right = integerRight_.data() + part.offset;
    // The first channel heard on a side sets the sums of the part (its
    // samples, zeros around them) instead of adding to zeros.
    bool leftSet = false;
    bool rightSet = false;
    for (int32_t c = 0; c < channelCount; ++c) {
        uint8_t& heard = sides_[size_t(c)];
        // The first channel heard on a side sets the sums of the part (its
        // samples, zeros around them) instead of adding to zeros; its
        // samples may come in several pieces, one per block.
        bool copyLeft = false;
        bool copyRight = false;
        // A request the channel refuses adds nothing, but the channel still
        // counts as heard on its sides.
        manager_->ChannelAtLocked(c)->ReadForMix(part.from, part.count, [&](const Channel::MixSource& source) {
            // The sides are read once per buffer: a buffer that wraps around
            // the loop hears each channel on the same sides in both parts.
            if (firstPart && source.firstPiece)
                heard = mix::HeardSides(source.muted, source.pan);
            if (source.length <= 0)
                return;
            if (source.firstPiece) {
                copyLeft = (heard & kHeardLeft) != 0 && !leftSet;
                copyRight = (heard & kHeardRight) != 0 && !rightSet;
                if (copyLeft)
                    std::fill_n(left, source.offset, 0);
                if (copyRight)
                    std::fill_n(right, source.offset, 0);
            }
            if (heard == (kHeardLeft | kHeardRight) && !copyLeft && !copyRight) {
                mix::AddSamplesToBoth(source.samples, source.length, left + source.offset, right + source.offset);
            } else {
                if ((heard & kHeardLeft) != 0)
                    AddOrCopy(source, copyLeft, left);
                if ((heard & kHeardRight) != 0)
                    AddOrCopy(source, copyRight, right);
            }
            mix::PrefetchSamples(
                source.samples + source.length, std::min({source.following, source.length, mix::kPrefetchLimit}));
            if (source.lastPiece) {
                const int64_t after = source.offset + source.length;
                if (copyLeft)
                    std::fill_n(left + after, part.count - after, 0);
                if (copyRight)
                    std::fill_n(right + after, part.count - after, 0);
                leftSet = leftSet || copyLeft;
                rightSet = rightSet || copyRight;
            }
        });
    }
    if (!leftSet)
        std::fill_n(left, part.count, 0);
    if (!rightSet)
        std::fill_n(right, part.count, 0);
}

void Mixer::FillChannel(int32_t index, int64_t frames, const Part* parts, int32_t partCount)
{
    Channel* channel = manager_->ChannelAtLocked(index);
    int16_t* samples = scratch_.data();
    int64_t filled = 0;
    for (int32_t p = 0; p < partCount; ++p) {
        int16_t* part = samples + parts[p].offset;
        if (!channel->FillBuffer(part, parts[p].from, parts[p].count))
            std::fill_n(part, parts[p].count, int16_t(0));
        filled = parts[p].offset + parts[p].count;
    }
    std::fill_n(samples + filled, frames - filled, int16_t(0));
}

// The plain frame-by-frame float sum in channel order. Below
// kExactIntegerSumLimit contributors it gives the very values the integer
// sums give: every partial sum is a multiple of 1/32768 under 512 in size,
// which a float holds exactly.
template <typename Sample>
void Mixer::MixInFloat(int32_t channelCount, int64_t frames, const Part* parts, int32_t partCount, Sample* out)
{
    float* left = leftSum_.data();
    float* right = rightSum_.data();
    std::fill_n(left, frames, 0.0f);
    std::fill_n(right, frames, 0.0f);
    int32_t leftCount = 0;
    int32_t rightCount = 0;
    for (int32_t c = 0; c < channelCount; ++c) {
        // Muted channels are asked for their samples too.
        FillChannel(c, frames, parts, partCount);
        bool muted = false;
        int8_t pan = Channel::kPanMiddle;
        manager_->ChannelAtLocked(c)->GetMixSettings(&muted, &pan);
        const uint8_t heard = mix::HeardSides(muted, pan);
        const bool toLeft = (heard & kHeardLeft) != 0;
        const bool toRight = (heard & kHeardRight) != 0;
        leftCount += toLeft;
        rightCount += toRight;
        const int16_t* samples = scratch_.data();
        for (int64_t i = 0; heard != 0 && i < frames; ++i) {
            const float value = float(samples[i]) * mix::kSampleScale;
            if (toLeft)
                left[i] += value;
            if (toRight)
                right[i] += value;
        }
    }
    for (int64_t i = 0; i < frames; ++i) {
        const float leftValue = mix::CombineSide(left[i], leftCount);
        const float rightValue = mix::CombineSide(right[i], rightCount);
        if constexpr (std::is_same_v<Sample, float>) {
            out[2 * i] = leftValue;
            out[2 * i + 1] = rightValue;
        } else {
            out[2 * i] = mix::ToSample(leftValue);
            out[2 * i + 1] = mix::ToSample(rightValue);
        }
    }
}

template <typename Sample>
void Mixer::Mix(int32_t channelCount, int64_t frames, const Part* parts, int32_t partCount, Sample* out)
{
    if (channelCount > mix::kExactIntegerSumLimit) {
        MixInFloat(channelCount, frames, parts, partCount, out);
        return;
    }
    // Every side has at most kExactIntegerSumLimit channels: the integer sum
    // is exact, and each channel's samples are added where they lie.
    int64_t filled = 0;
    for (int32_t p = 0; p < partCount; ++p) {
        AddChannels(channelCount, parts[p], p == 0);
        filled = parts[p].offset + parts[p].count;
    }
    std::fill_n(integerLeft_.data() + filled, frames - filled, 0);
    std::fill_n(integerRight_.data() + filled, frames - filled, 0);
    int32_t leftCount = 0;
    int32_t rightCount = 0;
    for (int32_t c = 0; c < channelCount; ++c) {
        leftCount += (sides_[size_t(c)] & kHeardLeft) != 0;
        rightCount += (sides_[size_t(c)] & kHeardRight) != 0;
    }
    mix::WriteMix(leftCount, rightCount, integerLeft_.data(), integerRight_.data(), leftSum_.data(),
        rightSum_.data(), frames, out);
}

}  // namespace glimmet
