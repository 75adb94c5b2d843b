#pragma once

#include <cmath>
#include <cstdint>
#include <functional>
#include <limits>
#include <random>
#include <string>
#include <vector>

namespace glimmet::test {

/// What the effect tests share: the curves they draw, the samples they feed
/// and the integer conversions of the effects written out again,
/// independently of the production code.

/// A curve as the dialogs' curve control gives it: 0 left of 0, right of 1
/// and for not-a-number; otherwise the drawn shape, not clamped.
inline double ControlValue(double x, const std::function<double(double)>& shape)
{
    if (std::isnan(x) || x < 0.0 || x > 1.0)
        return 0.0;
    return shape(x);
}

struct NamedCurve {
    std::string name;
    std::function<double(double)> shape;

    double operator()(double x) const { return ControlValue(x, shape); }
};

/// Constant, linear, wiggly, outside [-1, 1] and huge: the shapes every
/// effect is checked with.
inline std::vector<NamedCurve> EffectCurves()
{
    return {
        {"zero", [](double) { return 0.0; }},
        {"untouched", [](double) { return 0.75; }},
        {"one", [](double) { return 1.0; }},
        {"tenth", [](double) { return 0.1; }},
        {"rising", [](double x) { return x; }},
        {"falling", [](double x) { return 1.0 - x; }},
        {"wiggly", [](double x) { return 0.5 + 0.4 * std::sin(23.0 * x) + 0.07 * std::cos(131.0 * x); }},
        {"overshooting", [](double x) { return 3.0 - 8.0 * x; }},
        {"huge", [](double x) { return 1.0e9 * std::sin(17.0 * x + 0.3); }},
        {"negative", [](double x) { return -0.5 - 2.0 * x * x; }},
    };
}

/// The extremes first, then alternating signs, runs of each sign and zeros,
/// then random samples; the last run reaches the end of the buffer.
inline std::vector<int16_t> EffectSamples(uint32_t seed, size_t randomCount)
{
    std::vector<int16_t> samples = {-32768, 32767, 0, 1, -1, 2, -2, 32767, 32767, -32768,
                                    -32768, 0, 0, 0, 5, -5, 5, -5, 5, 12000, 32767, 700,
                                    0, -32768, -300, -32767, 1, 0, -1, -1};
    std::mt19937 random(seed);
    std::uniform_int_distribution<int> any(-32768, 32767);
    std::uniform_int_distribution<int> runLength(1, 12);
    std::uniform_int_distribution<int> magnitude(1, 32767);
    while (samples.size() < randomCount) {
        // Mostly runs of one sign, so that the half-wave effects find runs.
        const int length = runLength(random);
        const int sign = any(random) < 0 ? -1 : 1;
        for (int k = 0; k < length; ++k)
            samples.push_back(int16_t(sign * magnitude(random)));
        if (any(random) > 20000)
            samples.push_back(int16_t(any(random)));
        if (any(random) > 25000)
            samples.push_back(0);
    }
    samples.push_back(30000);
    samples.push_back(100);
    samples.push_back(32767);
    return samples;
}

/// trunc(value) as an int32; out of range and not-a-number give INT32_MIN.
inline int32_t ReferenceInt32(double value)
{
    const double truncated = std::trunc(value);
    if (!(truncated >= -2147483648.0 && truncated <= 2147483647.0))
        return std::numeric_limits<int32_t>::min();
    return int32_t(truncated);
}

/// 32767 for anything outside the 16-bit range, on either side.
inline int16_t ReferenceOneSided(double value)
{
    const int64_t truncated = ReferenceInt32(value);
    if (truncated > 32767 || truncated < -32768)
        return 32767;
    return int16_t(truncated);
}

/// The low 16 bits of the int32, no clipping.
inline int16_t ReferenceLow16(double value)
{
    const int64_t truncated = ReferenceInt32(value);
    return int16_t(uint16_t(uint64_t(truncated) & 0xffffu));
}

}  // namespace glimmet::test
