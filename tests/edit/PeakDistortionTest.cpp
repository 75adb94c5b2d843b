#include "edit/effects/PeakDistortion.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <span>
#include <vector>

#include "EffectReference.h"

namespace glimmet {
namespace {

using effects::PeakDistort;

// Peak Distort written out from its description, over a working buffer with
// one sample to spare past the end, which the scaling may touch.
template <typename Curve>
std::vector<int16_t> ReferencePeakDistort(const std::vector<int16_t>& samples, const Curve& f)
{
    const size_t n = samples.size();
    std::vector<int16_t> buffer(samples);
    buffer.push_back(0);
    size_t i = 0;
    while (i < n) {
        size_t L = 0;
        int p = 0;
        while (i + L < n && buffer[i + L] >= 1) {
            if (buffer[i + L] > p)
                p = buffer[i + L];
            ++L;
        }
        if (L > 1) {
            const double g = f(p / 32767.0);
            const double gain = double(float(1 - g)) / (p / 32767.0);
            for (size_t j = i; j <= i + L; ++j)
                buffer[j] = test::ReferenceLow16(gain * buffer[j]);
        }
        const size_t u = i + L;
        size_t M = 0;
        int q = 0;
        while (u + M < n && buffer[u + M] <= -1) {
            if (buffer[u + M] < q)
                q = buffer[u + M];
            ++M;
        }
        if (M > 1) {
            const double g = f(q * -1.0 / 32768.0);
            const double gain = double(float(1 - g)) / (q * -1.0 / 32768.0);
            for (size_t j = u; j <= u + M; ++j)
                buffer[j] = test::ReferenceLow16(gain * buffer[j]);
        }
        i = u + M + 1;
    }
    buffer.pop_back();
    return buffer;
}

template <typename Curve>
std::vector<int16_t> Distorted(std::vector<int16_t> samples, const Curve& curve)
{
    PeakDistort(samples, curve);
    return samples;
}

TEST(PeakDistortionTest, AlternatingSignsAreLeftUnchanged)
{
    int calls = 0;
    auto counting = [&](double) {
        ++calls;
        return 0.9;
    };
    std::vector<int16_t> samples;
    for (int j = 0; j < 1001; ++j)
        samples.push_back(j % 2 == 0 ? int16_t(32767 - j) : int16_t(-32768 + j));
    EXPECT_EQ(Distorted(samples, counting), samples);
    EXPECT_EQ(calls, 0);
}

TEST(PeakDistortionTest, ZerosNeverStartARun)
{
    int calls = 0;
    auto counting = [&](double) {
        ++calls;
        return 0.5;
    };
    const std::vector<int16_t> zeros(100, 0);
    EXPECT_EQ(Distorted(zeros, counting), zeros);
    const std::vector<int16_t> lonely = {0, 0, 7, 0, 0, -7, 0, 0, 7};
    EXPECT_EQ(Distorted(lonely, counting), lonely);
    EXPECT_EQ(calls, 0);
}

TEST(PeakDistortionTest, ARunIsScaledWithTheSampleThatEndsIt)
{
    // Height 0.5 at the peak 16384: gain 0.5 / (16384 / 32767).
    auto half = [](double) { return 0.5; };
    const double gain = 0.5 / (16384 / 32767.0);
    const std::vector<int16_t> samples = {8192, 16384, -100, 5};
    const std::vector<int16_t> expected = {int16_t(std::trunc(gain * 8192)),
                                           int16_t(std::trunc(gain * 16384)),
                                           int16_t(std::trunc(gain * -100)), 5};
    EXPECT_EQ(Distorted(samples, half), expected);
    EXPECT_EQ(expected[1], 16383);
}

TEST(PeakDistortionTest, ThePeakIsMappedThroughTheCurve)
{
    auto curve = [](double x) { return 0.2 * x; };
    for (int peak : {2, 100, 12345, 32767}) {
        const std::vector<int16_t> run = {int16_t(peak / 2), int16_t(peak), 0};
        const int16_t mapped = Distorted(run, curve)[1];
        EXPECT_NEAR(mapped, 32767 * (1 - curve(peak / 32767.0)), 1.0) << peak;
    }
    for (int peak : {-2, -100, -12345, -32768}) {
        const std::vector<int16_t> run = {int16_t(peak), int16_t(peak / 2), 0};
        const int16_t mapped = Distorted(run, curve)[0];
        EXPECT_NEAR(mapped, -32768 * (1 - curve(peak / -32768.0)), 1.0) << peak;
    }
}

TEST(PeakDistortionTest, ARunAtTheEndScalesOnePastItWithoutTouchingTheNeighbours)
{
    auto quarter = [](double) { return 0.75; };
    for (const std::vector<int16_t>& tail :
         {std::vector<int16_t>{-3, 100, 200, 300}, std::vector<int16_t>{5, -100, -200, -32768}}) {
        // The effect sees only the middle of a larger buffer: the guards on
        // either side must stay as they are.
        std::vector<int16_t> guarded = {1111};
        guarded.insert(guarded.end(), tail.begin(), tail.end());
        guarded.push_back(2222);
        PeakDistort(std::span<int16_t>(guarded).subspan(1, tail.size()), quarter);
        EXPECT_EQ(guarded.front(), 1111);
        EXPECT_EQ(guarded.back(), 2222);
        const std::vector<int16_t> result(guarded.begin() + 1, guarded.end() - 1);
        EXPECT_EQ(result, ReferencePeakDistort(tail, quarter));
        EXPECT_NE(result, tail);
    }
}

TEST(PeakDistortionTest, TheNegativeRunIsCountedAfterThePositiveRunsScaling)
{
    // A height below zero flips the sign of the sample after the positive
    // run, so the negative run that followed it loses its first sample.
    auto flipping = [](double) { return 1.5; };
    const std::vector<int16_t> samples = {1000, 2000, -100, -200, -300, 4};
    const std::vector<int16_t> result = Distorted(samples, flipping);
    EXPECT_EQ(result, ReferencePeakDistort(samples, flipping));
    EXPECT_GT(result[2], 0);
}

TEST(PeakDistortionTest, ScaledSamplesWrapInsteadOfClipping)
{
    // Height 4 at the peak 16384 takes it to about 131068, kept in 16 bits.
    auto tall = [](double) { return -3.0; };
    const std::vector<int16_t> samples = {16384, 16384, 0};
    const double gain = double(float(4.0)) / (16384 / 32767.0);
    const int16_t wrapped = int16_t(uint16_t(uint32_t(int32_t(std::trunc(gain * 16384)))));
    EXPECT_EQ(Distorted(samples, tall), (std::vector<int16_t>{wrapped, wrapped, 0}));
}

TEST(PeakDistortionTest, TheHeightIsRoundedToAFloatBeforeTheDivision)
{
    // 1 - 0.1 is not a float; its float rounding decides the last digit.
    auto tenth = [](double) { return 0.1; };
    std::vector<int16_t> samples;
    for (int peak = 2; peak < 32768; peak += 7) {
        samples.push_back(int16_t(peak));
        samples.push_back(int16_t(peak - 1));
        samples.push_back(0);
    }
    EXPECT_EQ(Distorted(samples, tenth), ReferencePeakDistort(samples, tenth));
}

TEST(PeakDistortionTest, MatchesTheReferenceForEveryCurve)
{
    for (uint32_t seed : {10u, 11u, 12u}) {
        const std::vector<int16_t> samples = test::EffectSamples(seed, 5000);
        for (const test::NamedCurve& curve : test::EffectCurves())
            EXPECT_EQ(Distorted(samples, curve), ReferencePeakDistort(samples, curve)) << curve.name;
    }
}

TEST(PeakDistortionTest, MatchesTheReferenceOnExtremeRuns)
{
    const std::vector<std::vector<int16_t>> buffers = {
        {},
        {32767},
        {-32768},
        {32767, 32767},
        {-32768, -32768},
        {1, 1, 1, 1},
        {-1, -1, -1},
        {32767, -32768, -32768, 32767, 32767, 0, -32768, -32768},
        {0, 32767, 32767, 32767, -32768, -32768, -32768, 0},
    };
    for (const std::vector<int16_t>& samples : buffers)
        for (const test::NamedCurve& curve : test::EffectCurves())
            EXPECT_EQ(Distorted(samples, curve), ReferencePeakDistort(samples, curve)) << curve.name;
}

TEST(PeakDistortionTest, TakesAFloatCurveToo)
{
    auto curve = [](float x) { return 0.25f + x * 0.5f; };
    const std::vector<int16_t> samples = test::EffectSamples(13, 3000);
    EXPECT_EQ(Distorted(samples, curve), ReferencePeakDistort(samples, curve));
}

}  // namespace
}  // namespace glimmet
