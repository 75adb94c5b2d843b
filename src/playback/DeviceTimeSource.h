#pragma once

#include <atomic>
#include <cstdint>

namespace glimmet {

/// The clock that playback runs on: performance time counts the frames the
/// sound device has taken, converted to microseconds at the device's rate,
/// and is tied to real time (system_time) at the start of the latest period.
///
/// Thread use: Advance is called by the audio thread only; the queries may
/// be called from any thread.
class DeviceTimeSource {
public:
    /// Starts the clock at performance time 0 now.
    void Reset(float frameRate);

    /// Audio thread, at the start of a device period: frames delivered so far.
    int64_t FramesDelivered() const { return frames_.load(std::memory_order_acquire); }
    /// Audio thread, after a period of frames was written at realTime.
    void Advance(int64_t frames, int64_t realTime);

    float FrameRate() const { return rate_.load(std::memory_order_relaxed); }
    /// Microseconds of performance time at which device frame `frame` plays.
    int64_t PerformanceTimeOfFrame(int64_t frame) const;
    /// Real time now (system_time), as the time source's RealTime().
    static int64_t RealTime();
    /// The performance time that corresponds to the given real time.
    int64_t PerformanceTimeFor(int64_t realTime) const;

private:
    std::atomic<float> rate_{44100.0f};
    std::atomic<int64_t> frames_{0};
    std::atomic<int64_t> anchorRealTime_{0};  // real time when frames_ last changed
};

}  // namespace glimmet
