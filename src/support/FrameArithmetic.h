#pragma once

#include <cstdint>
#include <limits>

namespace glimmet {

/// Sums of frame positions that users can make as large as they like (a
/// typed move offset, a drag) saturate instead of wrapping: a position that
/// wrapped would put a channel at the other end of the timeline.
inline int64_t SaturatingAdd(int64_t a, int64_t b)
{
    int64_t sum = 0;
    if (!__builtin_add_overflow(a, b, &sum))
        return sum;
    return b > 0 ? std::numeric_limits<int64_t>::max() : std::numeric_limits<int64_t>::min();
}

inline int64_t SaturatingSubtract(int64_t a, int64_t b)
{
    int64_t difference = 0;
    if (!__builtin_sub_overflow(a, b, &difference))
        return difference;
    return b < 0 ? std::numeric_limits<int64_t>::max() : std::numeric_limits<int64_t>::min();
}

}  // namespace glimmet
