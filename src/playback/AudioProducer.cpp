#include "playback/AudioProducer.h"

#include <algorithm>
#include <cinttypes>
#include <cmath>
#include <cstring>
#include <vector>

#include "playback/DeviceTimeSource.h"
#include "sound/ChannelManager.h"
#include "support/Diagnostics.h"
#include "support/SystemTime.h"

namespace glimmet {

namespace {

// How long the audio thread may wait to be woken on a loaded desktop; it is
// part of the lead time that a start is given.
constexpr int64_t kSchedulingLatencyMicros = 1000;

// A consumer may suggest any buffer size and a device any latency; beyond
// these a connection is refused buffers rather than allowed to allocate
// without bound.
constexpr uint32_t kLargestBufferSize = 16u << 20;
constexpr int64_t kMostBuffers = 64;

int64_t MicrosOfFrames(int64_t frames, float frameRate)
{
    if (!(frameRate > 0))
        return 0;
    // The frame count is taken as unsigned for the conversion.
    return std::llround(double(uint64_t(frames)) / double(frameRate) * 1000000.0);
}

void CopyName(char* to, const char* from)
{
    if (to == nullptr || to == from)
        return;
    std::strncpy(to, from, kMediaNameLength - 1);
    to[kMediaNameLength - 1] = '\0';
}

}  // namespace

AudioProducer::AudioProducer(ChannelManager* manager, MessageTarget* looper)
    : manager_(manager), mixer_(manager), relay_(looper)
{
    preferredFormat_.type = B_MEDIA_RAW_AUDIO;
    preferredFormat_.frameRate = 44100;
    preferredFormat_.channelCount = 2;
    preferredFormat_.sampleFormat = B_AUDIO_FLOAT;
    preferredFormat_.byteOrder = B_MEDIA_LITTLE_ENDIAN;
    preferredFormat_.bufferSize = kWildcardBufferSize;

    output_.destination = MediaDestination::Null();
    output_.format = preferredFormat_;
}

AudioProducer::~AudioProducer()
{
    // The event loop ends before the members go.
    loopRunning_ = false;
}

void* AudioProducer::AddOn(int32_t* internalId) const
{
    if (internalId != nullptr)
        *internalId = 0;
    return nullptr;
}

void AudioProducer::NodeRegistered(int32_t nodeId)
{
    nodeId_ = nodeId;
    priority_ = kRealTimePriority;
    loopRunning_ = true;
    output_.source = MediaSource{nodeId, 0};
    output_.node = nodeId;
    CopyName(output_.name, kOutputName);
}

void AudioProducer::SetRunMode(int32_t mode)
{
    if (mode == B_OFFLINE) {
        reportedError_.store(B_NODE_FAILED_SET_RUN_MODE, std::memory_order_relaxed);
        return;
    }
    runMode_.store(mode, std::memory_order_relaxed);
}

status_t AudioProducer::GetLatency(int64_t* latency) const
{
    if (latency == nullptr)
        return B_BAD_VALUE;
    *latency = EventLatency() + SchedulingLatency();
    return B_OK;
}

int64_t AudioProducer::SchedulingLatency() const
{
    return kSchedulingLatencyMicros;
}

status_t AudioProducer::FormatSuggestionRequested(int32_t type, int32_t, MediaFormat* format)
{
    if (format == nullptr) {
        Diagnostics::Print("\tERROR - NULL format pointer passed in!\n");
        return B_BAD_VALUE;
    }
    *format = preferredFormat_;
    if (type == B_MEDIA_UNKNOWN_TYPE)
        type = B_MEDIA_RAW_AUDIO;
    return type == B_MEDIA_RAW_AUDIO ? B_OK : B_MEDIA_BAD_FORMAT;
}

status_t AudioProducer::FormatProposal(const MediaSource& output, MediaFormat* format)
{
    if (!IsOurSource(output)) {
        Diagnostics::Print("AudioProducer::FormatProposal returning B_MEDIA_BAD_SOURCE\n");
        return B_MEDIA_BAD_SOURCE;
    }
    if (format == nullptr)
        return B_BAD_VALUE;
    const int32_t proposed = format->type;
    *format = preferredFormat_;
    if (proposed == B_MEDIA_UNKNOWN_TYPE || proposed == B_MEDIA_RAW_AUDIO)
        return B_OK;
    Diagnostics::Print("AudioProducer::FormatProposal returning B_MEDIA_BAD_FORMAT\n");
    return B_MEDIA_BAD_FORMAT;
}

status_t AudioProducer::FormatChangeRequested(const MediaSource& source, const MediaDestination& destination,
    MediaFormat* format, int32_t*)
{
    if (!(destination == output_.destination))
        return B_MEDIA_BAD_DESTINATION;
    if (!IsOurSource(source))
        return B_MEDIA_BAD_SOURCE;
    if (format == nullptr)
        return B_BAD_VALUE;
    output_.format = *format;
    PrepareMixer(output_.format);
    AllocateBuffers(output_.format);
    return B_OK;
}

status_t AudioProducer::GetNextOutput(int32_t* cookie, MediaOutput* output)
{
    if (cookie == nullptr || output == nullptr)
        return B_BAD_VALUE;
    if (*cookie != 0)
        return B_BAD_INDEX;
    *output = output_;
    ++*cookie;
    return B_OK;
}

status_t AudioProducer::DisposeOutputCookie(int32_t)
{
    return B_OK;
}

status_t AudioProducer::SetBufferGroup(const MediaSource& forSource, std::unique_ptr<BufferGroup> group)
{
    if (!IsOurSource(forSource))
        return B_MEDIA_BAD_SOURCE;
    if (group.get() != bufferGroup_.get()) {
        bufferGroup_.reset();
        if (group == nullptr)
            AllocateBuffers(output_.format, false);
        else
            bufferGroup_ = std::move(group);
    }
    return B_OK;
}

status_t AudioProducer::PrepareToConnect(const MediaSource& what, const MediaDestination& where,
    MediaFormat* format, MediaSource* source, char* name)
{
    if (!IsOurSource(what))
        return B_MEDIA_BAD_SOURCE;
    if (IsConnected())
        return B_MEDIA_ALREADY_CONNECTED;
    if (format == nullptr)
        return B_BAD_VALUE;
    if (format->type != B_MEDIA_RAW_AUDIO) {
        Diagnostics::Print("\tnon-raw-audio format?!\n");
        return B_MEDIA_BAD_FORMAT;
    }
    if (format->sampleFormat != B_AUDIO_FLOAT) {
        Diagnostics::Print("\tnon-float-audio format?!\n");
        return B_MEDIA_BAD_FORMAT;
    }
    if (format->bufferSize == kWildcardBufferSize) {
        format->bufferSize = kDefaultBufferSize;
        Diagnostics::Print("\tno buffer size provided, suggesting %lu\n", (unsigned long)format->bufferSize);
    } else {
        Diagnostics::Print("\tconsumer suggested buffer_size %lu\n", (unsigned long)format->bufferSize);
    }
    output_.destination = where;
    output_.format = *format;
    if (source != nullptr)
        *source = output_.source;
    CopyName(name, output_.name);
    return B_OK;
}

int64_t AudioProducer::MixFramesPerBuffer(uint32_t bufferSize, uint32_t channelCount) const
{
    // The mixer always writes stereo; the count of frames follows the
    // format's channel count as the connection states it.
    if (channelCount == 0)
        return 0;
    return int64_t(bufferSize / 4) / int64_t(channelCount);
}

void AudioProducer::Connect(status_t error, const MediaSource&, const MediaDestination& destination,
    const MediaFormat& format, char* name, int64_t downstreamLatency)
{
    if (error != B_OK) {
        output_.destination = MediaDestination::Null();
        output_.format = preferredFormat_;
        return;
    }
    output_.destination = destination;
    output_.format = format;
    CopyName(name, output_.name);
    downstreamLatency_.store(downstreamLatency, std::memory_order_relaxed);

    // The trial mix is a real one: it moves the document's play position on
    // by one buffer, which the window resets before playing anyway. It runs
    // on the prepared mixer, so it measures what playback will cost.
    PrepareMixer(format);
    const uint32_t bufferSize = std::min(format.bufferSize, kLargestBufferSize);
    const int64_t frames = MixFramesPerBuffer(bufferSize, format.channelCount);
    std::vector<float> trial(std::max<size_t>(bufferSize / 4, size_t(frames) * 2));
    const int64_t before = system_time();
    Mix(trial.data(), frames);
    const int64_t internal = system_time() - before;
    internalLatency_.store(internal, std::memory_order_relaxed);
    Diagnostics::Print("\tbuffer-filling took %" PRId64 " usec on this machine\n", internal);

    SetEventLatency(downstreamLatency + internal);
    const int64_t samplesPerSecond = std::llround(double(format.channelCount) * double(format.frameRate));
    SetBufferDuration(samplesPerSecond > 0 ? int64_t(format.bufferSize / 4) * 1000000 / samplesPerSecond : 0);
    if (bufferGroup_ == nullptr)
        AllocateBuffers(output_.format);
}

void AudioProducer::PrepareMixer(const MediaFormat& format)
{
    // Buffers beyond the largest size get no buffers at all (see
    // AllocateBuffers), so the mixer need not hold them either.
    const uint32_t bufferSize = std::min(format.bufferSize, kLargestBufferSize);
    mixer_.Prepare(MixFramesPerBuffer(bufferSize, format.channelCount));
}

bool AudioProducer::Mix(float* out, int64_t frames)
{
    if (manager_ == nullptr)
        return false;
    bool reachedEnd = false;
    const bool mixed = mixer_.FillBuffer(out, frames, &reachedEnd);
    // Queued before this buffer's update, as the mix reaches the end before
    // the update reports where it left the play position.
    if (reachedEnd)
        relay_.PostStop();
    return mixed;
}

void AudioProducer::AllocateBuffers(const MediaFormat& format, bool requirePositiveDuration)
{
    bufferGroup_.reset();
    const int64_t duration = BufferDuration();
    int64_t count = 0;
    if (duration > 0)
        count = DownstreamLatency() / duration + 2;
    else if (!requirePositiveDuration)
        count = 2;  // no duration to divide by yet: the two buffers any group has
    count = std::clamp<int64_t>(count, 0, kMostBuffers);
    if (format.bufferSize > kLargestBufferSize)
        count = 0;
    const int64_t frames = MixFramesPerBuffer(format.bufferSize, format.channelCount);
    const size_t floats = format.bufferSize / 4;
    const size_t spare = size_t(frames) * 2 > floats ? size_t(frames) * 2 - floats : 0;
    bufferGroup_ = std::make_unique<BufferGroup>(format.bufferSize, int32_t(count), spare);
}

void AudioProducer::Disconnect(const MediaSource& what, const MediaDestination& where)
{
    if (IsOurSource(what) && where == output_.destination) {
        output_.destination = MediaDestination::Null();
        output_.format = preferredFormat_;
        bufferGroup_.reset();
        return;
    }
    Diagnostics::Print("\tDisconnect() called with wrong source/destination (%ld/%ld), ours is (%ld/%ld)\n",
        long(what.id), long(where.id), long(output_.source.id), long(output_.destination.id));
}

void AudioProducer::LateNoticeReceived(const MediaSource& what, int64_t howMuch, int64_t)
{
    if (!IsOurSource(what))
        return;
    const int32_t mode = RunMode();
    if (mode == B_RECORDING)
        return;
    if (mode == B_INCREASE_LATENCY) {
        const int64_t internal = internalLatency_.fetch_add(howMuch, std::memory_order_relaxed) + howMuch;
        const int64_t total = DownstreamLatency() + internal;
        SetEventLatency(total);
        Diagnostics::Print("\tincreasing latency to %" PRId64 "\n", total);
    } else {
        // The buffer's sample count (both channels), not its frame count.
        framesSent_.fetch_add(int64_t(output_.format.bufferSize / 4), std::memory_order_relaxed);
        Diagnostics::Print("\tskipping a buffer to try to catch up\n");
    }
}

void AudioProducer::EnableOutput(const MediaSource& what, bool enabled, int32_t*)
{
    if (IsOurSource(what))
        outputEnabled_.store(enabled, std::memory_order_relaxed);
}

void AudioProducer::LatencyChanged(const MediaSource& source, const MediaDestination& destination,
    int64_t newLatency, uint32_t)
{
    if (!IsOurSource(source) || !(destination == output_.destination))
        return;
    downstreamLatency_.store(newLatency, std::memory_order_relaxed);
    SetEventLatency(newLatency + InternalLatency());
}

void AudioProducer::AdditionalBufferRequested(const MediaSource&, int32_t, int64_t) {}

status_t AudioProducer::HandleMessage(int32_t, const void*, size_t)
{
    return B_ERROR;
}

status_t AudioProducer::SetPlayRate(int32_t, int32_t)
{
    return B_ERROR;
}

// Event loop ----------------------------------------------------------------

bool AudioProducer::PushEvent(const MediaEvent& event)
{
    const size_t head = eventHead_.load(std::memory_order_relaxed);
    if (head - eventTail_.load(std::memory_order_acquire) >= kEventQueueSize)
        return false;
    events_[head % kEventQueueSize] = event;
    eventHead_.store(head + 1, std::memory_order_release);
    return true;
}

status_t AudioProducer::Start(int64_t performanceTime)
{
    return PushEvent(MediaEvent{B_START, performanceTime}) ? B_OK : B_ERROR;
}

status_t AudioProducer::Stop(int64_t performanceTime, bool immediate)
{
    return PushEvent(MediaEvent{B_STOP, immediate ? INT64_MIN : performanceTime}) ? B_OK : B_ERROR;
}

void AudioProducer::RunDueEvents(int64_t periodEnd)
{
    size_t tail = eventTail_.load(std::memory_order_relaxed);
    const size_t head = eventHead_.load(std::memory_order_acquire);
    // In the order they were queued; a future event holds back those behind it.
    while (tail != head && events_[tail % kEventQueueSize].eventTime < periodEnd) {
        const MediaEvent event = events_[tail % kEventQueueSize];
        ++tail;
        eventTail_.store(tail, std::memory_order_release);
        HandleEvent(event, 0, true);
    }
}

void AudioProducer::HandleEvent(const MediaEvent& event, int64_t, bool)
{
    switch (event.type) {
        case B_START:
            HandleStart(event);
            break;
        case B_STOP:
            HandleStop();
            break;
        case B_HANDLE_BUFFER:
            HandleBuffer(event);
            break;
        default:
            break;
    }
}

void AudioProducer::HandleStart(const MediaEvent& event)
{
    if (IsStarted())
        return;
    framesSent_.store(0, std::memory_order_relaxed);
    startTime_.store(event.eventTime, std::memory_order_relaxed);
    started_.store(true, std::memory_order_relaxed);
    startDeviceFrame_ = currentDeviceFrame_;
    QueueNextBuffer();
}

void AudioProducer::HandleStop()
{
    // Flushes the chain of buffer events; a later start begins a new one.
    bufferPending_ = false;
    started_.store(false, std::memory_order_relaxed);
}

int64_t AudioProducer::TimeOfFramesSent(int64_t frames) const
{
    return StartTime() + MicrosOfFrames(frames, output_.format.frameRate);
}

void AudioProducer::QueueNextBuffer()
{
    bufferPending_ = true;
    pendingBufferFrame_ = FramesSent();
    pendingBufferTime_ = TimeOfFramesSent(pendingBufferFrame_);
}

void AudioProducer::HandleBuffer(const MediaEvent& event)
{
    if (!IsStarted() || !IsConnected())
        return;
    BufferGroup::Buffer* buffer = FillNextBuffer(event.eventTime);
    if (buffer != nullptr) {
        if (!IsOutputEnabled() || SendBuffer(buffer, output_.destination) != B_OK)
            bufferGroup_->Recycle(buffer);
    }
    const uint32_t channels = std::max<uint32_t>(output_.format.channelCount, 1);
    framesSent_.fetch_add(int64_t(output_.format.bufferSize / (channels * 4)), std::memory_order_relaxed);
    QueueNextBuffer();
}

BufferGroup::Buffer* AudioProducer::FillNextBuffer(int64_t eventTime)
{
    const uint32_t bufferSize = output_.format.bufferSize;
    BufferGroup::Buffer* buffer = bufferGroup_ ? bufferGroup_->RequestBuffer(bufferSize) : nullptr;
    if (buffer == nullptr) {
        Diagnostics::Print("no buffer!\n");
        return nullptr;
    }
    const size_t floats = bufferSize / 4;
    const int64_t frames = MixFramesPerBuffer(bufferSize, output_.format.channelCount);
    if (!Mix(buffer->data.data(), frames))
        std::fill_n(buffer->data.begin(), floats, 0.0f);
    buffer->sizeUsed = floats * 4;

    const int64_t start = RunMode() == B_RECORDING ? eventTime : TimeOfFramesSent(FramesSent());
    lastBufferStart_.store(start, std::memory_order_relaxed);

    const int64_t current = manager_ != nullptr ? manager_->CurrentFrame() : 0;
    relay_.Post(current, system_time());
    return buffer;
}

status_t AudioProducer::SendBuffer(BufferGroup::Buffer* buffer, const MediaDestination&)
{
    if (deviceOut_ == nullptr)
        return B_MEDIA_NOT_CONNECTED;
    const size_t floats = std::min(buffer->sizeUsed / 4, size_t(deviceFrames_) * 2);
    std::copy_n(buffer->data.begin(), floats, deviceOut_);
    // The device copies what it takes; the buffer is free again at once.
    bufferGroup_->Recycle(buffer);
    return B_OK;
}

// Device --------------------------------------------------------------------

void AudioProducer::ServeDueBuffer(int32_t frames, int64_t deviceFrame)
{
    // Buffers are due by frame count, not by rounded microseconds, so that
    // each device period gets exactly one buffer of a steady chain.
    if (!bufferPending_ || pendingBufferFrame_ >= deviceFrame - startDeviceFrame_ + frames)
        return;
    bufferPending_ = false;
    HandleEvent(MediaEvent{B_HANDLE_BUFFER, pendingBufferTime_}, 0, true);
}

void AudioProducer::ServeDevice(float* out, int32_t frames, int64_t deviceFrame)
{
    const int64_t began = system_time();
    std::fill_n(out, size_t(frames) * 2, 0.0f);
    deviceOut_ = out;
    deviceFrames_ = frames;
    currentDeviceFrame_ = deviceFrame;

    const float rate = output_.format.frameRate;
    const int64_t periodStart = MicrosOfFrames(deviceFrame, rate);
    RunDueEvents(MicrosOfFrames(deviceFrame + frames, rate));
    ServeDueBuffer(frames, deviceFrame);
    deviceOut_ = nullptr;

    // A period served more slowly than it plays leaves the device behind.
    const int64_t took = system_time() - began;
    periodsServed_.fetch_add(1, std::memory_order_relaxed);
    if (took > longestPeriod_.load(std::memory_order_relaxed))
        longestPeriod_.store(took, std::memory_order_relaxed);
    const int64_t duration = BufferDuration();
    if (duration > 0 && took > duration) {
        latePeriods_.fetch_add(1, std::memory_order_relaxed);
        LateNoticeReceived(output_.source, took - duration, periodStart);
    }
}

}  // namespace glimmet
