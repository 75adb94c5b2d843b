#pragma once

#include <cstdint>

namespace glimmet {

/// Microseconds of a monotonic clock; only differences are meaningful.
int64_t system_time();

/// Sleeps the calling thread for the given number of microseconds.
void snooze(int64_t micros);

}  // namespace glimmet
