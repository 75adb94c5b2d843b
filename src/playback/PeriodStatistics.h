#pragma once

#include <atomic>
#include <cstdint>

namespace glimmet {

/// How the audio thread keeps up with the device: periods served, the
/// longest one took, and those that took longer than a buffer lasts. The
/// audio thread records; any thread may read.
class PeriodStatistics {
public:
    /// Audio thread: one period took `took` microseconds; true when that is
    /// longer than a buffer of `bufferDuration` lasts (no duration: never).
    bool Record(int64_t took, int64_t bufferDuration);

    int64_t LatePeriods() const { return latePeriods_.load(std::memory_order_relaxed); }
    int64_t PeriodsServed() const { return periodsServed_.load(std::memory_order_relaxed); }
    int64_t LongestPeriodMicros() const { return longestPeriod_.load(std::memory_order_relaxed); }

private:
    std::atomic<int64_t> latePeriods_{0};
    std::atomic<int64_t> periodsServed_{0};
    std::atomic<int64_t> longestPeriod_{0};
};

}  // namespace glimmet
