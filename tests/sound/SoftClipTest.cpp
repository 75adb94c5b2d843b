#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <vector>

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

// The block version against the scalar one, bit for bit. The values sit at
// every position of blocks of several lengths, so each goes through the
// vector lanes as well as the scalar remainders of the loops.
void ExpectBlockMatches(const std::vector<float>& values)
{
    for (int64_t length : {1, 3, 7, 8, 15, 16, 17, 63, 64, 65, 129}) {
        for (size_t begin = 0; begin < values.size(); begin += size_t(length)) {
            const size_t end = std::min(values.size(), begin + size_t(length));
            std::vector<float> in(values.begin() + ptrdiff_t(begin), values.begin() + ptrdiff_t(end));
            std::vector<float> out(in.size(), 12345.0f);
            soft_clip_block(in.data(), out.data(), int64_t(in.size()));
            std::vector<float> inPlace = in;
            soft_clip_block(inPlace.data(), inPlace.data(), int64_t(inPlace.size()));
            for (size_t i = 0; i < in.size(); ++i) {
                ASSERT_EQ(Bits(out[i]), Bits(soft_clip(in[i]))) << "x = " << in[i] << " bits " << Bits(in[i]);
                ASSERT_EQ(Bits(inPlace[i]), Bits(out[i])) << "x = " << in[i];
            }
        }
    }
}

float FromBits(uint32_t bits)
{
    float value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

TEST(SoftClipBlockTest, SpecialValues)
{
    const float infinity = std::numeric_limits<float>::infinity();
    const float denormal = std::numeric_limits<float>::denorm_min();
    std::vector<float> values = {0.0f, -0.0f, 0.3f, -0.3f, 1.0f, -1.0f, 1.5f, -1.5f, 2.7f, -2.7f, infinity,
        -infinity, std::numeric_limits<float>::quiet_NaN(), -std::numeric_limits<float>::quiet_NaN(),
        FromBits(0x7fa00001u), FromBits(0xffc12345u), FromBits(0x7f800001u), denormal, -denormal,
        std::numeric_limits<float>::min(), -std::numeric_limits<float>::min(), FromBits(0x007fffffu),
        FromBits(0x807fffffu), std::numeric_limits<float>::max(), std::numeric_limits<float>::lowest(),
        std::nextafter(0.3f, 0.0f), std::nextafter(0.3f, 1.0f), std::nextafter(-0.3f, 0.0f),
        std::nextafter(-0.3f, -1.0f), std::nextafter(1.0f, 0.0f), std::nextafter(1.0f, 2.0f),
        std::nextafter(-1.0f, 0.0f), std::nextafter(-1.0f, -2.0f), 0.999969f, 1.99994f, 64.0f, 511.0f, -511.0f};
    ExpectBlockMatches(values);
}

TEST(SoftClipBlockTest, MixSums)
{
    // Sums of up to 64 channels, as the mixer feeds them: k / 32768.
    std::vector<float> values;
    for (int32_t k = -64 * 32768; k <= 64 * 32768; k += 7)
        values.push_back(float(k) * 3.0517578125e-05f);
    ExpectBlockMatches(values);
}

TEST(SoftClipBlockTest, ArbitraryBitPatterns)
{
    std::vector<float> values;
    uint32_t state = 2024u;
    for (int i = 0; i < 200000; ++i) {
        state = state * 1664525u + 1013904223u;
        values.push_back(FromBits(state));
    }
    // Every magnitude from 2^-3 to 2^3 in small steps, both signs.
    for (uint32_t bits = 0x3e000000u; bits <= 0x41000000u; bits += 97) {
        values.push_back(FromBits(bits));
        values.push_back(FromBits(bits | 0x80000000u));
    }
    ExpectBlockMatches(values);
}

}  // namespace
}  // namespace glimmet
