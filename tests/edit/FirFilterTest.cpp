#include "edit/effects/FirFilter.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <stdexcept>
#include <vector>

#include "EffectReference.h"

namespace glimmet {
namespace {

using effects::FirFilter;
using effects::FirKernel;

// The filter written out from its description: input holds the taps frames of
// history, then the range.
std::vector<int16_t> ReferenceFilter(const std::vector<int16_t>& input,
                                     const std::vector<double>& kernel)
{
    const size_t taps = kernel.size();
    const size_t n = input.size() - taps;
    std::vector<int16_t> output(n);
    for (size_t i = 0; i < n; ++i) {
        if (taps == 0) {
            output[i] = input[i];
            continue;
        }
        int64_t acc = test::ReferenceInt32(kernel[0] * input[i + taps]);
        if (taps == 1)
            acc = acc > 32767 ? 32767 : (acc < -32768 ? -32768 : acc);
        for (size_t k = 1; k < taps; ++k) {
            acc += test::ReferenceInt32(kernel[k] * input[i + taps - k]);
            // 32-bit arithmetic wraps.
            if (acc > INT32_MAX)
                acc -= int64_t(1) << 32;
            if (acc < INT32_MIN)
                acc += int64_t(1) << 32;
            if (acc > 32767)
                acc = 32767;
            if (acc < -32768)
                acc = -32768;
        }
        output[i] = int16_t(acc);
    }
    return output;
}

std::vector<int16_t> Filter(const std::vector<int16_t>& input, const std::vector<double>& kernel)
{
    std::vector<int16_t> output(input.size() - kernel.size(), int16_t(12345));
    FirFilter(input, kernel, output);
    return output;
}

TEST(FirFilterTest, KernelSamplesTheCurveOverTheHalfOpenUnitInterval)
{
    std::vector<double> positions;
    auto curve = [&](double x) {
        positions.push_back(x);
        return x * x;
    };
    const std::vector<double> kernel = FirKernel(curve, 10);
    ASSERT_EQ(kernel.size(), 10u);
    ASSERT_EQ(positions.size(), 10u);
    for (int i = 0; i < 10; ++i) {
        EXPECT_EQ(positions[i], double(i) / 10.0);
        EXPECT_EQ(kernel[i], 1.0 - positions[i] * positions[i]);
    }
    EXPECT_LT(positions.back(), 1.0);
}

TEST(FirFilterTest, KernelOfEveryCurveIsOneMinusTheCurve)
{
    for (const test::NamedCurve& curve : test::EffectCurves()) {
        for (int32_t taps : {1, 2, 3, 10, 57}) {
            const std::vector<double> kernel = FirKernel(curve, taps);
            ASSERT_EQ(kernel.size(), size_t(taps));
            for (int32_t i = 0; i < taps; ++i)
                EXPECT_EQ(kernel[i], 1.0 - curve(double(i) / double(taps))) << curve.name;
        }
    }
}

TEST(FirFilterTest, NoTapsGiveAnEmptyKernelThatLeavesTheRangeUnchanged)
{
    auto curve = [](double) { return 0.25; };
    EXPECT_TRUE(FirKernel(curve, 0).empty());
    EXPECT_TRUE(FirKernel(curve, -3).empty());
    EXPECT_TRUE(FirKernel(curve, INT32_MIN).empty());
    const std::vector<int16_t> input = test::EffectSamples(1, 200);
    EXPECT_EQ(Filter(input, {}), input);
}

TEST(FirFilterTest, DefaultTapsWithAFlatZeroCurveSumTheCurrentAndNinePreviousFrames)
{
    const std::vector<double> kernel = FirKernel([](double) { return 0.0; }, 10);
    for (double coefficient : kernel)
        EXPECT_EQ(coefficient, 1.0);
    std::vector<int16_t> input;
    for (int j = 0; j < 40; ++j)
        input.push_back(int16_t(j * 7 - 100));
    const std::vector<int16_t> output = Filter(input, kernel);
    for (size_t i = 0; i < output.size(); ++i) {
        int sum = 0;
        for (size_t k = 0; k < 10; ++k)
            sum += input[i + 10 - k];
        EXPECT_EQ(output[i], sum) << i;
    }
    // Loud frames saturate.
    const std::vector<int16_t> loud(30, int16_t(5000));
    for (int16_t value : Filter(loud, kernel))
        EXPECT_EQ(value, 32767);
}

TEST(FirFilterTest, TheRunningSumIsClampedAfterEveryTerm)
{
    // 30000 + 30000 saturates to 32767 before the third term subtracts 30000.
    const std::vector<int16_t> input = {30000, 30000, 30000, 30000};
    EXPECT_EQ(Filter(input, {1.0, 1.0, -1.0}), (std::vector<int16_t>{2767}));
    const std::vector<int16_t> low = {-30000, -30000, -30000, -30000};
    EXPECT_EQ(Filter(low, {1.0, 1.0, -1.0}), (std::vector<int16_t>{-2768}));
    // The first term alone is not clamped before the second is added.
    EXPECT_EQ(Filter({0, 100, 30000}, {2.0, -1.0}), (std::vector<int16_t>{32767}));
    EXPECT_EQ(Filter({0, 30000, 30000}, {2.0, -1.0}), (std::vector<int16_t>{30000}));
}

TEST(FirFilterTest, ProductsTruncateTowardZero)
{
    EXPECT_EQ(Filter({3, 3, 3}, {0.5, 0.5}), (std::vector<int16_t>{2}));
    EXPECT_EQ(Filter({-3, -3, -3}, {0.5, 0.5}), (std::vector<int16_t>{-2}));
}

TEST(FirFilterTest, FirstFramesTakeTheirHistoryFromBeforeTheRange)
{
    // The frames before the range stand for what FillBuffer supplies from
    // before the channel's first frame.
    const std::vector<int16_t> input = {1000, 200, 30, 4};
    const std::vector<int16_t> output = Filter(input, {1.0, 1.0, 1.0});
    EXPECT_EQ(output, (std::vector<int16_t>{234}));
    const std::vector<int16_t> silentHistory = {0, 0, 30, 4};
    EXPECT_EQ(Filter(silentHistory, {1.0, 1.0, 1.0}), (std::vector<int16_t>{34}));
    // The kernel weights the frame k frames before the current one.
    EXPECT_EQ(Filter({1, 10, 100, 1000, 7}, {0.0, 0.0, 0.0, 1.0}), (std::vector<int16_t>{10}));
}

TEST(FirFilterTest, OneTapIsAClampedGain)
{
    EXPECT_EQ(Filter({0, 1001, -1001, 3}, {0.5}), (std::vector<int16_t>{500, -500, 1}));
    EXPECT_EQ(Filter({0, 30000, -30000}, {2.0}), (std::vector<int16_t>{32767, -32768}));
    EXPECT_EQ(Filter({0, -32768, 32767}, {1.0}), (std::vector<int16_t>{-32768, 32767}));
}

TEST(FirFilterTest, HugeCoefficientsSaturateAndNeverLeaveTheSampleRange)
{
    // Products beyond int32 become INT32_MIN; sums wrap in 32 bits.
    EXPECT_EQ(Filter({0, 32767}, {1.0e9}), (std::vector<int16_t>{-32768}));
    EXPECT_EQ(Filter({0, 32767, 1}, {0.0, 1.0e9}), (std::vector<int16_t>{-32768}));
    // 2147483647 + 2 wraps to a negative sum before the clamp.
    EXPECT_EQ(Filter({0, 1, 1}, {2147483647.0, 2.0}), (std::vector<int16_t>{-32768}));
}

TEST(FirFilterTest, TheSameKernelGivesTheSameResultAgain)
{
    // Redo filters with the kept kernel: the result depends on nothing else.
    const std::vector<double> kernel = FirKernel(test::EffectCurves()[6], 12);
    const std::vector<int16_t> input = test::EffectSamples(2, 300);
    EXPECT_EQ(Filter(input, kernel), Filter(input, kernel));
}

TEST(FirFilterTest, RejectsAnInputThatDoesNotHoldHistoryAndRange)
{
    std::vector<int16_t> input(10);
    std::vector<int16_t> output(8);
    const std::vector<double> kernel = {1.0, 1.0, 1.0};
    EXPECT_THROW(FirFilter(input, kernel, output), std::invalid_argument);
}

TEST(FirFilterTest, MatchesTheReferenceForEveryCurveAndTapCount)
{
    const std::vector<int16_t> input = test::EffectSamples(3, 3000);
    for (const test::NamedCurve& curve : test::EffectCurves()) {
        for (int32_t taps : {0, 1, 2, 3, 10, 33, 128}) {
            const std::vector<double> kernel = FirKernel(curve, taps);
            EXPECT_EQ(Filter(input, kernel), ReferenceFilter(input, kernel))
                << curve.name << " taps " << taps;
        }
    }
}

TEST(FirFilterTest, MatchesTheReferenceOnExtremeFrames)
{
    std::vector<int16_t> input;
    for (int j = 0; j < 500; ++j)
        input.push_back(j % 3 == 0 ? int16_t(-32768) : (j % 3 == 1 ? int16_t(32767) : int16_t(0)));
    const std::vector<std::vector<double>> kernels = {
        {1.0, 1.0}, {-1.0, -1.0, -1.0}, {0.999, -0.5, 0.25, 2.0}, {1.0e12, -1.0e12}, {-1.0e-9, 3.0}};
    for (const std::vector<double>& kernel : kernels)
        EXPECT_EQ(Filter(input, kernel), ReferenceFilter(input, kernel));
}

}  // namespace
}  // namespace glimmet
