#pragma once

#include <cstdint>
#include <vector>

namespace glimmet::test {

using Samples = std::vector<int16_t>;

/// Frame i holds the value i + offset (wrapping), so every frame tells where
/// it came from.
inline Samples Counting(int64_t count, int16_t offset = 0)
{
    Samples samples = Samples(size_t(count));
    for (int64_t i = 0; i < count; ++i)
        samples[size_t(i)] = int16_t(i + offset);
    return samples;
}

/// What the mix makes of one sample.
inline float Level(int16_t sample) { return float(sample) / 32768.0f; }

}  // namespace glimmet::test
