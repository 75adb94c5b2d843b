#include "edit/effects/Distortion.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <vector>

#include "EffectReference.h"

namespace glimmet {
namespace {

using effects::Distort;

// Distort written out from its description, one sample at a time.
template <typename Curve>
std::vector<int16_t> ReferenceDistort(std::vector<int16_t> samples, const Curve& f)
{
    for (int16_t& s : samples) {
        // The curve's value is taken as a double, whatever its own type.
        double v;
        if (s < 0) {
            const double g = f(std::fabs(s / 32768.0));
            v = (1 - g) * -32768;
        } else {
            const double g = f(std::fabs(s / 32767.0));
            v = 32767 * (1 - g);
        }
        s = test::ReferenceOneSided(v);
    }
    return samples;
}

template <typename Curve>
std::vector<int16_t> Distorted(std::vector<int16_t> samples, const Curve& curve)
{
    Distort(samples, curve);
    return samples;
}

TEST(DistortionTest, FullScaleSamplesOfEitherSignReachTheCurveAtExactlyOne)
{
    std::vector<double> positions;
    auto curve = [&](double x) {
        positions.push_back(x);
        return 0.25;
    };
    std::vector<int16_t> samples = {-32768, 32767, 0, -16384};
    Distort(samples, curve);
    EXPECT_EQ(positions, (std::vector<double>{1.0, 1.0, 0.0, 0.5}));
    EXPECT_EQ(samples, (std::vector<int16_t>{-24576, 24575, 24575, -24576}));
}

TEST(DistortionTest, ResultsBeyondTheSampleRangeAreStoredAs32767OnBothSides)
{
    // 1 - (-1) = 2: the magnitude doubles.
    auto doubling = [](double) { return -1.0; };
    EXPECT_EQ(Distorted(std::vector<int16_t>{20000, -20000, -32768, 32767}, doubling),
              (std::vector<int16_t>{32767, 32767, 32767, 32767}));
    // Exactly at the ends of the range the values are kept.
    auto unit = [](double) { return 0.0; };
    EXPECT_EQ(Distorted(std::vector<int16_t>{-1, 1, -32768}, unit),
              (std::vector<int16_t>{-32768, 32767, -32768}));
}

TEST(DistortionTest, ACurveValueOfOneSilencesTheSample)
{
    auto one = [](double) { return 1.0; };
    EXPECT_EQ(Distorted(std::vector<int16_t>{-32768, 32767, 5, -5, 0}, one),
              (std::vector<int16_t>{0, 0, 0, 0, 0}));
}

TEST(DistortionTest, NotANumberIsStoredAs32767)
{
    auto broken = [](double) { return std::numeric_limits<double>::quiet_NaN(); };
    EXPECT_EQ(Distorted(std::vector<int16_t>{-5, 5}, broken), (std::vector<int16_t>{32767, 32767}));
}

TEST(DistortionTest, TheLinearCurveFromOneToZeroKeepsTheSamples)
{
    // 1 - f(x) = x: the identity up to the rounding of the scale.
    auto identity = [](double x) { return 1.0 - x; };
    std::vector<int16_t> samples = {-32768, -16384, -1, 0, 1, 16384, 32767};
    EXPECT_EQ(Distorted(samples, identity), ReferenceDistort(samples, identity));
    EXPECT_EQ(Distorted(std::vector<int16_t>{-32768, 0, 32767}, identity),
              (std::vector<int16_t>{-32768, 0, 32767}));
}

TEST(DistortionTest, EvaluatesTheCurveOncePerSampleInOrder)
{
    int calls = 0;
    auto counting = [&](double x) {
        ++calls;
        return x;
    };
    std::vector<int16_t> samples = test::EffectSamples(4, 500);
    Distort(samples, counting);
    EXPECT_EQ(size_t(calls), samples.size());
}

TEST(DistortionTest, MatchesTheReferenceForEveryCurve)
{
    const std::vector<int16_t> samples = test::EffectSamples(5, 5000);
    for (const test::NamedCurve& curve : test::EffectCurves())
        EXPECT_EQ(Distorted(samples, curve), ReferenceDistort(samples, curve)) << curve.name;
}

TEST(DistortionTest, TakesAFloatCurveToo)
{
    auto curve = [](float x) { return x * x * 0.5f; };
    const std::vector<int16_t> samples = test::EffectSamples(6, 2000);
    EXPECT_EQ(Distorted(samples, curve), ReferenceDistort(samples, curve));
}

TEST(DistortionTest, EveryPossibleSampleMatchesTheReference)
{
    std::vector<int16_t> all;
    for (int s = -32768; s <= 32767; ++s)
        all.push_back(int16_t(s));
    for (const test::NamedCurve& curve : test::EffectCurves())
        EXPECT_EQ(Distorted(all, curve), ReferenceDistort(all, curve)) << curve.name;
}

}  // namespace
}  // namespace glimmet
