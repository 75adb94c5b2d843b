#include <gtest/gtest.h>

#include <memory>

#include <cmath>

#include "ViewWaveformCheck.h"

namespace glimmet::test {
namespace {

std::vector<int16_t> Sine(int64_t count, double period, double amplitude)
{
    std::vector<int16_t> samples(static_cast<size_t>(count), int16_t(0));
    for (int64_t i = 0; i < count; ++i)
        samples[size_t(i)] = int16_t(std::lround(amplitude * std::sin(2 * M_PI * double(i) / period)));
    return samples;
}

std::vector<int16_t> Noise(int64_t count, uint32_t seed)
{
    std::vector<int16_t> samples(static_cast<size_t>(count), int16_t(0));
    for (auto& sample : samples) {
        seed = seed * 1664525u + 1013904223u;
        sample = int16_t(seed >> 16);
    }
    return samples;
}

TEST(SampleViewRender, WholeSineAtSeveralSizes)
{
    for (const QSize size : {QSize(200, 100), QSize(321, 77), QSize(64, 40), QSize(800, 260)}) {
        ViewFixture fixture(size.width(), size.height());
        const auto samples = Sine(5000, 300, 30000);
        fixture.Add(MakeChannel(samples));
        fixture.Show();
        fixture.container->SetDisplayRange(0, 4999);
        SCOPED_TRACE(size.width());
        ExpectRendered(fixture, 0, samples);
    }
}

TEST(SampleViewRender, NoiseWithRangeCursorAndPlaymark)
{
    ViewFixture fixture(300, 120);
    const auto samples = Noise(9000, 7);
    fixture.Add(MakeChannel(samples));
    fixture.Show();
    fixture.container->SetDisplayRange(1000, 7999);
    fixture.manager.ChannelAt(0)->SetSelected(true);
    fixture.container->SetRangeStart(2000);
    fixture.container->SetRangeEnd(4321);
    fixture.container->RangeChanged();
    fixture.container->SetCursorFrame(5000);
    fixture.container->SetPlaymarkFrame(6000);
    ExpectRendered(fixture, 0, samples);

    // Moving the cursor and the mark redraws only their columns; the whole
    // picture must still be right.
    fixture.container->SetCursorFrame(2500);
    fixture.container->SetPlaymarkFrame(2500);
    ExpectRendered(fixture, 0, samples);
    fixture.container->SetPlaymarkFrame(7000);
    ExpectRendered(fixture, 0, samples);
}

TEST(SampleViewRender, LateChannelShowsEmptyColumnsBeforeItsFirstFrame)
{
    ViewFixture fixture(250, 90);
    const auto early = Sine(4000, 97, 12000);
    const auto late = Noise(2500, 3);
    fixture.Add(MakeChannel(early));
    fixture.Add(MakeChannel(late, 1500));
    fixture.Show();
    fixture.container->SetDisplayRange(0, 3999);
    ExpectRendered(fixture, 0, early);
    ExpectRendered(fixture, 1, late);
    // Column 0 lies before the late channel's data: one flat colour,
    // and here the cursor (frame 0) is in it.
    EXPECT_EQ(fixture.View(1)->Bitmap().pixel(0, 5) & 0xffffff, 0x0000dcu);
    EXPECT_EQ(fixture.View(1)->Bitmap().pixel(10, 5) & 0xffffff, 0x505050u);
}

TEST(SampleViewRender, ColumnsReachingPastTheDataAreEmptyNotPartial)
{
    ViewFixture fixture(120, 60);
    const auto samples = Sine(1000, 50, 20000);
    fixture.Add(MakeChannel(samples));
    fixture.Show();
    // Show more than the data: the last columns reach past frame 999.
    fixture.container->SetDisplayRange(0, 1299);
    const WaveformCase c = CaseFor(fixture, 0, samples);
    ExpectRendered(fixture, 0, samples);
    const float perColumn = float(c.last - c.first + 1) / float(c.width);
    int partial = -1;
    for (int x = 0; x < c.width; ++x) {
        const int64_t f0 = int64_t(std::trunc(perColumn * float(x)));
        const int64_t f1 = int64_t(std::trunc(float(x) * perColumn + perColumn)) - 1;
        if (f0 <= 999 && f1 > 999)
            partial = x;
    }
    ASSERT_GE(partial, 0);
    for (int y = 0; y < c.height; ++y)
        EXPECT_EQ(fixture.View(0)->Bitmap().pixel(partial, y) & 0xffffff, 0x505050u) << y;
}

TEST(SampleViewRender, RangeColumnHoldingOnlyTheEndAndReachingPastItIsNotInRange)
{
    ViewFixture fixture(120, 40);
    std::vector<int16_t> samples(5000, 0);
    fixture.Add(MakeChannel(samples));
    fixture.Show();
    fixture.container->SetDisplayRange(0, 4999);
    fixture.manager.ChannelAt(0)->SetSelected(true);
    fixture.container->SetRangeStart(100);
    fixture.container->SetRangeEnd(2010);
    fixture.container->SetCursorFrame(4999);
    fixture.container->RangeChanged();
    ExpectRendered(fixture, 0, samples);
    SampleView* view = fixture.View(0);
    const float perColumn = 5000.0f / float(view->width());
    const int endColumn = int(2010 / perColumn);
    const int64_t f0 = int64_t(std::trunc(perColumn * float(endColumn)));
    ASSERT_LT(f0, 2010);
    // All samples are 0: rows of a plain column beyond the middle are light,
    // rows of a range column dark at the edge.
    EXPECT_EQ(view->Bitmap().pixel(endColumn, 0) & 0xff, 245u);
    EXPECT_EQ(view->Bitmap().pixel(endColumn - 1, 0) & 0xff, 0u);
}

TEST(SampleViewRender, HandComputedColumnShades)
{
    // One frame per column: a column holds a single sample, so a row is
    // either fully beyond (c = n) or not (c = 0).
    ViewFixture fixture(12, 50);
    std::vector<int16_t> samples = {-32768, 32767, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0};
    fixture.Add(MakeChannel(samples));
    fixture.Show();
    fixture.container->SetDisplayRange(0, 9);
    fixture.container->SetCursorFrame(5);
    SampleView* view = fixture.View(0);
    ASSERT_EQ(view->width(), 10);
    const int rows = view->height();
    const QImage& image = view->Bitmap();
    // -32768 is in row 0: seen from the top, every upper row has it beyond.
    EXPECT_EQ(view->RowOf(-32768), 0);
    EXPECT_EQ(view->RowOf(32767), rows - 1);
    EXPECT_EQ(image.pixel(0, 0) & 0xffffff, 0x000000u);
    EXPECT_EQ(image.pixel(0, rows / 2 - 1) & 0xffffff, 0x000000u);
    EXPECT_EQ(image.pixel(0, rows - 1) & 0xffffff, 0xf5f5f5u);
    // 32767 in the bottom row: all lower rows are dark, upper ones light.
    EXPECT_EQ(image.pixel(1, rows - 1) & 0xffffff, 0x000000u);
    EXPECT_EQ(image.pixel(1, rows / 2) & 0xffffff, 0x000000u);
    EXPECT_EQ(image.pixel(1, 0) & 0xffffff, 0xf5f5f5u);
    // The cursor column: (45, 45, 255) where the sample 0 is not beyond the
    // row, black where it is (from the top down to its row).
    const int zeroRow = view->RowOf(0);
    if (zeroRow < rows / 2) {
        EXPECT_EQ(image.pixel(5, 0) & 0xffffff, 0x000000u);
        EXPECT_EQ(image.pixel(5, zeroRow + 1) & 0xffffff, 0x2d2dffu);
        EXPECT_EQ(image.pixel(5, rows - 1) & 0xffffff, 0x2d2dffu);
    } else {
        // Seen from the bottom, rows from the middle down to the sample's
        // row have it beyond them; the rows below and the upper half not.
        EXPECT_EQ(image.pixel(5, rows / 2) & 0xffffff, 0x000000u);
        EXPECT_EQ(image.pixel(5, zeroRow + 1) & 0xffffff, 0x2d2dffu);
        EXPECT_EQ(image.pixel(5, 0) & 0xffffff, 0x2d2dffu);
    }
    EXPECT_EQ(image.pixel(5, zeroRow) & 0xffffff, 0x000000u);
}

TEST(SampleViewRender, RowTableMapsExtremesToFirstAndLastRow)
{
    for (int height : {16, 17, 50, 100, 199, 200, 257, 600}) {
        ViewFixture fixture(60, 100);
        Channel* channel = MakeChannel(std::vector<int16_t>(100, 0));
        fixture.manager.AddChannel(std::unique_ptr<Channel>(channel));
        auto view = std::make_unique<SampleView>(channel, fixture.container.get());
        view->Layout({0, 0, 59, float(height - 1)});
        ASSERT_EQ(view->height(), height);
        ASSERT_EQ(view->Bitmap().height(), height);
        const uint32_t q = 65535u / uint32_t(height) + 1;
        EXPECT_EQ(view->RowOf(-32768), 0);
        EXPECT_EQ(view->RowOf(32767), int(65528u / q)) << height;
        // The bottom row for the usual heights, not for every height.
        if (height <= 200)
            EXPECT_EQ(view->RowOf(32767), height - 1) << height;
        else
            EXPECT_LT(view->RowOf(32767), height - 1) << height;
        EXPECT_EQ(view->RowOf(0), int(32768u / q)) << height;
    }
}

TEST(SampleViewRender, WidgetShowsItsBitmap)
{
    ViewFixture fixture(200, 100);
    const auto samples = Noise(3000, 11);
    fixture.Add(MakeChannel(samples));
    fixture.Show();
    fixture.container->SetDisplayRange(0, 2999);
    DeliverPosted();
    const QImage shown = fixture.View(0)->grab().toImage().convertToFormat(QImage::Format_RGB32);
    EXPECT_EQ(FirstDifference(shown, fixture.View(0)->Bitmap()), "");
}

TEST(SampleViewRender, PartialUpdateRendersOnlyItsColumns)
{
    ViewFixture fixture(100, 50);
    const auto samples = Noise(2000, 5);
    fixture.Add(MakeChannel(samples));
    fixture.Show();
    fixture.container->SetDisplayRange(0, 1999);
    SampleView* view = fixture.View(0);
    const QImage before = view->Bitmap().copy();
    fixture.manager.ChannelAt(0)->SetSelected(true);
    fixture.manager.SetRangeStart(0);
    fixture.manager.SetRangeEnd(1999);
    ViewRect strip = view->Bounds();
    strip.left = 10;
    strip.right = 12;
    strip.top = 30;  // columns are always rendered over the full height
    strip.bottom = 31;
    view->Update(strip);
    const QImage after = view->Bitmap();
    const QImage expected = ReferenceWaveform(CaseFor(fixture, 0, samples));
    for (int y = 0; y < after.height(); ++y) {
        for (int x = 0; x < after.width(); ++x) {
            const QRgb want = (x >= 10 && x <= 12) ? expected.pixel(x, y) : before.pixel(x, y);
            ASSERT_EQ(after.pixel(x, y) & 0xffffff, want & 0xffffff) << x << "," << y;
        }
    }
}

TEST(SampleViewRender, ColumnsWithMoreThan65535FramesStayInBounds)
{
    // The 16-bit counters wrap for such columns, and the picture shows it.
    ViewFixture fixture(40, 40);
    auto samples = Sine(38 * 70000, 1000, 30000);
    // A steady first half puts all 70000 samples of a column in one row.
    std::fill(samples.begin(), samples.begin() + 19 * 70000, int16_t(20000));
    fixture.Add(MakeChannel(samples));
    fixture.Show();
    fixture.container->SetDisplayRange(0, 38 * 70000 - 1);
    ASSERT_EQ(fixture.View(0)->width(), 38);
    ExpectRendered(fixture, 0, samples);
    // 70000 wraps to 4464: the bottom of a steady column stays light.
    const QImage& image = fixture.View(0)->Bitmap();
    EXPECT_EQ(image.pixel(3, image.height() / 2) & 0xff, uint32_t(245 - (245 * 4464) / 70000));
}

}  // namespace
}  // namespace glimmet::test

