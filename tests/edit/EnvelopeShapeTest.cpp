#include "edit/effects/EnvelopeShape.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <vector>

#include "EffectReference.h"

namespace glimmet {
namespace {

using effects::ApplyEnvelope;

// The envelope written out from its description, one sample at a time.
template <typename Curve>
std::vector<int16_t> ReferenceEnvelope(std::vector<int16_t> samples, const Curve& f)
{
    const size_t n = samples.size();
    for (size_t i = 0; i < n; ++i) {
        const double position = double(i) / double(n);
        const double g = f(position);  // taken as a double, whatever the curve's type
        samples[i] = test::ReferenceOneSided((1 - g) * 4.0 * samples[i]);
    }
    return samples;
}

template <typename Curve>
std::vector<int16_t> Shaped(std::vector<int16_t> samples, const Curve& curve)
{
    ApplyEnvelope(samples, curve);
    return samples;
}

TEST(EnvelopeShapeTest, TheUntouchedCurveLeavesTheDataUnchanged)
{
    auto untouched = [](double) { return 0.75; };
    const std::vector<int16_t> samples = test::EffectSamples(7, 3000);
    EXPECT_EQ(Shaped(samples, untouched), samples);
}

TEST(EnvelopeShapeTest, FourHundredPercentSaturatesTo32767OnBothSides)
{
    auto full = [](double) { return 0.0; };
    EXPECT_EQ(Shaped(std::vector<int16_t>{-10000, 8000, 9000, -8192, -8193, 0}, full),
              (std::vector<int16_t>{32767, 32000, 32767, -32768, 32767, 0}));
}

TEST(EnvelopeShapeTest, ACurveValueOfOneSilencesTheSample)
{
    auto one = [](double) { return 1.0; };
    EXPECT_EQ(Shaped(std::vector<int16_t>{-32768, 32767, 7}, one), (std::vector<int16_t>{0, 0, 0}));
}

TEST(EnvelopeShapeTest, TheCurveIsSampledAtIOverNAndNeverAtItsRightEnd)
{
    std::vector<double> positions;
    auto curve = [&](double x) {
        positions.push_back(x);
        return 0.75;
    };
    std::vector<int16_t> samples(7, int16_t(100));
    ApplyEnvelope(samples, curve);
    ASSERT_EQ(positions.size(), 7u);
    for (size_t i = 0; i < 7; ++i)
        EXPECT_EQ(positions[i], double(i) / 7.0);
    EXPECT_LT(positions.back(), 1.0);
}

TEST(EnvelopeShapeTest, ProductsTruncateTowardZero)
{
    // A gain of 4 * (1 - 0.875) = 0.5.
    auto half = [](double) { return 0.875; };
    EXPECT_EQ(Shaped(std::vector<int16_t>{3, -3, 1, -1}, half), (std::vector<int16_t>{1, -1, 0, 0}));
}

TEST(EnvelopeShapeTest, AFadeFollowsTheCurve)
{
    // Gain from 4 * 0.25 = 1 down toward 0 along a straight line.
    auto fade = [](double x) { return 0.75 + 0.25 * x; };
    EXPECT_EQ(Shaped(std::vector<int16_t>{1000, 1000, 1000, 1000}, fade),
              (std::vector<int16_t>{1000, 750, 500, 250}));
}

TEST(EnvelopeShapeTest, NotANumberIsStoredAs32767)
{
    auto broken = [](double) { return std::numeric_limits<double>::quiet_NaN(); };
    EXPECT_EQ(Shaped(std::vector<int16_t>{5, -5}, broken), (std::vector<int16_t>{32767, 32767}));
}

TEST(EnvelopeShapeTest, AnEmptyRangeIsLeftAlone)
{
    int calls = 0;
    std::vector<int16_t> samples;
    ApplyEnvelope(samples, [&](double) { return double(++calls); });
    EXPECT_EQ(calls, 0);
}

TEST(EnvelopeShapeTest, MatchesTheReferenceForEveryCurve)
{
    for (size_t count : {1u, 2u, 3u, 1000u, 6001u}) {
        std::vector<int16_t> samples = test::EffectSamples(8, count);
        samples.resize(count);
        for (const test::NamedCurve& curve : test::EffectCurves())
            EXPECT_EQ(Shaped(samples, curve), ReferenceEnvelope(samples, curve))
                << curve.name << " count " << count;
    }
}

TEST(EnvelopeShapeTest, TakesAFloatCurveToo)
{
    auto curve = [](float x) { return 0.5f + 0.3f * x; };
    const std::vector<int16_t> samples = test::EffectSamples(9, 2000);
    EXPECT_EQ(Shaped(samples, curve), ReferenceEnvelope(samples, curve));
}

}  // namespace
}  // namespace glimmet
