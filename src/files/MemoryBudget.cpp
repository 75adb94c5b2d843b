#include "files/MemoryBudget.h"

#include <sys/resource.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <string>

namespace glimmet {

namespace {

/// The number after "field:" in a /proc file whose figures are in kB.
int64_t ReadKilobytes(const std::filesystem::path& file, const std::string& field)
{
    std::ifstream in(file);
    std::string line;
    const std::string prefix = field + ":";
    while (std::getline(in, line)) {
        if (line.rfind(prefix, 0) != 0)
            continue;
        const long long kilobytes = std::atoll(line.c_str() + prefix.size());
        if (kilobytes < 0 || kilobytes > INT64_MAX / 1024)
            return MemoryBudget::kUnlimited;
        return int64_t(kilobytes) * 1024;
    }
    return -1;
}

/// A whole non-negative number, or -1 for anything else ("max" included).
int64_t ParseBytes(const std::string& text)
{
    if (text.empty() || text.find_first_not_of("0123456789") != std::string::npos)
        return -1;
    errno = 0;
    const unsigned long long value = std::strtoull(text.c_str(), nullptr, 10);
    if (errno == ERANGE || value > uint64_t(INT64_MAX))
        return -1;
    return int64_t(value);
}

int64_t ReadBytesFile(const std::filesystem::path& file)
{
    std::ifstream in(file);
    std::string text;
    in >> text;
    return ParseBytes(text);
}

/// What a limit leaves beyond what is in use; kUnlimited for no limit.
int64_t RoomUnder(rlim_t limit, int64_t used)
{
    if (limit == RLIM_INFINITY || limit > rlim_t(INT64_MAX))
        return MemoryBudget::kUnlimited;
    return std::max<int64_t>(0, int64_t(limit) - std::max<int64_t>(0, used));
}

int64_t RoomUnderLimit(int resource, const char* usedField)
{
    rlimit limit{};
    if (getrlimit(resource, &limit) != 0)
        return MemoryBudget::kUnlimited;
    if (limit.rlim_cur == RLIM_INFINITY)
        return MemoryBudget::kUnlimited;
    return RoomUnder(limit.rlim_cur, ReadKilobytes("/proc/self/status", usedField));
}

/// One way groups are mounted: the unified hierarchy (version 2) or the
/// memory controller's own (version 1).
struct GroupHierarchy {
    const char* root;
    const char* linePrefix;  // of the process's line in /proc/self/cgroup
    const char* limitFile;
    const char* usageFile;
};

constexpr GroupHierarchy kHierarchies[] = {
    {"/sys/fs/cgroup", "0::", "memory.max", "memory.current"},
    {"/sys/fs/cgroup/memory", "memory:", "memory.limit_in_bytes", "memory.usage_in_bytes"},
};

/// The process's group in hierarchy ("user.slice/..."), or empty when it
/// is in the root group or the hierarchy is not there.
std::filesystem::path OwnGroup(const GroupHierarchy& hierarchy)
{
    std::ifstream in("/proc/self/cgroup");
    std::string line;
    while (std::getline(in, line)) {
        const size_t at = line.find(hierarchy.linePrefix);
        // Version 1 lines start with the hierarchy's number ("4:memory:/x").
        if (at == 0 || (at != std::string::npos && line[at - 1] == ':'))
            return std::filesystem::path(line.substr(at + std::strlen(hierarchy.linePrefix))).relative_path();
    }
    return {};
}

/// What the process's group and every group above it leave; a group whose
/// folder is not visible (a container shows its own root) is skipped.
int64_t RoomInHierarchy(const GroupHierarchy& hierarchy)
{
    int64_t room = MemoryBudget::kUnlimited;
    for (std::filesystem::path group = OwnGroup(hierarchy);; group = group.parent_path()) {
        const std::filesystem::path folder = std::filesystem::path(hierarchy.root) / group;
        const int64_t limit = ReadBytesFile(folder / hierarchy.limitFile);
        const int64_t usage = ReadBytesFile(folder / hierarchy.usageFile);
        // Version 1 writes "no limit" as a number near 2^63.
        if (limit >= 0 && usage >= 0 && limit < (int64_t(1) << 62))
            room = std::min(room, std::max<int64_t>(0, limit - usage));
        if (group.empty())
            break;
    }
    return room;
}

}  // namespace

int64_t MemoryBudget::ForSamples()
{
    return std::min(AfterMargin(Room()), EnvironmentLimit());
}

int64_t MemoryBudget::Room()
{
    return std::min({SystemAvailable(), ProcessLimitRoom(), ControlGroupRoom()});
}

int64_t MemoryBudget::AfterMargin(int64_t room)
{
    if (room == kUnlimited)
        return kUnlimited;
    const int64_t margin = kFixedMargin + room / kMarginShare;
    return std::max<int64_t>(0, room - margin);
}

int64_t MemoryBudget::SystemAvailable(const std::filesystem::path& meminfo)
{
    const int64_t available = ReadKilobytes(meminfo, "MemAvailable");
    return available < 0 ? kUnlimited : available;
}

int64_t MemoryBudget::ProcessLimitRoom()
{
    return std::min(RoomUnderLimit(RLIMIT_AS, "VmSize"), RoomUnderLimit(RLIMIT_DATA, "VmData"));
}

int64_t MemoryBudget::ControlGroupRoom()
{
    int64_t room = kUnlimited;
    for (const GroupHierarchy& hierarchy : kHierarchies)
        room = std::min(room, RoomInHierarchy(hierarchy));
    return room;
}

int64_t MemoryBudget::EnvironmentLimit()
{
    const char* text = std::getenv(kLimitVariable);
    if (text == nullptr)
        return kUnlimited;
    const int64_t limit = ParseBytes(text);
    return limit < 0 ? kUnlimited : limit;
}

std::string MemoryBudget::Describe(int64_t bytes)
{
    static const char* const kUnits[] = {"bytes", "KB", "MB", "GB", "TB", "PB", "EB"};
    double value = double(std::max<int64_t>(0, bytes));
    size_t unit = 0;
    while (value >= 1000 && unit + 1 < std::size(kUnits)) {
        value /= 1000;
        ++unit;
    }
    char text[32];
    if (unit == 0)
        std::snprintf(text, sizeof text, "%lld bytes", static_cast<long long>(bytes));
    else
        std::snprintf(text, sizeof text, value < 10 ? "%.1f %s" : "%.0f %s", value, kUnits[unit]);
    return text;
}

}  // namespace glimmet
