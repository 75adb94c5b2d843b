#pragma once

#include <atomic>
#include <cstdint>
#include <memory>

#include "playback/BufferGroup.h"
#include "playback/MediaKit.h"
#include "playback/OutputNegotiator.h"
#include "playback/PeriodStatistics.h"
#include "playback/PlaymarkRelay.h"
#include "playback/ProducerEventQueue.h"
#include "sound/Mixer.h"
#include "support/Status.h"

namespace glimmet {

class ChannelManager;
class DeviceTimeSource;
class MessageTarget;

/// The node that plays a document: it mixes one buffer of stereo float at a
/// time from the ChannelManager, stamps it with a performance time, hands it
/// to the sound device and tells the window where playback is ('udpm') and,
/// at the end of a range that does not loop, that it has stopped ('stop').
///
/// Negotiation and connection (the Format*, PrepareToConnect, Connect,
/// Disconnect, SetBufferGroup hooks) run on the window thread while the
/// device does not call the producer. Start and Stop queue timed events from
/// the window thread; the device's audio thread runs them, and every buffer,
/// in ServeDevice. Run mode, output enable and the latencies are atomics that
/// either thread may set. Everything the audio thread touches per buffer is
/// allocated at connection, the mixer's scratch included; both messages go
/// through the relay, never through Qt's queue from the audio thread.
///
/// The negotiation of the output's format is the OutputNegotiator's, the
/// buffer arithmetic the BufferPlan's, the event ring the
/// ProducerEventQueue's and the period accounting the PeriodStatistics';
/// the producer ties them to the mixer, the buffers and the device.
class AudioProducer {
public:
    static constexpr const char* kNodeName = "Glimmet";
    static constexpr const char* kOutputName = "Quillex Sound Output";
    static constexpr int32_t kRealTimePriority = 120;
    /// The buffer size given to a consumer that leaves it open: 256 stereo
    /// float frames.
    static constexpr uint32_t kDefaultBufferSize = OutputNegotiator::kDefaultBufferSize;

    AudioProducer(ChannelManager* manager, MessageTarget* looper);
    ~AudioProducer();
    AudioProducer(const AudioProducer&) = delete;
    AudioProducer& operator=(const AudioProducer&) = delete;

    const char* Name() const { return kNodeName; }
    /// The producer is application-owned: it comes from no add-on.
    void* AddOn(int32_t* internalId) const;

    // Registration ----------------------------------------------------------

    /// Called by the graph once the node has an id: sets the priority, starts
    /// the event loop and names the output.
    void NodeRegistered(int32_t nodeId);
    int32_t ID() const { return nodeId_; }
    int32_t Priority() const { return priority_; }
    bool IsLoopRunning() const { return loopRunning_; }
    void SetTimeSource(DeviceTimeSource* timeSource) { timeSource_ = timeSource; }
    DeviceTimeSource* TimeSource() const { return timeSource_; }

    // Run mode and latency ------------------------------------------------

    /// Offline mode is refused with an error report; others are taken.
    void SetRunMode(int32_t mode);
    int32_t RunMode() const { return runMode_.load(std::memory_order_relaxed); }
    /// The delay given with B_RECORDING by the graph.
    void SetProducerDelay(int64_t delay) { producerDelay_.store(delay, std::memory_order_relaxed); }
    int64_t ProducerDelay() const { return producerDelay_.load(std::memory_order_relaxed); }
    /// The last error reported to the node's watchers, 0 if none.
    int32_t LastReportedError() const { return reportedError_.load(std::memory_order_relaxed); }

    status_t GetLatency(int64_t* latency) const;
    int64_t EventLatency() const { return eventLatency_.load(std::memory_order_relaxed); }
    void SetEventLatency(int64_t latency) { eventLatency_.store(latency, std::memory_order_relaxed); }
    /// Estimated worst wake-up delay of the audio thread.
    int64_t SchedulingLatency() const;
    int64_t InternalLatency() const { return internalLatency_.load(std::memory_order_relaxed); }
    int64_t DownstreamLatency() const { return downstreamLatency_.load(std::memory_order_relaxed); }
    int64_t BufferDuration() const { return bufferDuration_.load(std::memory_order_relaxed); }
    void SetBufferDuration(int64_t duration) { bufferDuration_.store(duration, std::memory_order_relaxed); }

    // Format negotiation --------------------------------------------------

    const MediaFormat& PreferredFormat() const { return negotiator_.PreferredFormat(); }
    status_t FormatSuggestionRequested(int32_t type, int32_t quality, MediaFormat* format);
    status_t FormatProposal(const MediaSource& output, MediaFormat* format);
    status_t FormatChangeRequested(const MediaSource& source, const MediaDestination& destination,
        MediaFormat* format, int32_t* changeTag);
    status_t GetNextOutput(int32_t* cookie, MediaOutput* output);
    status_t DisposeOutputCookie(int32_t cookie);
    /// Null makes the node allocate its own group; another group is adopted.
    status_t SetBufferGroup(const MediaSource& forSource, std::unique_ptr<BufferGroup> group);
    status_t PrepareToConnect(const MediaSource& what, const MediaDestination& where, MediaFormat* format,
        MediaSource* source, char* name);
    /// downstreamLatency is what the device reports for the connection
    /// (the graph's answer to "find latency for").
    void Connect(status_t error, const MediaSource& source, const MediaDestination& destination,
        const MediaFormat& format, char* name, int64_t downstreamLatency = 0);
    void Disconnect(const MediaSource& what, const MediaDestination& where);
    void LateNoticeReceived(const MediaSource& what, int64_t howMuch, int64_t performanceTime);
    void EnableOutput(const MediaSource& what, bool enabled, int32_t* changeTag);
    void LatencyChanged(const MediaSource& source, const MediaDestination& destination, int64_t newLatency,
        uint32_t flags);
    void AdditionalBufferRequested(const MediaSource& source, int32_t previousBufferId, int64_t previousTime);
    status_t HandleMessage(int32_t message, const void* data, size_t size);
    status_t SetPlayRate(int32_t numerator, int32_t denominator);

