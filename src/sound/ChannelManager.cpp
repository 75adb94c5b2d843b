#include "sound/ChannelManager.h"

#include <algorithm>
#include <cmath>
#include <mutex>
#include <type_traits>

#include "sound/Channel.h"
#include "sound/DocumentWindow.h"
#include "sound/SoftClip.h"
#include "support/Message.h"
#include "support/MessageCodes.h"

namespace glimmet {

namespace {

constexpr float kSampleScale = 3.0517578125e-05f;  // 1 / 32768
constexpr float kOutputScale = 32767.0f;

// The hot loops of the mix get a second, AVX2 build picked at load time on
// processors that have it. Plain SSE2 and AVX2 give identical results here:
// there is no contraction into fused multiply-adds in standard C++ mode, and
// every operation is exactly rounded either way.
// Not under ThreadSanitizer: the loader runs the clones' resolvers before
// the sanitizer's runtime is up, and the program dies at start-up.
#if defined(__GNUC__) && !defined(__clang__) && defined(__x86_64__) && !defined(__SANITIZE_THREAD__)
#define GLIMMET_VECTOR_CLONES __attribute__((target_clones("avx2", "default")))
#else
#define GLIMMET_VECTOR_CLONES
#endif

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
inline int16_t ToSample(float value)
{
    const float scaled = value * kOutputScale;
    const bool inRange = (scaled >= -32768.5f) & (scaled < 32767.5f);
    constexpr float kRoundingMagic = 12582912.0f;
    const float rounded = (scaled + kRoundingMagic) - kRoundingMagic;
    return int16_t(int32_t(inRange ? rounded : -32768.0f));
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

template <SideMode mode>
inline float SideValue(float sum)
{
    if constexpr (mode == SideMode::kSilent)
        return 0.0f;
    else if constexpr (mode == SideMode::kSingle)
        return sum;
    else
        return soft_clip(sum);
}

// The last pass of a mix: scale the integer sums, combine each side and
// interleave. One instance per pair of side modes keeps the loop free of
// branches, so the common cases vectorise.
template <SideMode left, SideMode right>
GLIMMET_VECTOR_CLONES void WriteFrames(const int32_t* leftSums, const int32_t* rightSums, int64_t frames, float* out)
{
    for (int64_t i = 0; i < frames; ++i) {
        out[2 * i] = SideValue<left>(float(leftSums[i]) * kSampleScale);
        out[2 * i + 1] = SideValue<right>(float(rightSums[i]) * kSampleScale);
    }
}

template <SideMode left, SideMode right>
GLIMMET_VECTOR_CLONES void WriteFrames(const int32_t* leftSums, const int32_t* rightSums, int64_t frames, int16_t* out)
{
    for (int64_t i = 0; i < frames; ++i) {
        out[2 * i] = ToSample(SideValue<left>(float(leftSums[i]) * kSampleScale));
        out[2 * i + 1] = ToSample(SideValue<right>(float(rightSums[i]) * kSampleScale));
    }
}

template <typename Sample, SideMode left>
void WriteFramesFor(SideMode right, const int32_t* leftSums, const int32_t* rightSums, int64_t frames, Sample* out)
{
    switch (right) {
        case SideMode::kSilent: WriteFrames<left, SideMode::kSilent>(leftSums, rightSums, frames, out); break;
        case SideMode::kSingle: WriteFrames<left, SideMode::kSingle>(leftSums, rightSums, frames, out); break;
        case SideMode::kCurve: WriteFrames<left, SideMode::kCurve>(leftSums, rightSums, frames, out); break;
    }
}

template <typename Sample>
void WriteMix(int32_t leftCount, int32_t rightCount, const int32_t* leftSums, const int32_t* rightSums,
    int64_t frames, Sample* out)
{
    const SideMode right = ModeFor(rightCount);
    switch (ModeFor(leftCount)) {
        case SideMode::kSilent:
            WriteFramesFor<Sample, SideMode::kSilent>(right, leftSums, rightSums, frames, out);
            break;
        case SideMode::kSingle:
            WriteFramesFor<Sample, SideMode::kSingle>(right, leftSums, rightSums, frames, out);
            break;
        case SideMode::kCurve:
            WriteFramesFor<Sample, SideMode::kCurve>(right, leftSums, rightSums, frames, out);
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

}  // namespace

ChannelManager::ChannelManager(DocumentWindow* window) : window_(window) {}

ChannelManager::~ChannelManager() = default;

void ChannelManager::AddChannel(Channel* channel)
{
    if (channel == nullptr)
        return;
    std::lock_guard guard(lock_);
    channels_.emplace_back(channel);
}

bool ChannelManager::AddChannel(Channel* channel, int32_t index)
{
    if (channel == nullptr)
        return false;
    std::lock_guard guard(lock_);
    if (index < 0 || size_t(index) > channels_.size())
        return false;
    channels_.emplace(channels_.begin() + index, channel);
    return true;
}

std::unique_ptr<Channel> ChannelManager::RemoveChannel(Channel* channel)
{
    std::lock_guard guard(lock_);
    auto found = std::find_if(channels_.begin(), channels_.end(),
        [channel](const std::unique_ptr<Channel>& item) { return item.get() == channel; });
    if (found == channels_.end() || channel == nullptr)
        return nullptr;
    std::unique_ptr<Channel> removed = std::move(*found);
    channels_.erase(found);
    return removed;
}

bool ChannelManager::RemoveChannelAt(int32_t index)
{
    std::lock_guard guard(lock_);
    if (index < 0 || size_t(index) >= channels_.size())
        return false;
    channels_.erase(channels_.begin() + index);
    return true;
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
        integerLeft_.resize(size_t(frames));
        integerRight_.resize(size_t(frames));
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

bool ChannelManager::SumChannels(int32_t channelCount, int64_t frames, int32_t* leftCount, int32_t* rightCount)
{
    *leftCount = 0;
    *rightCount = 0;
    for (int32_t c = 0; c < channelCount; ++c) {
        bool muted = false;
        int8_t pan = Channel::kPanMiddle;
        channels_[size_t(c)]->GetMixSettings(&muted, &pan);
        if (muted)
            continue;
        const int16_t* samples = scratch_.data() + size_t(c) * size_t(frames);
        if (pan == Channel::kPanMiddle || pan == Channel::kPanLeft) {
            (*leftCount == 0 ? CopySamples : AddSamples)(samples, frames, integerLeft_.data());
            ++*leftCount;
        }
        if (pan == Channel::kPanMiddle || pan == Channel::kPanRight) {
            (*rightCount == 0 ? CopySamples : AddSamples)(samples, frames, integerRight_.data());
            ++*rightCount;
        }
    }
    if (*leftCount == 0)
        std::fill_n(integerLeft_.data(), frames, 0);
    if (*rightCount == 0)
        std::fill_n(integerRight_.data(), frames, 0);
    return *leftCount <= kExactIntegerSumLimit && *rightCount <= kExactIntegerSumLimit;
}

// The plain frame-by-frame float sum in channel order, for documents so
// crowded that the integer sum might differ from it.
void ChannelManager::SumChannelsInFloat(int32_t channelCount, int64_t frames)
{
    float* left = leftSum_.data();
    float* right = rightSum_.data();
    std::fill_n(left, frames, 0.0f);
    std::fill_n(right, frames, 0.0f);
    for (int32_t c = 0; c < channelCount; ++c) {
        Channel* channel = channels_[size_t(c)].get();
        if (channel->IsMuted())
            continue;
        const int8_t pan = channel->PanPosition();
        const int16_t* samples = scratch_.data() + size_t(c) * size_t(frames);
        for (int64_t i = 0; i < frames; ++i) {
            const float value = float(samples[i]) * kSampleScale;
            if (pan == Channel::kPanMiddle || pan == Channel::kPanLeft)
                left[i] += value;
            if (pan == Channel::kPanMiddle || pan == Channel::kPanRight)
                right[i] += value;
        }
    }
}

template <typename Sample>
void ChannelManager::MixScratch(int32_t channelCount, int64_t frames, Sample* out)
{
    int32_t leftCount = 0;
    int32_t rightCount = 0;
    if (SumChannels(channelCount, frames, &leftCount, &rightCount)) {
        WriteMix(leftCount, rightCount, integerLeft_.data(), integerRight_.data(), frames, out);
        return;
    }
    SumChannelsInFloat(channelCount, frames);
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
    ReserveScratch(channelCount, frames);

    if (current + frames <= end) {
        FillScratch(channelCount, frames, current, 0, frames);
        current += frames;
    } else {
        const int64_t head = end - current + 1;
        const int64_t tail = frames - head;
        FillScratch(channelCount, frames, current, 0, head);
        if (Loop()) {
            FillScratch(channelCount, frames, start, head, tail);
            current = start + tail;
        } else {
            ZeroScratch(channelCount, frames, head, tail);
            PostToWindow(kMsgStop);
            current = end + 1;
        }
    }
    currentFrame_ = current;

    MixScratch(channelCount, frames, out);
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

    const int32_t channelCount = int32_t(channels_.size());
    ReserveScratch(channelCount, count);
    FillScratch(channelCount, count, current, 0, count);

    MixScratch(channelCount, count, out);
    currentFrame_ = current + count;
    return true;
}

}  // namespace glimmet
