#pragma once

#include <cstdint>
#include <filesystem>
#include <string>

namespace glimmet {

/// How many bytes of samples a file about to be opened may still take.
///
/// The room is the least of what the system says it can give without
/// swapping (MemAvailable in /proc/meminfo), what the process's own limits
/// leave (RLIMIT_AS over the mapped size, RLIMIT_DATA over the data
/// segment) and what its control group leaves (memory.max over
/// memory.current, for the group and every group above it). Of that room,
/// a margin stays free: 64 MiB for the decoder, the first picture and the
/// rest of the program, plus an eighth of the room, so that the first edits
/// (which build the blocks they change) have somewhere to go, and so that
/// the estimate MemAvailable makes of reclaimable caches is not relied on
/// to the last byte.
///
/// The environment variable GLIMMET_MEMORY_LIMIT (a number of bytes) can
/// lower the result, never raise it; tests use it to stand in for a small
/// machine.
class MemoryBudget {
public:
    static constexpr int64_t kFixedMargin = int64_t(64) << 20;
    static constexpr int64_t kMarginShare = 8;
    static constexpr const char* kLimitVariable = "GLIMMET_MEMORY_LIMIT";
    /// What "no limit known" reads as.
    static constexpr int64_t kUnlimited = INT64_MAX;

    MemoryBudget() = delete;

    /// Bytes of samples that may still be had; 0 when none.
    static int64_t ForSamples();
    /// The room before the margin is taken off (kUnlimited when nothing
    /// limits it).
    static int64_t Room();
    /// room less the margin, never below 0.
    static int64_t AfterMargin(int64_t room);

    /// A byte count as people read it: "812 KB", "2.5 GB".
    static std::string Describe(int64_t bytes);

    /// The pieces of Room, each kUnlimited when unknown or unlimited.
    static int64_t SystemAvailable(const std::filesystem::path& meminfo = "/proc/meminfo");
    static int64_t ProcessLimitRoom();
    static int64_t ControlGroupRoom();
    /// GLIMMET_MEMORY_LIMIT, or kUnlimited when unset or not a number.
    static int64_t EnvironmentLimit();
};

}  // namespace glimmet
