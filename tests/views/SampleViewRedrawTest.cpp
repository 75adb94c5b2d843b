#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include <QResizeEvent>

#include "ViewWaveformCheck.h"
#include "sound/ChannelSamples.h"

namespace glimmet::test {
namespace {

std::vector<int16_t> Tone(int64_t count, double period)
{
    std::vector<int16_t> samples(size_t(count), int16_t(0));
    for (int64_t i = 0; i < count; ++i)
        samples[size_t(i)] = int16_t(std::lround(28000 * std::sin(2 * M_PI * double(i) / period)));
    return samples;
}

// The image kept between renders must always equal a full render; these
// cases count how many columns each change renders again.
class SampleViewRedraw : public ::testing::Test {
protected:
    void SetUp() override
    {
        samples0 = Tone(9000, 333);
        samples1 = Tone(7000, 71);
        fixture.Add(MakeChannel(samples0));
        fixture.Add(MakeChannel(samples1, 1200));
        fixture.Show();
        fixture.container->SetDisplayRange(0, 8999);
    }

    int64_t Rendered() const { return fixture.View(0)->RenderedColumns() + fixture.View(1)->RenderedColumns(); }

    void ExpectAsFullRender(int index, const std::vector<int16_t>& samples) { ExpectRendered(fixture, index, samples); }

    void ExpectBothAsFullRender()
    {
        ExpectAsFullRender(0, samples0);
        ExpectAsFullRender(1, samples1);
    }

