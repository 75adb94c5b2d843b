#include "playback/AudioProducer.h"

#include <algorithm>
#include <cinttypes>
#include <cstdio>
#include <vector>

#include "playback/BufferPlan.h"
#include "playback/DeviceTimeSource.h"
#include "sound/ChannelManager.h"
#include "support/Diagnostics.h"
#include "support/SystemTime.h"

namespace glimmet {

namespace {

// How long the audio thread may wait to be woken on a loaded desktop; it is
// part of the lead time that a start is given.
constexpr int64_t kSchedulingLatencyMicros = 1000;

}  // namespace

AudioProducer::AudioProducer(ChannelManager* manager, MessageTarget* looper)
    : manager_(manager), mixer_(manager), relay_(looper)
{
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
    negotiator_.Register(nodeId, kOutputName);
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
    return negotiator_.SuggestFormat(type, format);
}

status_t AudioProducer::FormatProposal(const MediaSource& output, MediaFormat* format)
{
    return negotiator_.ProposeFormat(output, format);
}

status_t AudioProducer::FormatChangeRequested(const MediaSource& source, const MediaDestination& destination,
    MediaFormat* format, int32_t*)
{
    const status_t status = negotiator_.ChangeFormat(source, destination, format);
    if (status != B_OK)
        return status;
    PrepareMixer(Output().format);
    AllocateBuffers(Output().format);
    return B_OK;
}

status_t AudioProducer::GetNextOutput(int32_t* cookie, MediaOutput* output)
{
    return negotiator_.GetNextOutput(cookie, output);
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
            AllocateBuffers(Output().format, false);
        else
            bufferGroup_ = std::move(group);
    }
    return B_OK;
}

status_t AudioProducer::PrepareToConnect(const MediaSource& what, const MediaDestination& where,
    MediaFormat* format, MediaSource* source, char* name)
{
    return negotiator_.PrepareToConnect(what, where, format, source, name);
}

void AudioProducer::Connect(status_t error, const MediaSource&, const MediaDestination& destination,
    const MediaFormat& format, char* name, int64_t downstreamLatency)
{
    if (error != B_OK) {
        negotiator_.Reset();
        return;
    }
    negotiator_.Connected(destination, format, name);
    downstreamLatency_.store(downstreamLatency, std::memory_order_relaxed);

    // The trial mix is a real one: it moves the document's play position on
    // by one buffer, which the window resets before playing anyway. It runs
    // on the prepared mixer, so it measures what playback will cost.
    PrepareMixer(format);
    const uint32_t bufferSize = std::min(format.bufferSize, BufferPlan::kLargestBufferSize);
    const int64_t frames = BufferPlan::MixFramesPerBuffer(bufferSize, format.channelCount);
    std::vector<float> trial(std::max<size_t>(bufferSize / 4, size_t(frames) * 2));
    const int64_t before = system_time();
    Mix(trial.data(), frames);
    const int64_t internal = system_time() - before;
    internalLatency_.store(internal, std::memory_order_relaxed);
    Diagnostics::Print("\tbuffer-filling took %" PRId64 " usec on this machine\n", internal);

    SetEventLatency(downstreamLatency + internal);
    SetBufferDuration(BufferPlan::BufferDuration(format));
    if (bufferGroup_ == nullptr)
        AllocateBuffers(Output().format);
}

void AudioProducer::PrepareMixer(const MediaFormat& format)
{
    mixer_.Prepare(BufferPlan::MixerFrames(format));
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
    const int64_t count =
        BufferPlan::BufferCount(format, BufferDuration(), DownstreamLatency(), requirePositiveDuration);
    bufferGroup_ =
        std::make_unique<BufferGroup>(format.bufferSize, int32_t(count), BufferPlan::SpareFloats(format));
}

void AudioProducer::Disconnect(const MediaSource& what, const MediaDestination& where)
{
    if (negotiator_.Disconnect(what, where))
        bufferGroup_.reset();
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
        framesSent_.fetch_add(int64_t(Output().format.bufferSize / 4), std::memory_order_relaxed);
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
    if (!IsOurSource(source) || !(destination == Output().destination))
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

status_t AudioProducer::Start(int64_t performanceTime)
{
    return events_.Push(MediaEvent{B_START, performanceTime}) ? B_OK : B_ERROR;
}

status_t AudioProducer::Stop(int64_t performanceTime, bool immediate)
{
    return events_.Push(MediaEvent{B_STOP, immediate ? INT64_MIN : performanceTime}) ? B_OK : B_ERROR;
}

void AudioProducer::RunDueEvents(int64_t periodEnd)
{
    events_.RunDue(periodEnd, [this](const MediaEvent& event) { HandleEvent(event, 0, true); });
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
    return StartTime() + BufferPlan::MicrosOfFrames(frames, Output().format.frameRate);
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
        if (!IsOutputEnabled() || SendBuffer(buffer, Output().destination) != B_OK)
            bufferGroup_->Recycle(buffer);
    }
    const MediaFormat& format = Output().format;
    const uint32_t channels = std::max<uint32_t>(format.channelCount, 1);
    framesSent_.fetch_add(int64_t(format.bufferSize / (channels * 4)), std::memory_order_relaxed);
    QueueNextBuffer();
}

BufferGroup::Buffer* AudioProducer::FillNextBuffer(int64_t eventTime)
{
    const uint32_t bufferSize = Output().format.bufferSize;
    BufferGroup::Buffer* buffer = bufferGroup_ ? bufferGroup_->RequestBuffer(bufferSize) : nullptr;
    if (buffer == nullptr) {
        Diagnostics::Print("no buffer!\n");
        return nullptr;
    }
    const size_t floats = bufferSize / 4;
    const int64_t frames = BufferPlan::MixFramesPerBuffer(bufferSize, Output().format.channelCount);
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

    const float rate = Output().format.frameRate;
    const int64_t periodStart = BufferPlan::MicrosOfFrames(deviceFrame, rate);
    RunDueEvents(BufferPlan::MicrosOfFrames(deviceFrame + frames, rate));
    ServeDueBuffer(frames, deviceFrame);
    deviceOut_ = nullptr;

    // A period served more slowly than it plays leaves the device behind.
    const int64_t took = system_time() - began;
    const int64_t duration = BufferDuration();
    if (periods_.Record(took, duration))
        LateNoticeReceived(Output().source, took - duration, periodStart);
}

}  // namespace glimmet
