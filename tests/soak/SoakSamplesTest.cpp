#include <gtest/gtest.h>

#include <vector>

#include "soak/SoakSamples.h"

namespace glimmet::test {
namespace {

std::vector<int16_t> Values(std::initializer_list<int16_t> values)
{
    return std::vector<int16_t>(values);
}

TEST(SoakSamplesTest, InsertPutsSamplesBeforeTheGivenIndex)
{
    SoakSamples samples(Values({1, 2, 3}));
    samples.Insert(1, SoakSamples(Values({7, 8})));
    EXPECT_EQ(samples.ToVector(), Values({1, 7, 8, 2, 3}));
    samples.Insert(5, SoakSamples(Values({9})));
    EXPECT_EQ(samples.ToVector(), Values({1, 7, 8, 2, 3, 9}));
    samples.Insert(0, SoakSamples::Zeros(2));
    EXPECT_EQ(samples.ToVector(), Values({0, 0, 1, 7, 8, 2, 3, 9}));
}

TEST(SoakSamplesTest, EraseAndResizeCutAndPad)
{
    SoakSamples samples(Values({1, 2, 3, 4, 5}));
    samples.Erase(1, 3);
    EXPECT_EQ(samples.ToVector(), Values({1, 4, 5}));
    samples.Resize(5);
    EXPECT_EQ(samples.ToVector(), Values({1, 4, 5, 0, 0}));
    samples.Resize(2);
    EXPECT_EQ(samples.ToVector(), Values({1, 4}));
}

TEST(SoakSamplesTest, ReplacingARangeIsSliceAndAppend)
{
    SoakSamples samples(Values({1, 2, 3, 4, 5}));
    SoakSamples replaced = samples.Slice(0, 1);
    replaced.Append(SoakSamples(Values({-1, -2, -3})));
    replaced.Append(samples.Slice(4, 1));
    EXPECT_EQ(replaced.ToVector(), Values({1, -1, -2, -3, 5}));
}

TEST(SoakSamplesTest, ReadsOutsideTheSamplesAreZeros)
{
    const SoakSamples samples(Values({5, 6}));
    EXPECT_EQ(samples.Read(-2, 6), Values({0, 0, 5, 6, 0, 0}));
    EXPECT_EQ(samples.Read(4, 2), Values({0, 0}));
    EXPECT_EQ(samples.At(-1), 0);
    EXPECT_EQ(samples.At(2), 0);
    EXPECT_EQ(samples.At(1), 6);
}

TEST(SoakSamplesTest, NeighbouringZeroRunsMergeIntoOnePiece)
{
    SoakSamples samples = SoakSamples::Zeros(3);
    samples.AppendZeros(4);
    samples.Append(SoakSamples::Zeros(5));
    ASSERT_EQ(samples.Pieces().size(), 1u);
    EXPECT_EQ(samples.Pieces()[0].count, 12);
    // Taking out the literal between two runs leaves one run.
    SoakSamples split = SoakSamples::Zeros(3);
    split.Append(SoakSamples(Values({1, 2})));
    split.AppendZeros(3);
    split.Erase(3, 5);
    ASSERT_EQ(split.Pieces().size(), 1u);
    EXPECT_TRUE(split.Pieces()[0].IsZeros());
    EXPECT_EQ(split.Size(), 6);
}

TEST(SoakSamplesTest, BillionsOfSilentFramesCostAFewPieces)
{
    SoakSamples samples(Values({1, 2, 3}));
    samples.Insert(0, SoakSamples::Zeros(int64_t(2) << 30));
    samples.AppendZeros(int64_t(1) << 31);
    EXPECT_EQ(samples.Size(), (int64_t(2) << 30) + 3 + (int64_t(1) << 31));
    EXPECT_EQ(samples.Pieces().size(), 3u);
    EXPECT_EQ(samples.At(int64_t(2) << 30), 1);
    EXPECT_EQ(samples.Read((int64_t(2) << 30) - 1, 5), Values({0, 1, 2, 3, 0}));
    EXPECT_TRUE(samples.Slice(0, int64_t(2) << 30).AllZeros());
}

TEST(SoakSamplesTest, EqualSamplesCompareEqualHoweverTheZerosAreKept)
{
    SoakSamples runs(Values({4}));
    runs.AppendZeros(3);
    const SoakSamples literal(Values({4, 0, 0, 0}));
    EXPECT_EQ(runs, literal);
    EXPECT_EQ(literal, runs);
    EXPECT_FALSE(runs == SoakSamples(Values({4, 0, 1, 0})));
    EXPECT_FALSE(runs == SoakSamples(Values({4, 0, 0})));
}

TEST(SoakSamplesTest, FirstDifferenceFindsTheFirstSampleThatDiffers)
{
    SoakSamples samples(Values({1, 2}));
    samples.AppendZeros(3);
    const int16_t same[] = {2, 0, 0};
    const int16_t other[] = {2, 0, 5};
    EXPECT_EQ(samples.FirstDifference(1, same, 3), -1);
    EXPECT_EQ(samples.FirstDifference(1, other, 3), 2);
}

}  // namespace
}  // namespace glimmet::test
