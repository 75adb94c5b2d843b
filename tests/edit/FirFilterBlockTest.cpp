#include "edit/effects/FirFilter.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <random>
#include <stdexcept>
#include <vector>

#include "EffectReference.h"

namespace glimmet {
namespace {

using effects::FirFilter;
using effects::FirFilterInPlace;

// The filter written out again from its description, one output at a time in
// 64-bit arithmetic: truncated products, the int32 sum wrapping, the clamp
// after every term.
std::vector<int16_t> ReferenceFilter(const std::vector<int16_t>& input, const std::vector<double>& kernel)
{
    const size_t taps = kernel.size();
    std::vector<int16_t> output(input.size() - taps);
    for (size_t i = 0; i < output.size(); ++i) {
        if (taps == 0) {
            output[i] = input[i];
            continue;
        }
        int64_t acc = test::ReferenceInt32(kernel[0] * input[i + taps]);
        if (taps == 1)
            acc = std::clamp<int64_t>(acc, -32768, 32767);
        for (size_t k = 1; k < taps; ++k) {
            acc += test::ReferenceInt32(kernel[k] * input[i + taps - k]);
            acc = int64_t(int32_t(uint32_t(uint64_t(acc))));
            acc = std::clamp<int64_t>(acc, -32768, 32767);
        }
        output[i] = int16_t(acc);
    }
    return output;
}

std::vector<int16_t> Filtered(const std::vector<int16_t>& input, const std::vector<double>& kernel)
{
    std::vector<int16_t> output(input.size() - kernel.size(), int16_t(12345));
    FirFilter(input, kernel, output);
    return output;
}

std::vector<int16_t> FilteredInPlace(const std::vector<int16_t>& input, const std::vector<double>& kernel)
{
    const std::vector<int16_t> history(input.begin(), input.begin() + std::ptrdiff_t(kernel.size()));
    std::vector<int16_t> samples(input.begin() + std::ptrdiff_t(kernel.size()), input.end());
    FirFilterInPlace(history, kernel, samples);
    return samples;
}

// Extremes, alternating full-scale signs and runs, then random frames.
std::vector<int16_t> Frames(std::mt19937& random, size_t count)
{
    std::vector<int16_t> frames = test::EffectSamples(uint32_t(random()), count);
    for (size_t i = 0; i < 64 && i < frames.size(); ++i)
        frames[i] = i % 2 == 0 ? int16_t(32767) : int16_t(-32768);
    frames.resize(count);
    return frames;
}

std::vector<double> RandomKernel(std::mt19937& random, size_t taps, double magnitude)
{
    std::uniform_real_distribution<double> value(-magnitude, magnitude);
    std::vector<double> kernel;
    for (size_t k = 0; k < taps; ++k)
        kernel.push_back(value(random));
    return kernel;
}

void ExpectBothFormsMatch(const std::vector<int16_t>& input, const std::vector<double>& kernel, const char* what)
{
    const std::vector<int16_t> expected = ReferenceFilter(input, kernel);
    ASSERT_EQ(Filtered(input, kernel), expected) << what << ", " << kernel.size() << " taps, " << input.size();
    ASSERT_EQ(FilteredInPlace(input, kernel), expected) << what << ", " << kernel.size() << " taps, in place";
}

TEST(FirFilterBlockTest, KernelsOfEveryScaleMatchTheDefinition)
{
    std::mt19937 random(51);
    // Lengths around the block size and the vector widths.
    const std::vector<size_t> lengths = {0, 1, 7, 15, 16, 17, 33, 2047, 2048, 2049, 4097, 7001};
    for (size_t taps = 1; taps <= 24; ++taps) {
        for (size_t length : lengths) {
            const std::vector<int16_t> input = Frames(random, length + taps);
            ExpectBothFormsMatch(input, RandomKernel(random, taps, 1.0), "unit");
            ExpectBothFormsMatch(input, RandomKernel(random, taps, 0.3), "small");
            ExpectBothFormsMatch(input, RandomKernel(random, taps, 16384.0), "at the bound");
            ExpectBothFormsMatch(input, RandomKernel(random, taps, 1e6), "beyond the bound");
        }
    }
}

TEST(FirFilterBlockTest, CoefficientsAtAndJustPastTheBoundMatchTheDefinition)
{
    std::mt19937 random(52);
    const std::vector<int16_t> input = Frames(random, 5000);
    const double bound = 16384.0;
    const std::vector<double> edges = {bound, -bound, std::nextafter(bound, 1e9), -std::nextafter(bound, 1e9),
                                       65536.0, -65536.0, 1e12, 2.0, -2.0, 0.0};
    for (double a : edges) {
        for (double b : edges) {
            ExpectBothFormsMatch(input, {a, b, a, b, b, a, 1.0, -1.0, a, b}, "edge");
            ExpectBothFormsMatch(input, {a}, "one tap");
            ExpectBothFormsMatch(input, {b, a}, "two taps");
        }
    }
}

TEST(FirFilterBlockTest, NotANumberAndInfiniteCoefficientsMatchTheDefinition)
{
    std::mt19937 random(53);
    const std::vector<int16_t> input = Frames(random, 3000);
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const double inf = std::numeric_limits<double>::infinity();
    ExpectBothFormsMatch(input, {nan, 1.0, 1.0}, "NaN first");
    ExpectBothFormsMatch(input, {1.0, nan, 0.5, 0.5}, "NaN later");
    ExpectBothFormsMatch(input, {inf, -inf, 1.0}, "infinite");
}

TEST(FirFilterBlockTest, InPlaceWithoutTapsLeavesTheSamples)
{
    std::vector<int16_t> samples = {1, -2, 3};
    FirFilterInPlace({}, {}, samples);
    EXPECT_EQ(samples, (std::vector<int16_t>{1, -2, 3}));
}

TEST(FirFilterBlockTest, InPlaceRejectsAHistoryOfAnotherLength)
{
    std::vector<int16_t> samples(10, 1);
    const std::vector<int16_t> history(2, 0);
    const std::vector<double> kernel(3, 1.0);
    EXPECT_THROW(FirFilterInPlace(history, kernel, samples), std::invalid_argument);
}

}  // namespace
}  // namespace glimmet
