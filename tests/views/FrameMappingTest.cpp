#include <gtest/gtest.h>

#include <cmath>

#include "views/FrameMapping.h"

namespace glimmet {
namespace {

struct MappingCase {
    float width;
    int64_t first;
    int64_t last;
};

class FrameMappingTest : public ::testing::TestWithParam<MappingCase> {};

// Reference computed in long double, then rounded to float where the
// mapping rounds, independently of the class under test.
float ReferencePosAt(const MappingCase& c, int64_t frame)
{
    const long double exact = (long double)(frame - c.first) * (long double)(c.width - 1) / (long double)(c.last - c.first);
    return std::ceil(float(exact)) - 1.0f;
}

TEST_P(FrameMappingTest, FirstDisplayedFrameIsOneLeftOfTheViewAndLastIsTwoLeftOfItsEdge)
{
    const MappingCase c = GetParam();
    const FrameMapping mapping(c.width, c.first, c.last);
    EXPECT_EQ(mapping.PosAt(c.first), -1.0f);
    EXPECT_EQ(mapping.PosAt(c.last), c.width - 2);
}

TEST_P(FrameMappingTest, PosAtMatchesTheFormulaEverywhere)
{
    const MappingCase c = GetParam();
    const FrameMapping mapping(c.width, c.first, c.last);
    const int64_t span = c.last - c.first + 1;
    for (int64_t k = -3; k <= 40; ++k) {
        const int64_t frame = c.first + k * span / 37;
        EXPECT_EQ(mapping.PosAt(frame), ReferencePosAt(c, frame)) << "frame " << frame;
    }
}

TEST_P(FrameMappingTest, ColumnsCoverSpanOverWidthMinusOneFrames)
{
    const MappingCase c = GetParam();
    const FrameMapping mapping(c.width, c.first, c.last);
    const float perColumn = float(c.last - c.first + 1) / (c.width - 1);
    for (int x = 0; x < int(c.width); x += 7) {
        const float fx = float(x);
        const int64_t first = int64_t(std::trunc(fx * perColumn)) + c.first;
        const int64_t last = int64_t(std::trunc((fx + 1) * perColumn)) + c.first - 1;
        EXPECT_EQ(mapping.FirstFrameAt(fx), first) << x;
        EXPECT_EQ(mapping.LastFrameAt(fx), last) << x;
        EXPECT_EQ(mapping.FrameAt(fx), (first + last) / 2) << x;
    }
}

TEST_P(FrameMappingTest, NeighbouringColumnsFollowEachOtherWithoutGaps)
{
    const MappingCase c = GetParam();
    const FrameMapping mapping(c.width, c.first, c.last);
    for (int x = 0; x + 1 < int(c.width); ++x) {
        EXPECT_LE(mapping.FirstFrameAt(float(x)), mapping.FirstFrameAt(float(x + 1))) << x;
        EXPECT_LE(mapping.FirstFrameAt(float(x + 1)), mapping.LastFrameAt(float(x)) + 1) << x;
    }
}

INSTANTIATE_TEST_SUITE_P(Widths, FrameMappingTest,
                         ::testing::Values(MappingCase{11, 0, 99}, MappingCase{100, 0, 999}, MappingCase{640, 0, 44099},
                                           MappingCase{641, 1000, 5000}, MappingCase{1919, 0, 158759999},
                                           MappingCase{300, -50, 249}, MappingCase{57, 13, 70},
                                           MappingCase{1024, 441000, 441000 + 1023 * 3}));

TEST(FrameMapping, FrameAtRoundsTowardsZeroForNegativeFrames)
{
    // Frames -3 .. -2 under column 0: their middle is -2.5, rounded to -2.
    const FrameMapping mapping(3, -3, -2);
    EXPECT_EQ(mapping.FirstFrameAt(0), -3);
    EXPECT_EQ(mapping.LastFrameAt(0), -3);
    EXPECT_EQ(mapping.FirstFrameAt(1), -2);
    const FrameMapping wide(2, -3, -2);
    EXPECT_EQ(wide.FirstFrameAt(0), -3);
    EXPECT_EQ(wide.LastFrameAt(0), -2);
    EXPECT_EQ(wide.FrameAt(0), -2);
}

TEST(FrameMapping, OneFrameDisplayRangeHasNoScaleAndStaysDefined)
{
    const FrameMapping mapping(100, 5, 5);
    EXPECT_EQ(mapping.PosAt(5), -1.0f);
    EXPECT_EQ(mapping.PosAt(900), -1.0f);
}

TEST(FrameMapping, TruncationClampsWhatNoFrameCanHold)
{
    EXPECT_EQ(TruncateToFrame(std::nanf("")), 0);
    EXPECT_EQ(TruncateToFrame(1e30f), int64_t(1) << 62);
    EXPECT_EQ(TruncateToFrame(-1e30f), -(int64_t(1) << 62));
    EXPECT_EQ(TruncateToFrame(-2.9f), -2);
    EXPECT_EQ(TruncateToFrame(2.9f), 2);
}

}  // namespace
}  // namespace glimmet
