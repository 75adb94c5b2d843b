#include "edit/effects/EnvelopeShape.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <random>
#include <span>
#include <stdexcept>
#include <vector>

#include "EffectReference.h"
#include "edit/effects/Spline.h"
#include "edit/effects/SplineCurve.h"

namespace glimmet {
namespace {

using effects::ApplyGains;
using effects::ApplySplineEnvelope;
using effects::EnvelopeGains;
using effects::SplineCurve;

// The envelope written out again, one sample at a time, with the curve as
// the effects read it.
std::vector<int16_t> ReferenceEnvelope(std::vector<int16_t> samples, const SplineCurve& curve)
{
    const size_t n = samples.size();
    for (size_t i = 0; i < n; ++i) {
        const double g = curve(double(i) / double(n));
        samples[i] = test::ReferenceOneSided((1 - g) * 4.0 * samples[i]);
    }
    return samples;
}

std::vector<int16_t> Shaped(std::vector<int16_t> samples, const SplineCurve& curve)
{
    ApplySplineEnvelope(samples, curve);
    return samples;
}

// Knots over [0, 1] with both ends, values from `low` to `high`.
SplineCurve RandomCurve(std::mt19937& random, int32_t n, double low, double high)
{
    std::uniform_real_distribution<double> unit(0.0, 1.0);
    std::uniform_real_distribution<double> value(low, high);
    std::vector<double> x;
    for (int32_t i = 0; i < n; ++i)
        x.push_back(unit(random));
    std::sort(x.begin(), x.end());
    if (n >= 2) {
        x.front() = 0.0;
        x.back() = 1.0;
    }
    std::vector<double> y;
    for (int32_t i = 0; i < n; ++i)
        y.push_back(value(random));
    return SplineCurve(Spline(x.data(), y.data(), n));
}

TEST(EnvelopeGainsTest, MatchesThePerSampleEnvelopeForRandomSplines)
{
    std::mt19937 random(41);
    // Lengths around the block size and the vector widths.
    const std::vector<size_t> lengths = {1, 2, 3, 7, 16, 17, 2047, 2048, 2049, 4096, 6001};
    for (int32_t n = 1; n <= 12; ++n) {
        for (size_t length : lengths) {
            std::vector<int16_t> samples = test::EffectSamples(uint32_t(n * 100 + length), length);
            samples.resize(length);
            // Gains from below 0 to well above 400 %, so both sides saturate.
            const SplineCurve curve = RandomCurve(random, n, -1.5, 1.5);
            ASSERT_EQ(Shaped(samples, curve), ReferenceEnvelope(samples, curve)) << n << " knots, " << length;
        }
    }
}

TEST(EnvelopeGainsTest, MatchesThePerSampleEnvelopeOnExtremeSamples)
{
    std::mt19937 random(42);
    std::vector<int16_t> samples;
    for (int i = 0; i < 9000; ++i) {
        const int16_t extremes[] = {-32768, 32767, 0, 1, -1, -10000, 10000};
        samples.push_back(extremes[i % 7]);
    }
    for (int32_t n = 1; n <= 12; ++n) {
        const SplineCurve curve = RandomCurve(random, n, -3.0, 3.0);
        ASSERT_EQ(Shaped(samples, curve), ReferenceEnvelope(samples, curve)) << n << " knots";
    }
    const SplineCurve huge = RandomCurve(random, 5, -1e12, 1e12);
    EXPECT_EQ(Shaped(samples, huge), ReferenceEnvelope(samples, huge));
}

TEST(EnvelopeGainsTest, ACurveWithoutKnotsIsZeroEverywhere)
{
    const std::vector<int16_t> samples = test::EffectSamples(43, 5000);
    const SplineCurve empty;
    EXPECT_EQ(Shaped(samples, empty), ReferenceEnvelope(samples, empty));
}

TEST(EnvelopeGainsTest, EveryGainIsTheDoubleThePerSampleFormulaGives)
{
    // Frame by frame, so that a single differently rounded gain shows.
    std::mt19937 random(45);
    for (int32_t knots = 1; knots <= 12; ++knots) {
        const SplineCurve curve = RandomCurve(random, knots, -1.0, 2.0);
        const size_t n = 20011;
        std::vector<double> gains(n);
        EnvelopeGains(curve, n).Compute(0, gains);
        for (size_t i = 0; i < n; ++i)
            ASSERT_EQ(gains[i], (1.0 - curve(double(i) / double(n))) * 4.0) << knots << " knots, frame " << i;
    }
}

TEST(EnvelopeGainsTest, GainsOfAnyStretchAreThoseOfTheWholeRange)
{
    // Blocks may start anywhere; each gain depends on its frame index alone.
    std::mt19937 random(44);
    const SplineCurve curve = RandomCurve(random, 6, 0.0, 1.0);
    const size_t n = 10000;
    std::vector<double> whole(n);
    EnvelopeGains(curve, n).Compute(0, whole);
    EnvelopeGains stretches(curve, n);
    std::vector<double> part(777);
    for (size_t first = 0; first + part.size() <= n; first += 1999) {
        stretches.Compute(first, part);
        ASSERT_TRUE(std::equal(part.begin(), part.end(), whole.begin() + std::ptrdiff_t(first))) << first;
    }
}

TEST(EnvelopeGainsTest, RangesShapedTogetherAreShapedAsEachAlone)
{
    std::mt19937 random(46);
    for (size_t length : {size_t(1), size_t(2048), size_t(5001)}) {
        const SplineCurve curve = RandomCurve(random, 7, -0.5, 1.5);
        std::vector<std::vector<int16_t>> channels;
        for (uint32_t c = 0; c < 3; ++c) {
            channels.push_back(test::EffectSamples(47 + c, length));
            channels.back().resize(length);
        }
        std::vector<std::span<int16_t>> ranges;
        for (std::vector<int16_t>& channel : channels)
            ranges.emplace_back(channel);
        const std::vector<std::vector<int16_t>> before = channels;
        effects::ApplySplineEnvelopeTogether(ranges, curve);
        for (size_t c = 0; c < channels.size(); ++c)
            ASSERT_EQ(channels[c], ReferenceEnvelope(before[c], curve)) << "channel " << c << ", " << length;
    }
}

TEST(EnvelopeGainsTest, RangesOfDifferentLengthsAreRefused)
{
    std::vector<int16_t> a(10, 1);
    std::vector<int16_t> b(11, 1);
    const std::vector<std::span<int16_t>> ranges = {a, b};
    EXPECT_THROW(effects::ApplySplineEnvelopeTogether(ranges, SplineCurve()), std::invalid_argument);
}

TEST(EnvelopeGainsTest, ApplyGainsStoresLikeOneSidedTruncation)
{
    const std::vector<double> gains = {0.0, 1.0, -1.0, 4.0, -4.0, 1e300, -1e300, std::nan(""), 2.5, 0.9999999,
                                       3.99999, -3.99999, 65536.0, -65536.0, 1.0000305, 0.5};
    const std::vector<int16_t> values = {-32768, 32767, 0, 1, -1, 8191, -8192, 13107, -13108, 30000};
    for (double gain : gains) {
        std::vector<double> row(values.size(), gain);
        std::vector<int16_t> samples = values;
        ApplyGains(row, samples);
        for (size_t i = 0; i < values.size(); ++i)
            ASSERT_EQ(samples[i], test::ReferenceOneSided(gain * values[i])) << gain << " * " << values[i];
    }
}

}  // namespace
}  // namespace glimmet
