#include "edit/SampleTransform.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <random>
#include <vector>

#include "TestDocument.h"
#include "TransformReference.h"

namespace glimmet {
namespace {

using test::TransformReference;

TEST(SampleTransformTest, StoreTruncatedTruncatesTowardZeroAndKeepsTheLow16Bits)
{
    EXPECT_EQ(SampleTransform::StoreTruncated(1.9), 1);
    EXPECT_EQ(SampleTransform::StoreTruncated(-1.9), -1);
    EXPECT_EQ(SampleTransform::StoreTruncated(-0.5), 0);
    EXPECT_EQ(SampleTransform::StoreTruncated(32767.99), 32767);
    // No clipping: the low 16 bits wrap.
    EXPECT_EQ(SampleTransform::StoreTruncated(32768.0), -32768);
    EXPECT_EQ(SampleTransform::StoreTruncated(-32769.0), 32767);
    EXPECT_EQ(SampleTransform::StoreTruncated(65537.5), 1);
    EXPECT_EQ(SampleTransform::StoreTruncated(2147483647.9), -1);
    EXPECT_EQ(SampleTransform::StoreTruncated(-2147483648.9), 0);
}

TEST(SampleTransformTest, ValuesNoInt32HoldsStoreTheLowBitsOf0x80000000)
{
    EXPECT_EQ(SampleTransform::StoreTruncated(std::numeric_limits<double>::quiet_NaN()), 0);
    EXPECT_EQ(SampleTransform::StoreTruncated(std::numeric_limits<double>::infinity()), 0);
    EXPECT_EQ(SampleTransform::StoreTruncated(-std::numeric_limits<double>::infinity()), 0);
    EXPECT_EQ(SampleTransform::StoreTruncated(2147483648.0), 0);
    EXPECT_EQ(SampleTransform::StoreTruncated(-2147483649.0), 0);
    EXPECT_EQ(SampleTransform::StoreTruncated(1e300), 0);
}

TEST(SampleTransformTest, FadesOfThreeFrames)
{
    std::vector<int16_t> in{1000, 1000, 1000};
    SampleTransform::FadeIn(in.data(), 3);
    EXPECT_EQ(in, (std::vector<int16_t>{0, 500, 1000}));
    std::vector<int16_t> out{1000, 1000, 1000};
    SampleTransform::FadeOut(out.data(), 3);
    EXPECT_EQ(out, (std::vector<int16_t>{1000, 500, 0}));
}

TEST(SampleTransformTest, FadesOfOneFrameWriteZero)
{
    int16_t sample = 1234;
    SampleTransform::FadeIn(&sample, 1);
    EXPECT_EQ(sample, 0);
    sample = -32768;
    SampleTransform::FadeOut(&sample, 1);
    EXPECT_EQ(sample, 0);
}

TEST(SampleTransformTest, RevertPhasesWrapsAtTheNegativeExtreme)
{
    std::vector<int16_t> samples{-32768, 32767, 0, -1, 1};
    SampleTransform::RevertPhases(samples.data(), 5);
    EXPECT_EQ(samples, (std::vector<int16_t>{-32768, -32767, 0, 1, -1}));
}

TEST(SampleTransformTest, RevertOfAnOddCountKeepsTheMiddle)
{
    std::vector<int16_t> samples{1, 2, 3, 4, 5};
    SampleTransform::Revert(samples.data(), 5);
    EXPECT_EQ(samples, (std::vector<int16_t>{5, 4, 3, 2, 1}));
}

TEST(SampleTransformTest, PeakIsTheFirstSampleOfTheLargestMagnitude)
{
    const int16_t a[] = {3, 5, -5, 4};
    EXPECT_EQ(SampleTransform::Peak(a, 4, 0), 5);
    const int16_t b[] = {-5, 5};
    EXPECT_EQ(SampleTransform::Peak(b, 2, 0), -5);
    const int16_t c[] = {32767, -32768};
    EXPECT_EQ(SampleTransform::Peak(c, 2, 0), -32768);
    // The peak found in an earlier channel wins a tie.
    EXPECT_EQ(SampleTransform::Peak(b, 2, 5), 5);
    EXPECT_EQ(SampleTransform::Peak(a, 0, 0), 0);
}

TEST(SampleTransformTest, MaximizeFactorIsAFloat)
{
    EXPECT_EQ(SampleTransform::MaximizeFactor(-16384), std::fabs(32767.0f / -16384.0f));
    EXPECT_EQ(SampleTransform::MaximizeFactor(3), 32767.0f / 3.0f);
    EXPECT_TRUE(std::isinf(SampleTransform::MaximizeFactor(0)));
}

TEST(SampleTransformTest, ScaleOfSilenceByInfinityStaysSilent)
{
    std::vector<int16_t> samples(7, 0);
    SampleTransform::Scale(samples.data(), 7, SampleTransform::MaximizeFactor(0));
    EXPECT_EQ(samples, std::vector<int16_t>(7, 0));
}

TEST(SampleTransformTest, MaximizedPeakReachesFullScaleOrOneBelow)
{
    for (int peak = 1; peak <= 32766; peak += 37) {
        for (int sign : {1, -1}) {
            int16_t sample = int16_t(sign * peak);
            SampleTransform::Scale(&sample, 1, SampleTransform::MaximizeFactor(sample));
            EXPECT_GE(std::abs(int(sample)), 32766) << peak;
            EXPECT_LE(std::abs(int(sample)), 32767) << peak;
        }
    }
}

TEST(SampleTransformTest, LongFadesMatchTheReference)
{
    // 2^20 + 1 samples make n - 1 a power of two: many quotients are exact
    // integers, the case a reciprocal gets wrong without care.
    std::mt19937 random(5);
    for (size_t length : {size_t(44101), size_t(1048577), size_t(1000003)}) {
        const std::vector<int16_t> data = test::RandomSamples(random, length);
        std::vector<int16_t> in = data;
        SampleTransform::FadeIn(in.data(), int64_t(length));
        EXPECT_EQ(in, TransformReference::FadeIn(data)) << length;
        std::vector<int16_t> out = data;
        SampleTransform::FadeOut(out.data(), int64_t(length));
        EXPECT_EQ(out, TransformReference::FadeOut(data)) << length;
    }
}

TEST(SampleTransformTest, FadeInOfEveryValueAtEveryPositionOfAShortRange)
{
    for (int64_t n : {2, 3, 17}) {
        for (int value = -32768; value <= 32767; value += 1) {
            const std::vector<int16_t> data(static_cast<size_t>(n), static_cast<int16_t>(value));
            std::vector<int16_t> in = data;
            SampleTransform::FadeIn(in.data(), n);
            ASSERT_EQ(in, TransformReference::FadeIn(data)) << n << " " << value;
        }
    }
}

// The low 16 bits of the int32 truncation, 0x80000000 (low bits 0) for
// anything no int32 holds, worked out with 64-bit integers.
int16_t LowBitsOfTruncation(double value)
{
    if (!(value > -2147483649.0 && value < 2147483648.0))
        return 0;
    const int64_t truncated = int64_t(std::trunc(value));
    return int16_t(uint16_t(uint64_t(truncated) & 0xffffu));
}

TEST(SampleTransformTest, ScaledBlocksStoreValuesNoInt32HoldsAsSingleSamplesDo)
{
    // Long enough for whole vector blocks and a remainder; every sample
    // value class, so that lanes overflow in both directions next to lanes
    // that do not.
    std::vector<int16_t> data;
    for (int i = 0; i < 45; i++) {
        for (int16_t value : {int16_t(0), int16_t(1), int16_t(-1), int16_t(3), int16_t(-32768), int16_t(32767),
                 int16_t(100), int16_t(-2500)})
            data.push_back(int16_t(value + (value != 0 && value > -32768 && value < 32767 ? i : 0)));
    }
    const float factors[] = {std::numeric_limits<float>::infinity(), -std::numeric_limits<float>::infinity(),
        std::numeric_limits<float>::quiet_NaN(), 1e6f, 65537.5f, 65536.0f, 2.5f, -3.75f, 0.0f, -0.0f,
        std::numeric_limits<float>::max(), std::numeric_limits<float>::denorm_min()};
    for (float factor : factors) {
        std::vector<int16_t> expected;
        for (int16_t sample : data)
            expected.push_back(LowBitsOfTruncation(double(factor) * double(sample)));
        for (size_t length : {data.size(), size_t(16), size_t(17), size_t(33)}) {
            std::vector<int16_t> samples(data.begin(), data.begin() + ptrdiff_t(length));
            SampleTransform::Scale(samples.data(), int64_t(length), factor);
            EXPECT_EQ(samples, std::vector<int16_t>(expected.begin(), expected.begin() + ptrdiff_t(length)))
                << "factor " << factor << " length " << length;
        }
    }
}

class SampleTransformLengthTest : public ::testing::TestWithParam<int> {};

TEST_P(SampleTransformLengthTest, MatchesTheReferenceOverRandomData)
{
    std::mt19937 random(uint32_t(GetParam()) * 7919u + 17u);
    for (int round = 0; round < 4; round++) {
        const std::vector<int16_t> data = test::RandomSamples(random, size_t(GetParam()));
        const int64_t n = int64_t(data.size());

        std::vector<int16_t> in = data;
        SampleTransform::FadeIn(in.data(), n);
        EXPECT_EQ(in, TransformReference::FadeIn(data));

        std::vector<int16_t> out = data;
        SampleTransform::FadeOut(out.data(), n);
        EXPECT_EQ(out, TransformReference::FadeOut(data));

        std::vector<int16_t> reverted = data;
        SampleTransform::Revert(reverted.data(), n);
        EXPECT_EQ(reverted, TransformReference::Revert(data));

        std::vector<int16_t> inverted = data;
        SampleTransform::RevertPhases(inverted.data(), n);
        EXPECT_EQ(inverted, TransformReference::RevertPhases(data));

        // Maximize of data without the extremes, so that the scaling runs.
        std::vector<int16_t> quiet = data;
        for (int16_t& sample : quiet)
            sample = int16_t(sample / 3);
        std::vector<std::vector<int16_t>> expected{quiet};
        TransformReference::Maximize(expected);
        std::vector<int16_t> loud = quiet;
        const int16_t peak = SampleTransform::Peak(loud.data(), n, 0);
        SampleTransform::Scale(loud.data(), n, SampleTransform::MaximizeFactor(peak));
        EXPECT_EQ(loud, expected[0]);
    }
}

INSTANTIATE_TEST_SUITE_P(Lengths, SampleTransformLengthTest,
    ::testing::Values(1, 2, 3, 4, 5, 6, 7, 100, 101, 4096, 4097, 65535));

}  // namespace
}  // namespace glimmet
