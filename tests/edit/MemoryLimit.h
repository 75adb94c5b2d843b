#pragma once

#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstring>
#include <functional>
#include <string>

namespace glimmet::test {

/// The process's address space in bytes, from /proc/self/status.
inline int64_t AddressSpaceBytes()
{
    FILE* status = std::fopen("/proc/self/status", "r");
    if (status == nullptr)
        return -1;
    char line[256];
    int64_t kilobytes = -1;
    while (std::fgets(line, sizeof line, status) != nullptr) {
        if (std::strncmp(line, "VmSize:", 7) == 0)
            kilobytes = std::strtoll(line + 7, nullptr, 10);
    }
    std::fclose(status);
    return kilobytes * 1024;
}

/// Runs body in a forked child whose address space may grow by at most
/// extraBytes: an allocation beyond that fails there instead of swapping
/// the machine. Returns the child's exit code (body's result), or -1 when it
/// died; 99 means the limit could not be set.
inline int RunUnderMemoryLimit(int64_t extraBytes, const std::function<int()>& body)
{
    std::fflush(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        const int64_t now = AddressSpaceBytes();
        rlimit limit{};
        limit.rlim_cur = rlim_t(now + extraBytes);
        limit.rlim_max = rlim_t(now + extraBytes);
        if (now < 0 || setrlimit(RLIMIT_AS, &limit) != 0)
            _exit(99);
        const int result = body();
        std::fflush(nullptr);
        _exit(result);
    }
    int status = 0;
    if (child < 0 || waitpid(child, &status, 0) != child)
        return -1;
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

}  // namespace glimmet::test
