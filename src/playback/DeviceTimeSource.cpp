#include "playback/DeviceTimeSource.h"

#include <cmath>

#include "support/SystemTime.h"

namespace glimmet {

void DeviceTimeSource::Reset(float frameRate)
{
    rate_.store(frameRate > 0 ? frameRate : 44100.0f, std::memory_order_relaxed);
    frames_.store(0, std::memory_order_release);
    anchorRealTime_.store(system_time(), std::memory_order_release);
}

void DeviceTimeSource::Advance(int64_t frames, int64_t realTime)
{
    anchorRealTime_.store(realTime, std::memory_order_release);
    frames_.fetch_add(frames, std::memory_order_acq_rel);
}

int64_t DeviceTimeSource::PerformanceTimeOfFrame(int64_t frame) const
{
    return std::llround(double(frame) * 1000000.0 / double(FrameRate()));
}

int64_t DeviceTimeSource::RealTime()
{
    return system_time();
}

int64_t DeviceTimeSource::PerformanceTimeFor(int64_t realTime) const
{
    const int64_t anchor = anchorRealTime_.load(std::memory_order_acquire);
    return PerformanceTimeOfFrame(FramesDelivered()) + (realTime - anchor);
}

}  // namespace glimmet
