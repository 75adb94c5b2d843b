#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>

#include "sound/SoftClip.h"

namespace glimmet {
namespace {

// The curve written out again, step by step, with every rounding explicit.
float ReferenceCurve(float x)
{
    const float knee = 0.3f;
    const float blend = 0.7f;
    const float width = 1.2f;
    if (x < -knee)
        return -ReferenceCurve(-x);
    if (x <= knee)
        return x;
    const float parabolaBase = (x - knee) / width - 1.0f;
    const double parabolaSquare = std::pow(double(parabolaBase), 2.0);
    const float parabola = float(double(knee) + double(blend) * (1.0 - parabolaSquare));
    if (!(x < 1.0f))
        return parabola;
    const float blendBase = (x - knee) / blend - 1.0f;
    const double a = std::pow(double(blendBase), 2.0);
    const float oneMinusA = float(1.0 - a);
    const float parabolaPart = parabola * oneMinusA;
    return float(double(parabolaPart) + double(x) * a);
}

uint32_t Bits(float value)
{
    uint32_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    return bits;
}

class SoftClipPointTest : public ::testing::TestWithParam<float> {};

TEST_P(SoftClipPointTest, MatchesTheFormulaBitForBit)
{
    const float x = GetParam();
    EXPECT_EQ(Bits(soft_clip(x)), Bits(ReferenceCurve(x))) << "x = " << x;
}

INSTANTIATE_TEST_SUITE_P(Points, SoftClipPointTest,
    ::testing::Values(0.0f, -0.0f, 0.1f, -0.1f, 0.29999f, 0.3f, -0.3f, 0.30001f, -0.30001f, 0.35f, 0.4f, 0.5f,
        0.6f, 0.7f, 0.8f, 0.9f, 0.99f, 0.999969f, 1.0f, -1.0f, 1.0001f, 1.2f, 1.4f, 1.5f, -1.5f, 1.6f,
        1.99994f, -1.99994f, 2.0f, 2.5f, 2.7f, -2.7f, 3.0f, 4.0f, 10.0f, -10.0f, 64.0f));

TEST(SoftClipTest, KnownValues)
{
    EXPECT_EQ(soft_clip(0.3f), 0.3f);
    EXPECT_EQ(soft_clip(0.25f), 0.25f);
    EXPECT_EQ(soft_clip(-0.3f), -0.3f);
    // The parabola peaks at 1 for x = 1.5 and is back at 0.3 at 2.7.
    EXPECT_EQ(soft_clip(1.5f), 1.0f);
    EXPECT_NEAR(soft_clip(2.7f), 0.3f, 1e-6f);
    EXPECT_LT(soft_clip(4.0f), 0.0f);
    EXPECT_EQ(soft_clip(-1.5f), -1.0f);
}

TEST(SoftClipTest, IsOddAboveTheKnee)
{
    for (float x = 0.31f; x < 5.0f; x += 0.173f)
        EXPECT_EQ(Bits(soft_clip(-x)), Bits(-soft_clip(x))) << x;
}

TEST(SoftClipTest, NotANumberTakesTheParabola)
{
    EXPECT_TRUE(std::isnan(soft_clip(std::numeric_limits<float>::quiet_NaN())));
}

TEST(SoftClipTest, RisesFromTheKneeToThePeak)
{
    float previous = soft_clip(0.3f);
    for (float x = 0.3001f; x <= 1.5f; x += 0.0007f) {
        const float value = soft_clip(x);
        EXPECT_GE(value, previous - 1e-6f) << x;
        EXPECT_LE(value, 1.0f);
        previous = value;
    }
}

}  // namespace
}  // namespace glimmet
