#include "sound/ChannelManager.h"

#include <algorithm>
#include <cmath>
#include <mutex>
#include <type_traits>

#include "sound/Channel.h"
#include "sound/DocumentChange.h"
#include "sound/DocumentWindow.h"
#include "sound/SoftClip.h"
#include "support/Message.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"
#include "support/VectorClones.h"

namespace glimmet {

namespace {

constexpr float kSampleScale = 3.0517578125e-05f;  // 1 / 32768
constexpr float kOutputScale = 32767.0f;

// Every channel sample enters the mix as s / 32768, and such values add up
// exactly in single precision as long as no partial sum reaches 512 in
// magnitude: with fewer than 512 contributors per side the float sum in
// channel order equals the integer sum of the samples, scaled once. The mix
// therefore sums integers, which is exact and fast, and scales at the end.
constexpr int32_t kExactIntegerSumLimit = 511;

// Rounds to nearest even as the processor does by default, and stores the
// integer-indefinite value -32768 for anything outside the 16-bit range, as
// a 16-bit integer store of the FPU does. Written without branches or calls
// so that the conversion loop vectorises; adding and removing 1.5 * 2^23
// rounds exactly for every magnitude that passes the range test.
constexpr float kRoundingMagic = 12582912.0f;

inline int16_t ToSample(float value)
{
    const float scaled = value * kOutputScale;
    const bool inRange = (scaled >= -32768.5f) & (scaled < 32767.5f);
    const float rounded = (scaled + kRoundingMagic) - kRoundingMagic;
    return int16_t(int32_t(inRange ? rounded : -32768.0f));
}

// ToSample for a value that cannot leave the 16-bit range: silence, or a
// single channel's s / 32768, which scales to at most 32767 in magnitude.
inline int16_t ToSampleInRange(float value)
{
    const float scaled = value * kOutputScale;
    return int16_t(int32_t((scaled + kRoundingMagic) - kRoundingMagic));
}

// How one side of the mix is heard: nothing heard gives silence, a single
// channel passes unchanged (a lone full-scale channel is never bent), more go
// through the soft-clipping curve. There is no division by the number of
// channels.
enum class SideMode { kSilent, kSingle, kCurve };

SideMode ModeFor(int32_t contributors)
{
    if (contributors == 0)
        return SideMode::kSilent;
    return contributors == 1 ? SideMode::kSingle : SideMode::kCurve;
}

// One side's input to the last pass: the integer sums, and for a side that
// goes through the curve, its values already bent.
struct SideInput {
    const int32_t* sums;
    const float* curved;
};

template <SideMode mode>
inline float SideValue(const SideInput& side, int64_t i)
{
    if constexpr (mode == SideMode::kSilent)
        return 0.0f;
    else if constexpr (mode == SideMode::kSingle)
        return float(side.sums[i]) * kSampleScale;
    else
        return side.curved[i];
}

// The last pass of a mix: scale the integer sums, combine each side and
// interleave. One instance per pair of side modes keeps the loop free of
// branches, so the common cases vectorise.
template <SideMode left, SideMode right>
GLIMMET_VECTOR_CLONES void WriteFrames(SideInput leftSide, SideInput rightSide, int64_t frames, float* out)
{
    for (int64_t i = 0; i < frames; ++i) {
        out[2 * i] = SideValue<left>(leftSide, i);
        out[2 * i + 1] = SideValue<right>(rightSide, i);
    }
}

// Only the curve can leave the 16-bit range (its parabola falls without
// bound); the other sides skip the range test.
template <SideMode mode>
inline int16_t SideSample(const SideInput& side, int64_t i)
{
    if constexpr (mode == SideMode::kCurve)
        return ToSample(SideValue<mode>(side, i));
    else
        return ToSampleInRange(SideValue<mode>(side, i));
}

template <SideMode left, SideMode right>
GLIMMET_VECTOR_CLONES void WriteFrames(SideInput leftSide, SideInput rightSide, int64_t frames, int16_t* out)
{
    for (int64_t i = 0; i < frames; ++i) {
        out[2 * i] = SideSample<left>(leftSide, i);
        out[2 * i + 1] = SideSample<right>(rightSide, i);
    }
}

template <typename Sample, SideMode left>
void WriteFramesFor(SideMode right, SideInput leftSide, SideInput rightSide, int64_t frames, Sample* out)
{
    switch (right) {
        case SideMode::kSilent: WriteFrames<left, SideMode::kSilent>(leftSide, rightSide, frames, out); break;
        case SideMode::kSingle: WriteFrames<left, SideMode::kSingle>(leftSide, rightSide, frames, out); break;
        case SideMode::kCurve: WriteFrames<left, SideMode::kCurve>(leftSide, rightSide, frames, out); break;
    }
}

GLIMMET_VECTOR_CLONES void ScaleSums(const int32_t* sums, int64_t frames, float* values)
{
    for (int64_t i = 0; i < frames; ++i)
        values[i] = float(sums[i]) * kSampleScale;
}

// Bends a side heard from several channels: its scaled sums go through the
// curve in vector code, into curved.
SideInput PrepareSide(SideMode mode, const int32_t* sums, int64_t frames, float* curved)
{
    if (mode == SideMode::kCurve) {
        ScaleSums(sums, frames, curved);
        soft_clip_block(curved, curved, frames);
    }
    return SideInput{sums, curved};
}

// Mixes the integer sums into interleaved frames; leftCurved and rightCurved
// hold frames values each and are overwritten.
template <typename Sample>
void WriteMix(int32_t leftCount, int32_t rightCount, const int32_t* leftSums, const int32_t* rightSums,
    float* leftCurved, float* rightCurved, int64_t frames, Sample* out)
{
    const SideMode leftMode = ModeFor(leftCount);
    const SideMode right = ModeFor(rightCount);
    const SideInput leftSide = PrepareSide(leftMode, leftSums, frames, leftCurved);
    const SideInput rightSide = PrepareSide(right, rightSums, frames, rightCurved);
    switch (leftMode) {
        case SideMode::kSilent:
            WriteFramesFor<Sample, SideMode::kSilent>(right, leftSide, rightSide, frames, out);
            break;
        case SideMode::kSingle:
            WriteFramesFor<Sample, SideMode::kSingle>(right, leftSide, rightSide, frames, out);
            break;
        case SideMode::kCurve:
            WriteFramesFor<Sample, SideMode::kCurve>(right, leftSide, rightSide, frames, out);
            break;
    }
}

// The generic side value, for the crowded documents mixed in float.
float CombineSide(float sum, int32_t contributors)
{
    if (contributors == 0)
        return 0.0f;
    return contributors == 1 ? sum : soft_clip(sum);
}

GLIMMET_VECTOR_CLONES void AddSamples(const int16_t* samples, int64_t frames, int32_t* sums)
{
    for (int64_t i = 0; i < frames; ++i)
        sums[i] += samples[i];
}

GLIMMET_VECTOR_CLONES void CopySamples(const int16_t* samples, int64_t frames, int32_t* sums)
{
    for (int64_t i = 0; i < frames; ++i)
        sums[i] = samples[i];
}

GLIMMET_VECTOR_CLONES void AddSamplesToBoth(const int16_t* samples, int64_t frames, int32_t* left, int32_t* right)
{
    for (int64_t i = 0; i < frames; ++i) {
        left[i] += samples[i];
        right[i] += samples[i];
    }
}

// Asks the processor to start loading the samples the next buffer will most
// likely read, so that they arrive while this buffer is mixed: the samples
// come from main memory, and waiting for each cache line in turn took most
// of the mix's time, with many channels in playback and in saving alike. Up
// to kPrefetchLimit samples per channel, the next buffer for playback and
// for saving; far larger requests would only have the first of them evicted
// again before their turn.
constexpr int64_t kPrefetchLimit = 4096;

void PrefetchSamples(const int16_t* samples, int64_t count)
{
    constexpr int64_t kLineSamples = 64 / sizeof(int16_t);
    for (int64_t i = 0; i < count; i += kLineSamples)
        __builtin_prefetch(samples + i);
}

// The sides a channel is heard on.
constexpr uint8_t kHeardLeft = 1;
constexpr uint8_t kHeardRight = 2;

uint8_t HeardSides(bool muted, int8_t pan)
{
    if (muted)
        return 0;
    uint8_t sides = 0;
    if (pan == Channel::kPanMiddle || pan == Channel::kPanLeft)
        sides |= kHeardLeft;
    if (pan == Channel::kPanMiddle || pan == Channel::kPanRight)
        sides |= kHeardRight;
    return sides;
}

}  // namespace

ChannelManager::ChannelManager(DocumentWindow* window) : window_(window) {}

ChannelManager::~ChannelManager() = default;

void ChannelManager::AddChannel(Channel* channel)
{
    if (channel == nullptr)
        return;
    int32_t index;
    {
        std::lock_guard guard(lock_);
        channels_.emplace_back(channel);
        index = int32_t(channels_.size()) - 1;
    }
    NotifyChannel(DocumentChange::kChannelAdded, index);
}

bool ChannelManager::AddChannel(Channel* channel, int32_t index)
{
    if (channel == nullptr)
        return false;
    {
        std::lock_guard guard(lock_);
        if (index < 0 || size_t(index) > channels_.size())
            return false;
        channels_.emplace(channels_.begin() + index, channel);
    }
    NotifyChannel(DocumentChange::kChannelAdded, index);
    return true;
}

std::unique_ptr<Channel> ChannelManager::RemoveChannel(Channel* channel)
{
    std::unique_ptr<Channel> removed;
    int32_t index;
    {
        std::lock_guard guard(lock_);
        auto found = std::find_if(channels_.begin(), channels_.end(),
            [channel](const std::unique_ptr<Channel>& item) { return item.get() == channel; });
        if (found == channels_.end() || channel == nullptr)
            return nullptr;
        index = int32_t(found - channels_.begin());
        removed = std::move(*found);
        channels_.erase(found);
    }
    NotifyChannel(DocumentChange::kChannelRemoved, index);
    return removed;
}

bool ChannelManager::RemoveChannelAt(int32_t index)
{
    // The channel is freed only after the listeners have let go of it.
    std::unique_ptr<Channel> removed;
    {
        std::lock_guard guard(lock_);
        if (index < 0 || size_t(index) >= channels_.size())
            return false;
        removed = std::move(channels_[size_t(index)]);
        channels_.erase(channels_.begin() + index);
    }
    NotifyChannel(DocumentChange::kChannelRemoved, index);
    return true;
}

void ChannelManager::NotifyChannel(uint32_t change, int32_t index)
{
    Message data;
    data.AddInt32(kFieldIndex, index);
    listeners_.Notify(change, &data);
}

void ChannelManager::ChannelChanged(Channel* channel)
{
    const int32_t index = IndexOf(channel);
    if (index >= 0)
        NotifyChannel(DocumentChange::kChannelData, index);
}

void ChannelManager::ChannelsChanged()
{
    listeners_.Notify(DocumentChange::kChannelData);
}

int32_t ChannelManager::CountChannels()
{
    std::lock_guard guard(lock_);
    return int32_t(channels_.size());
}

Channel* ChannelManager::ChannelAt(int32_t index)
{
    std::lock_guard guard(lock_);
    if (index < 0 || size_t(index) >= channels_.size())
        return nullptr;
    return channels_[size_t(index)].get();
}

int32_t ChannelManager::IndexOf(Channel* channel)
{
    std::lock_guard guard(lock_);
    for (size_t i = 0; i < channels_.size(); ++i) {
        if (channels_[i].get() == channel)
            return int32_t(i);
    }
    return -1;
}

int64_t ChannelManager::FrameCount()
{
    std::lock_guard guard(lock_);
    return FrameCountLocked();
}

int64_t ChannelManager::FrameCountLocked()
{
    int64_t total = 0;
    for (const std::unique_ptr<Channel>& channel : channels_)
        total = std::max(total, channel->EndFrame());
    return total;
}

void ChannelManager::PostToWindow(uint32_t what, const char* field, int64_t value)
{
    if (window_ == nullptr)
        return;
    Message message(what);
    if (field != nullptr)
        message.AddInt64(field, value);
    window_->PostMessage(message);
}

// The window hears only of values the manager chose on its own; a value
// stored exactly as asked is not announced.
void ChannelManager::SetRangeStart(int64_t frame)
{
    const int64_t total = FrameCount();
    if (frame >= total) {
        rangeStart_ = total - 1;
        PostToWindow(kMsgRangeStartChanged, "range start", total - 1);
    } else {
        rangeStart_ = frame;
    }
    // The end follows the argument as passed, not the clamped start.
    if (rangeStart_ > rangeEnd_) {
        rangeEnd_ = frame;
        PostToWindow(kMsgRangeEndChanged, "range end", frame);
    }
}

void ChannelManager::SetRangeEnd(int64_t frame)
{
    const int64_t total = FrameCount();
    if (frame >= total) {
        rangeEnd_ = total - 1;
        PostToWindow(kMsgRangeEndChanged, "range end", total - 1);
    } else {
        rangeEnd_ = frame;
    }
    if (rangeStart_ > rangeEnd_) {
        rangeStart_ = frame;
        PostToWindow(kMsgRangeStartChanged, "range start", frame);
    }
}

void ChannelManager::SetLoop(bool loop)
{
    std::lock_guard guard(lock_);
    loop_ = loop;
}

void ChannelManager::SetPlayMode(int32_t mode)
{
    std::lock_guard guard(lock_);
    playMode_ = mode;
}

void ChannelManager::ResetCurrentFrame()
{
    std::lock_guard guard(lock_);
    const int32_t mode = playMode_;
    if (mode == kPlayAll || mode == kPlayRange || mode == kPlayVisible)
        currentFrame_ = 0;
}

void ChannelManager::SetFrameRate(float rate)
{
    if (rate > 0)
        frameRate_ = rate;
}

void ChannelManager::PlayRange(int64_t total, int64_t* start, int64_t* end)
{
    *start = 0;
    *end = total - 1;
    const int32_t mode = playMode_;
    if (mode == kPlayRange) {
        const int64_t rangeStart = rangeStart_;
        const int64_t rangeEnd = rangeEnd_;
        if (rangeStart >= 0 && rangeStart <= rangeEnd) {
            *start = rangeStart;
            *end = rangeEnd;
        }
    } else if (mode == kPlayVisible && window_ != nullptr) {
        // The window thread may be waiting for the document lock that this
        // thread holds, so its lock is only tried, never waited for.
        if (window_->LockWithTimeout(kWindowLockTimeoutMicros)) {
            window_->GetVisibleFrames(start, end);
            window_->UnlockWindow();
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

void ChannelManager::ReserveScratch(int32_t channelCount, int64_t frames)
{
    // Grows only when the buffer or the channel count grows, so a steady
    // playback allocates nothing per buffer.
    const size_t needed = size_t(channelCount) * size_t(frames);
    if (scratch_.size() < needed)
        scratch_.resize(needed);
    if (leftSum_.size() < size_t(frames)) {
        leftSum_.resize(size_t(frames));
        rightSum_.resize(size_t(frames));
    }
}

void ChannelManager::FillScratch(int32_t channelCount, int64_t frames, int64_t from, int64_t offset, int64_t count)
{
    for (int32_t c = 0; c < channelCount; ++c) {
        int16_t* part = scratch_.data() + size_t(c) * size_t(frames) + offset;
        if (!channels_[size_t(c)]->FillBuffer(part, from, count))
            std::fill_n(part, count, int16_t(0));
    }
}

void ChannelManager::ZeroScratch(int32_t channelCount, int64_t frames, int64_t offset, int64_t count)
{
    for (int32_t c = 0; c < channelCount; ++c)
        std::fill_n(scratch_.data() + size_t(c) * size_t(frames) + offset, count, int16_t(0));
}

// The plain frame-by-frame float sum in channel order, for documents so
// crowded that a side may have more contributors than an integer sum keeps
// exact. Below that many it gives the very values the integer sums give:
// every partial sum is a multiple of 1/32768 under 512 in size, which a
// float holds exactly. Counts the contributors of each side.
void ChannelManager::SumChannelsInFloat(int32_t channelCount, int64_t frames, int32_t* leftCount,
    int32_t* rightCount)
{
    float* left = leftSum_.data();
    float* right = rightSum_.data();
    std::fill_n(left, frames, 0.0f);
    std::fill_n(right, frames, 0.0f);
    *leftCount = 0;
    *rightCount = 0;
    for (int32_t c = 0; c < channelCount; ++c) {
        bool muted = false;
        int8_t pan = Channel::kPanMiddle;
        channels_[size_t(c)]->GetMixSettings(&muted, &pan);
        if (muted)
            continue;
        const bool toLeft = pan == Channel::kPanMiddle || pan == Channel::kPanLeft;
        const bool toRight = pan == Channel::kPanMiddle || pan == Channel::kPanRight;
        *leftCount += toLeft;
        *rightCount += toRight;
        const int16_t* samples = scratch_.data() + size_t(c) * size_t(frames);
        for (int64_t i = 0; i < frames; ++i) {
            const float value = float(samples[i]) * kSampleScale;
            if (toLeft)
                left[i] += value;
            if (toRight)
                right[i] += value;
        }
    }
}

template <typename Sample>
void ChannelManager::MixScratch(int32_t channelCount, int64_t frames, Sample* out)
{
    int32_t leftCount = 0;
    int32_t rightCount = 0;
    SumChannelsInFloat(channelCount, frames, &leftCount, &rightCount);
    for (int64_t i = 0; i < frames; ++i) {
        const float left = CombineSide(leftSum_[size_t(i)], leftCount);
        const float right = CombineSide(rightSum_[size_t(i)], rightCount);
        if constexpr (std::is_same_v<Sample, float>) {
            out[2 * i] = left;
            out[2 * i + 1] = right;
        } else {
            out[2 * i] = ToSample(left);
            out[2 * i + 1] = ToSample(right);
        }
    }
}

void ChannelManager::ReserveSums(int32_t channelCount, int64_t frames)
{
    // Grows only when the buffer or the channel count grows, so a steady
    // playback allocates nothing per buffer.
    if (sides_.size() < size_t(channelCount))
        sides_.resize(size_t(channelCount));
    if (integerLeft_.size() < size_t(frames)) {
        integerLeft_.resize(size_t(frames));
        integerRight_.resize(size_t(frames));
        leftSum_.resize(size_t(frames));
        rightSum_.resize(size_t(frames));
    }
}

void ChannelManager::AddChannels(int32_t channelCount, const Part& part, bool firstPart)
{
    int32_t* left = integerLeft_.data() + part.offset;
    int32_t* right = integerRight_.data() + part.offset;
    // The first channel heard on a side sets the sums of the part (its
    // samples, zeros around them) instead of adding to zeros.
    bool leftSet = false;
    bool rightSet = false;
    auto addTo = [&part](int32_t* sums, bool* set, const Channel::MixSource& source) {
        if (*set) {
            AddSamples(source.samples, source.length, sums + source.offset);
            return;
        }
        std::fill_n(sums, source.offset, 0);
        CopySamples(source.samples, source.length, sums + source.offset);
        const int64_t after = source.offset + source.length;
        std::fill_n(sums + after, part.count - after, 0);
        *set = true;
    };
    for (int32_t c = 0; c < channelCount; ++c) {
        uint8_t& heard = sides_[size_t(c)];
        // A request the channel refuses adds nothing, but the channel still
        // counts as heard on its sides.
        channels_[size_t(c)]->ReadForMix(part.from, part.count, [&](const Channel::MixSource& source) {
            // The sides are read once per buffer: a buffer that wraps around
            // the loop hears each channel on the same sides in both parts.
            if (firstPart)
                heard = HeardSides(source.muted, source.pan);
            if (source.length <= 0)
                return;
            if (heard == (kHeardLeft | kHeardRight) && leftSet && rightSet) {
                AddSamplesToBoth(source.samples, source.length, left + source.offset, right + source.offset);
            } else {
                if ((heard & kHeardLeft) != 0)
                    addTo(left, &leftSet, source);
                if ((heard & kHeardRight) != 0)
                    addTo(right, &rightSet, source);
            }
            PrefetchSamples(
                source.samples + source.length, std::min({source.following, source.length, kPrefetchLimit}));
        });
    }
    if (!leftSet)
        std::fill_n(left, part.count, 0);
    if (!rightSet)
        std::fill_n(right, part.count, 0);
}

template <typename Sample>
void ChannelManager::Mix(int32_t channelCount, int64_t frames, const Part* parts, int32_t partCount, Sample* out)
{
    if (channelCount > kExactIntegerSumLimit) {
        // So many channels that a side might need the float sum: copy every
        // channel out and take the general path.
        ReserveScratch(channelCount, frames);
        int64_t filled = 0;
        for (int32_t p = 0; p < partCount; ++p) {
            FillScratch(channelCount, frames, parts[p].from, parts[p].offset, parts[p].count);
            filled = parts[p].offset + parts[p].count;
        }
        ZeroScratch(channelCount, frames, filled, frames - filled);
        MixScratch(channelCount, frames, out);
        return;
    }
    // Every side has at most kExactIntegerSumLimit channels: the integer sum
    // is exact, and each channel's samples are added where they lie.
    ReserveSums(channelCount, frames);
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
    WriteMix(leftCount, rightCount, integerLeft_.data(), integerRight_.data(), leftSum_.data(), rightSum_.data(),
        frames, out);
}

bool ChannelManager::FillBuffer(float* out, int64_t frames)
{
    std::lock_guard guard(lock_);
    const int64_t total = FrameCountLocked();
    int64_t start = 0;
    int64_t end = 0;
    PlayRange(total, &start, &end);

    int64_t current = currentFrame_;
    if (current < start || current > end)
        current = start;

    const int32_t channelCount = int32_t(channels_.size());
    if (frames <= 0)
        return false;
    if (current + frames > end && frames > end - start + 1) {
        currentFrame_ = current;
        return false;
    }

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
        if (Loop()) {
            parts[1] = {start, head, tail};
            partCount = 2;
            current = start + tail;
        } else {
            PostToWindow(kMsgStop);
            current = end + 1;
        }
    }
    currentFrame_ = current;

    Mix(channelCount, frames, parts, partCount, out);
    return true;
}

bool ChannelManager::FillBuffer(int16_t* out, int64_t* frames)
{
    std::lock_guard guard(lock_);
    const int64_t total = FrameCountLocked();
    const int64_t current = currentFrame_;
    if (current >= total || *frames <= 0)
        return false;
    if (current + *frames >= total)
        *frames = total - current;
    const int64_t count = *frames;

    const Part part{current, 0, count};
    Mix(int32_t(channels_.size()), count, &part, 1, out);
    currentFrame_ = current + count;
    return true;
}

}  // namespace glimmet
