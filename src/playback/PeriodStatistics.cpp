#include "playback/PeriodStatistics.h"

namespace glimmet {

bool PeriodStatistics::Record(int64_t took, int64_t bufferDuration)
{
    periodsServed_.fetch_add(1, std::memory_order_relaxed);
    // Only the audio thread writes, so a load and a store cannot lose a
    // longer period to another writer.
    if (took > longestPeriod_.load(std::memory_order_relaxed))
        longestPeriod_.store(took, std::memory_order_relaxed);
    if (bufferDuration <= 0 || took <= bufferDuration)
        return false;
    latePeriods_.fetch_add(1, std::memory_order_relaxed);
    return true;
}

}  // namespace glimmet