    const MediaOutput& Output() const { return negotiator_.Output(); }
    bool IsOutputEnabled() const { return outputEnabled_.load(std::memory_order_relaxed); }
    const BufferGroup* Buffers() const { return bufferGroup_.get(); }

    // Event loop ------------------------------------------------------------

    /// Window thread: queue a start at the given performance time. False when
    /// the queue is full.
    status_t Start(int64_t performanceTime);
    /// Window thread: queue a stop; immediate stops go before anything else
    /// waiting at the next period.
    status_t Stop(int64_t performanceTime, bool immediate);
    /// Runs one event (audio thread, or any thread while no device serves).
    void HandleEvent(const MediaEvent& event, int64_t lateness, bool realTimeEvent);

    /// Audio thread: one device period of `frames` stereo float frames. The
    /// device has taken deviceFrame frames before this period. Runs the due
    /// events, produces and sends the due buffer, and raises a late notice
    /// when the period took longer than a buffer lasts.
    void ServeDevice(float* out, int32_t frames, int64_t deviceFrame);

    bool IsStarted() const { return started_.load(std::memory_order_relaxed); }
    int64_t FramesSent() const { return framesSent_.load(std::memory_order_relaxed); }
    int64_t StartTime() const { return startTime_.load(std::memory_order_relaxed); }
    /// Performance time stamped on the latest buffer produced.
    int64_t LastBufferStartTime() const { return lastBufferStart_.load(std::memory_order_relaxed); }
    /// Device periods whose service took longer than a buffer lasts.
    int64_t LatePeriods() const { return periods_.LatePeriods(); }
    /// Device periods served, and the longest time one took (microseconds).
    int64_t PeriodsServed() const { return periods_.PeriodsServed(); }
    int64_t LongestPeriodMicros() const { return periods_.LongestPeriodMicros(); }
    PlaymarkRelay& Relay() { return relay_; }
    const PlaymarkRelay& Relay() const { return relay_; }

private:
    bool IsOurSource(const MediaSource& source) const { return negotiator_.IsOurSource(source); }
    bool IsConnected() const { return negotiator_.IsConnected(); }
    void AllocateBuffers(const MediaFormat& format, bool requirePositiveDuration = true);
    /// Sizes the mixer for the buffers of the format (window thread).
    void PrepareMixer(const MediaFormat& format);
    /// One buffer of frames from the document; false when the mixer gave
    /// none. Relays the stop at the end of a range that does not loop.
    bool Mix(float* out, int64_t frames);
    int64_t TimeOfFramesSent(int64_t frames) const;
    void QueueNextBuffer();
    void HandleStart(const MediaEvent& event);
    void HandleStop();
    void HandleBuffer(const MediaEvent& event);
    BufferGroup::Buffer* FillNextBuffer(int64_t eventTime);
    status_t SendBuffer(BufferGroup::Buffer* buffer, const MediaDestination& destination);
    void RunDueEvents(int64_t periodEnd);
    void ServeDueBuffer(int32_t frames, int64_t deviceFrame);

    // Window thread while no device serves the producer.
    std::unique_ptr<BufferGroup> bufferGroup_;
    OutputNegotiator negotiator_;
    ChannelManager* manager_;  // not owned
    Mixer mixer_;              // sized at connection; the audio thread's own
    PlaymarkRelay relay_;      // carries 'udpm' and 'stop' to the looper (the window)
    DeviceTimeSource* timeSource_ = nullptr;  // not owned
    int32_t nodeId_ = -1;
    int32_t priority_ = 0;
    bool loopRunning_ = false;

    // Either thread.
    std::atomic<int64_t> downstreamLatency_{0};
    std::atomic<int64_t> internalLatency_{0};
    std::atomic<int64_t> eventLatency_{0};
    std::atomic<int64_t> bufferDuration_{0};
    std::atomic<int64_t> producerDelay_{0};
    std::atomic<int32_t> runMode_{B_INCREASE_LATENCY};
    std::atomic<bool> outputEnabled_{true};
    std::atomic<int32_t> reportedError_{0};

    // Events: written by the window thread (head), read by the audio thread
    // (tail).
    ProducerEventQueue events_;

    // Audio thread (atomics only so that other threads may look).
    std::atomic<bool> started_{false};
    std::atomic<int64_t> framesSent_{0};
    std::atomic<int64_t> startTime_{0};
    std::atomic<int64_t> lastBufferStart_{0};
    PeriodStatistics periods_;
    bool bufferPending_ = false;      // a B_HANDLE_BUFFER event is queued
    int64_t pendingBufferTime_ = 0;   // its performance time
    int64_t pendingBufferFrame_ = 0;  // frames sent when it was queued
    int64_t currentDeviceFrame_ = 0;  // device frame at the start of this period
    int64_t startDeviceFrame_ = 0;    // device frame at which the start was served
    float* deviceOut_ = nullptr;      // the period being written, during ServeDevice
    int32_t deviceFrames_ = 0;
};

}  // namespace glimmet