    ViewFixture fixture{302, 200};
    std::vector<int16_t> samples0;
    std::vector<int16_t> samples1;
};

TEST_F(SampleViewRedraw, APlaymarkStepRendersTheTwoColumnsItLeavesAndEnters)
{
    ChannelContainerView& container = *fixture.container;
    container.SetPlaymarkFrame(3000);
    const int64_t start = Rendered();
    for (int64_t frame = 3030; frame < 4000; frame += 30) {
        const int64_t before = Rendered();
        container.SetPlaymarkFrame(frame);
        // At most the old and the new mark column, in each of the two views.
        EXPECT_LE(Rendered() - before, 4) << frame;
    }
    // About one step in three crosses into a new column (30 frames per step,
    // 30 frames per column).
    EXPECT_GE(Rendered() - start, 2 * 20);
    ExpectBothAsFullRender();
}

TEST_F(SampleViewRedraw, ACursorMoveRendersOnlyTheColumnsItChanges)
{
    ChannelContainerView& container = *fixture.container;
    for (int64_t frame : {100, 5000, 5030, 8000, 0}) {
        const int64_t before = Rendered();
        container.SetCursorFrame(frame);
        // The old and the new cursor column, in each of the two views.
        EXPECT_LE(Rendered() - before, 4) << frame;
        EXPECT_GE(Rendered() - before, 1) << frame;
        ExpectBothAsFullRender();
    }
}

TEST_F(SampleViewRedraw, ALayoutThatKeepsTheSizesRendersNothing)
{
    const int64_t before = Rendered();
    QResizeEvent same(fixture.container->size(), fixture.container->size());
    QCoreApplication::sendEvent(fixture.container.get(), &same);
    fixture.View(0)->Layout(fixture.View(0)->Frame());
    EXPECT_EQ(Rendered(), before);
    ExpectBothAsFullRender();
}

TEST_F(SampleViewRedraw, ALayoutThatChangesTheSizeRendersEverything)
{
    const int64_t before = Rendered();
    fixture.container->resize(fixture.container->width(), 260);
    DeliverPosted();
    EXPECT_GE(Rendered() - before, fixture.View(0)->width() + fixture.View(1)->width());
    ExpectBothAsFullRender();
}

TEST_F(SampleViewRedraw, ARangeDragRendersOnlyTheColumnsItSweeps)
{
    ChannelContainerView& container = *fixture.container;
    container.StartDragging(fixture.View(0), container.FirstFrameAt(100));
    container.Dragging(fixture.View(0), 120);
    ExpectBothAsFullRender();
    for (float x : {130.0f, 150.0f, 140.0f, 90.0f}) {
        const int64_t before = fixture.View(0)->RenderedColumns();
        const int64_t otherBefore = fixture.View(1)->RenderedColumns();
        const float previous = x == 130.0f ? 120.0f : (x == 150.0f ? 130.0f : (x == 140.0f ? 150.0f : 140.0f));
        container.Dragging(fixture.View(0), x);
        // The columns between the old and the new end, and one at each side.
        EXPECT_LE(fixture.View(0)->RenderedColumns() - before, int64_t(std::fabs(x - previous)) + 3) << x;
        EXPECT_EQ(fixture.View(1)->RenderedColumns(), otherBefore) << x;
        SCOPED_TRACE(x);
        ExpectBothAsFullRender();
    }
    container.StopDragging();
}

TEST_F(SampleViewRedraw, ARangeChangeFromTheFieldsRendersOnlyWhatMoved)
{
    ChannelContainerView& container = *fixture.container;
    fixture.manager.ChannelAt(0)->SetSelected(true);
    container.SetRangeStart(3000);
    container.SetRangeEnd(6000);
    container.RangeChanged();
    ExpectBothAsFullRender();
    const int64_t before = Rendered();
    container.SetRangeEnd(6300);
    container.RangeChanged();
    const int64_t rendered = Rendered() - before;
    EXPECT_GE(rendered, 5);
    EXPECT_LE(rendered, 15);
    ExpectBothAsFullRender();
}

TEST_F(SampleViewRedraw, DisplayRangeAndDataChangesRenderEverything)
{
    ChannelContainerView& container = *fixture.container;
    const int64_t width = fixture.View(0)->width();
    int64_t before = fixture.View(0)->RenderedColumns();
    container.SetDisplayRange(10, 5000);
    EXPECT_EQ(fixture.View(0)->RenderedColumns() - before, width);
    ExpectBothAsFullRender();

    // New samples of the same length: the document says the channel changed.
    for (int16_t& sample : samples0)
        sample = int16_t(-sample / 2);
    test::SetSamples(*fixture.manager.ChannelAt(0), samples0);
    before = fixture.View(0)->RenderedColumns();
    fixture.manager.ChannelChanged(fixture.manager.ChannelAt(0));
    EXPECT_EQ(fixture.View(0)->RenderedColumns() - before, width);
    ExpectBothAsFullRender();
}

TEST_F(SampleViewRedraw, TheSameDisplayRangeAgainRendersNothing)
{
    ChannelContainerView& container = *fixture.container;
    const int64_t before = Rendered();
    // As opening a file into the document does when the longest channel
    // keeps its length.
    container.SetDisplayRange(0, 8999);
    EXPECT_EQ(Rendered() - before, 0);
    container.UpdateAll();
    EXPECT_EQ(Rendered() - before, 0);
    ExpectBothAsFullRender();
}

TEST_F(SampleViewRedraw, AChannelChangedRendersOnlyItsOwnView)
{
    const int64_t width = fixture.View(0)->width();
    const int64_t before0 = fixture.View(0)->RenderedColumns();
    const int64_t before1 = fixture.View(1)->RenderedColumns();
    for (int16_t& sample : samples1)
        sample = int16_t(sample / 3);
    SetSamples(*fixture.manager.ChannelAt(1), samples1);
    // Told for every channel at once, as an action over the selection does.
    fixture.container->UpdateAll();
    EXPECT_EQ(fixture.View(0)->RenderedColumns() - before0, 0);
    EXPECT_EQ(fixture.View(1)->RenderedColumns() - before1, width);
    ExpectBothAsFullRender();
}

TEST_F(SampleViewRedraw, MovingAChannelInTimeRendersItAgain)
{
    ExpectBothAsFullRender();
    fixture.manager.ChannelAt(1)->SetStartFrameOffset(300);
    fixture.View(1)->Update(fixture.View(1)->Bounds());
    ExpectBothAsFullRender();
}

}  // namespace
}  // namespace glimmet::test