namespace glimmet::test {
namespace {

// The strips the container redraws after each change must leave every view
// exactly as a full render would.
class PartialRedraws : public ::testing::Test {
protected:
    void SetUp() override
    {
        samples0 = Noise(6000, 21);
        samples1 = Sine(4000, 123, 25000);
        fixture.Add(MakeChannel(samples0));
        fixture.Add(MakeChannel(samples1, 1500));
        fixture.Show();
        fixture.container->SetDisplayRange(0, 5999);
    }

    void ExpectBothRendered()
    {
        ExpectRendered(fixture, 0, samples0);
        ExpectRendered(fixture, 1, samples1);
    }

    ViewFixture fixture{360, 180};
    std::vector<int16_t> samples0;
    std::vector<int16_t> samples1;
};

TEST_F(PartialRedraws, DraggingBackAndForthAcrossChannels)
{
    ChannelContainerView& container = *fixture.container;
    container.StartDragging(fixture.View(0), container.FirstFrameAt(100));
    for (float x : {150.0f, 220.0f, 180.0f, 60.0f, 20.0f, 300.0f}) {
        container.Dragging(fixture.View(1), x);
        SCOPED_TRACE(x);
        ExpectBothRendered();
    }
    container.Dragging(fixture.View(0), 90);
    ExpectBothRendered();
    container.StopDragging();
}

TEST_F(PartialRedraws, ShiftExtendAndDeselect)
{
    ChannelContainerView& container = *fixture.container;
    container.Clicked(fixture.View(1), QPointF(120, 10), Qt::LeftButton, Qt::NoModifier);
    container.MouseMoved(QPointF(200, 100));
    container.MouseUp(QPointF(200, 100));
    ExpectBothRendered();
    container.Clicked(fixture.View(1), QPointF(300, 10), Qt::LeftButton, Qt::ShiftModifier);
    container.MouseUp(QPointF(300, 10));
    ExpectBothRendered();
    container.Clicked(fixture.View(1), QPointF(40, 10), Qt::LeftButton, Qt::ShiftModifier);
    container.MouseUp(QPointF(40, 10));
    ExpectBothRendered();
    container.DeselectAll();
    ExpectBothRendered();
}

TEST_F(PartialRedraws, DoubleClickAndPlaymarkSteps)
{
    ChannelContainerView& container = *fixture.container;
    container.SelectAll();
    ExpectBothRendered();
    container.DoubleClicked(fixture.View(1), QPointF(200, 10), Qt::LeftButton, Qt::NoModifier);
    ExpectBothRendered();
    for (int64_t frame = 0; frame < 6000; frame += 777) {
        container.SetPlaymarkFrame(frame);
        container.SetCursorFrame(5999 - frame);
    }
    ExpectBothRendered();
}

TEST_F(PartialRedraws, AMarkMovedAwayLeavesNoColumnBehind)
{
    // The columns here do not hold whole numbers of frames, so the column a
    // mark is drawn in is not always the one PosAt names.
    ChannelContainerView& container = *fixture.container;
    for (int64_t frame = 0; frame < 6000; frame += 97) {
        container.SetCursorFrame(frame);
        container.SetCursorFrame(5000);
        container.SetPlaymarkFrame(frame);
        container.SetPlaymarkFrame(4000);
        SCOPED_TRACE(frame);
        ExpectBothRendered();
        if (HasFailure())
            return;
    }
}

}  // namespace
}  // namespace glimmet::test
