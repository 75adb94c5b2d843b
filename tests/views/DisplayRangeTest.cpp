#include <gtest/gtest.h>

#include "views/DisplayRange.h"

namespace glimmet {
namespace {

// Every case below is worked by hand for a container 399 pixels wide: 399
// whole columns, so a display range needs 398 frames to give each column
// at least one.
DisplayRange Range(int64_t first, int64_t last, float width = 399)
{
    DisplayRange range;
    range.SetWidth(width);
    range.Set(first, last);
    return range;
}

TEST(DisplayRangeTest, StartsEmptyAtZero)
{
    const DisplayRange range;
    EXPECT_EQ(range.First(), 0);
    EXPECT_EQ(range.Last(), -1);
    EXPECT_EQ(range.Width(), 0.0f);
}

TEST(DisplayRangeTest, ContainsBothEnds)
{
    const DisplayRange range = Range(10, 20);
    EXPECT_TRUE(range.Contains(10));
    EXPECT_TRUE(range.Contains(20));
    EXPECT_FALSE(range.Contains(9));
    EXPECT_FALSE(range.Contains(21));
}

TEST(DisplayRangeTest, MappingUsesTheWidthAndTheFrames)
{
    // 0 .. 398 over width 399: frame 0 at -1, frame 398 at
    // ceil(398 * 398 / 398) - 1 = 397, frame 199 at ceil(199) - 1 = 198.
    const DisplayRange range = Range(0, 398);
    EXPECT_EQ(range.PosAt(0), -1.0f);
    EXPECT_EQ(range.PosAt(398), 397.0f);
    EXPECT_EQ(range.PosAt(199), 198.0f);
    // 399 frames over 398 columns: column 0 holds frames 0 .. trunc(1.0025) - 1.
    EXPECT_EQ(range.FirstFrameAt(0), 0);
    EXPECT_EQ(range.LastFrameAt(0), 0);
}

TEST(DisplayRangeTest, NarrowRangeIsWidenedToTheColumns)
{
    DisplayRange range = Range(0, 0);
    // 1000 + 398 - 1 = 1397 > 1100, so the last frame moves out to 1397.
    EXPECT_TRUE(range.SetWidened(1000, 1100, 100000));
    EXPECT_EQ(range.First(), 1000);
    EXPECT_EQ(range.Last(), 1397);
}

TEST(DisplayRangeTest, WideRangeIsKept)
{
    DisplayRange range = Range(0, 0);
    EXPECT_FALSE(range.SetWidened(0, 5000, 100000));
    EXPECT_EQ(range.First(), 0);
    EXPECT_EQ(range.Last(), 5000);
}

TEST(DisplayRangeTest, ShortDocumentWidensOnlyToItsLength)
{
    // 50 frames: at most 49 columns count, 0 + 49 - 1 = 48.
    DisplayRange range = Range(0, 0);
    EXPECT_TRUE(range.SetWidened(0, 10, 50));
    EXPECT_EQ(range.Last(), 48);
}

TEST(DisplayRangeTest, FractionalWidthCountsWholeColumns)
{
    // 399.7 is 399 whole columns, as for 399: 0 + 398 - 1 = 397.
    DisplayRange range = Range(0, 0, 399.7f);
    EXPECT_TRUE(range.SetWidened(0, 10, 100000));
    EXPECT_EQ(range.Last(), 397);
}

TEST(DisplayRangeTest, ZoomCentresAShortRange)
{
    // 1000 .. 1099 spans 99 < 398: widened by (398 - 99) / 2 = 149 on
    // each side, 851 .. 1248.
    DisplayRange range = Range(0, 0);
    EXPECT_TRUE(range.ZoomTo(1000, 1099, 100000));
    EXPECT_EQ(range.First(), 851);
    EXPECT_EQ(range.Last(), 1248);
}

TEST(DisplayRangeTest, ZoomNearTheStartGivesTheShortfallToTheRight)
{
    // 10 .. 19 spans 9: widening (398 - 9) / 2 = 194; 10 - 194 falls 184
    // short of 0, so 0 .. 19 + 194 + 184 = 397.
    DisplayRange range = Range(0, 0);
    EXPECT_TRUE(range.ZoomTo(10, 19, 100000));
    EXPECT_EQ(range.First(), 0);
    EXPECT_EQ(range.Last(), 397);
}

TEST(DisplayRangeTest, ZoomNearTheEndShiftsLeftToTheFrameCount)
{
    // 990 .. 999 in 1000 frames: 796 .. 1193, which passes 1000 by 193,
    // so 603 .. 1000 (the frame count itself, one past the last frame).
    DisplayRange range = Range(0, 0);
    EXPECT_TRUE(range.ZoomTo(990, 999, 1000));
    EXPECT_EQ(range.First(), 603);
    EXPECT_EQ(range.Last(), 1000);
}

TEST(DisplayRangeTest, ZoomWithoutARangeShowsTheStart)
{
    // -1 .. -1: widening (398 - 0) / 2 = 199, shortfall 199 + 1 = 200,
    // so 0 .. -1 + 199 + 200 = 398.
    DisplayRange range = Range(5, 6);
    EXPECT_TRUE(range.ZoomTo(-1, -1, 100000));
    EXPECT_EQ(range.First(), 0);
    EXPECT_EQ(range.Last(), 398);
}

TEST(DisplayRangeTest, ZoomOfAWideRangeShowsItAsItIs)
{
    DisplayRange range = Range(0, 0);
    EXPECT_TRUE(range.ZoomTo(1000, 5000, 100000));
    EXPECT_EQ(range.First(), 1000);
    EXPECT_EQ(range.Last(), 5000);
}

TEST(DisplayRangeTest, ZoomOutsideTheDocumentChangesNothing)
{
    DisplayRange range = Range(5, 600);
    EXPECT_FALSE(range.ZoomTo(-5, 10, 1000));
    EXPECT_FALSE(range.ZoomTo(10, 1001, 1000));
    EXPECT_EQ(range.First(), 5);
    EXPECT_EQ(range.Last(), 600);
}

TEST(DisplayRangeTest, ResizeWidensByTheColumnsLessTwo)
{
    // 1000 .. 1100 spans 100 < 399 - 2 = 397: last = 1000 + 397 - 1 = 1396.
    DisplayRange range = Range(1000, 1100);
    range.WidenToOneFramePerColumn(100000);
    EXPECT_EQ(range.First(), 1000);
    EXPECT_EQ(range.Last(), 1396);
}

TEST(DisplayRangeTest, ResizeShiftsLeftBeforeTheEnd)
{
    // 1000 .. 1396 passes the last frame 1199 by 197: 803 .. 1199.
    DisplayRange range = Range(1000, 1100);
    range.WidenToOneFramePerColumn(1200);
    EXPECT_EQ(range.First(), 803);
    EXPECT_EQ(range.Last(), 1199);
}

TEST(DisplayRangeTest, ResizeOfAnEmptyDocumentChangesNothing)
{
    DisplayRange range = Range(0, -1);
    range.WidenToOneFramePerColumn(0);
    EXPECT_EQ(range.First(), 0);
    EXPECT_EQ(range.Last(), -1);
}

TEST(DisplayRangeTest, SliderMinimumIsTheColumnsOrTheDocument)
{
    const DisplayRange range = Range(0, 0);
    EXPECT_EQ(range.SliderMinRange(100000), 398);
    EXPECT_EQ(range.SliderMinRange(50), 49);
}

TEST(DisplayRangeTest, SliderFractionsInsideTheDocument)
{
    // 10397 frames, n = 399 - 2 = 397, 10397 - 397 = 10000:
    // 2500 / 10000 = 0.25 and (5397 - 397) / 10000 = 0.5.
    const DisplayRange range = Range(2500, 5397);
    const DisplayRange::SliderFractions fractions = range.SliderFractionsFor(10397);
    EXPECT_EQ(fractions.left, 0.25f);
    EXPECT_EQ(fractions.right, 0.5f);
}

TEST(DisplayRangeTest, SliderFractionsAtTheEndCountFromTheLastFrame)
{
    // 10398 frames, display up to the last, 10397: 10397 - 397 = 10000,
    // 2500 / 10000 = 0.25 and the right handle at 10000 / 10000 = 1.
    const DisplayRange range = Range(2500, 10397);
    const DisplayRange::SliderFractions fractions = range.SliderFractionsFor(10398);
    EXPECT_EQ(fractions.left, 0.25f);
    EXPECT_EQ(fractions.right, 1.0f);
}

}  // namespace
}  // namespace glimmet
