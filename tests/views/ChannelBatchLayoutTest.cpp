#include <gtest/gtest.h>

#include <cmath>
#include <memory>
#include <vector>

#include "ViewFixture.h"

namespace glimmet::test {
namespace {

std::vector<int16_t> Wave(int64_t count, int64_t period)
{
    std::vector<int16_t> samples(size_t(count), int16_t(0));
    for (int64_t i = 0; i < count; ++i)
        samples[size_t(i)] = int16_t(((i % period) * 60000) / period - 30000);
    return samples;
}

/// Columns rendered by every view of the container, in whole renders of a
/// view: one means each view was drawn once across its full width.
double WholeRendersPerView(const ViewFixture& fixture)
{
    const int32_t count = fixture.container->CountChannelViews();
    int64_t columns = 0;
    int64_t width = 0;
    for (int32_t i = 0; i < count; ++i) {
        columns += fixture.View(i)->RenderedColumns();
        width = std::max<int64_t>(width, fixture.View(i)->Bitmap().width());
    }
    return count == 0 || width == 0 ? 0 : double(columns) / double(width) / count;
}

// A file's channels reach the container one by one, all in one go, and
// each of them changes the height of every view. The work per channel must
// not grow with the number of channels: a view is drawn a few times, not
// once for every channel that came after it.
TEST(ChannelBatchLayout, AddingManyChannelsAtOnceDrawsEachViewAFewTimes)
{
    for (int channels : {16, 64}) {
        ViewFixture fixture(200, 2000);
        fixture.Show();
        for (int i = 0; i < channels; ++i)
            fixture.manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Wave(3000, 50 + i))));
        DeliverPosted();
        ASSERT_EQ(fixture.container->CountChannelViews(), channels);
        EXPECT_LE(WholeRendersPerView(fixture), 3.0) << channels << " channels";
    }
}

TEST(ChannelBatchLayout, RemovingManyChannelsAtOnceDrawsTheRemainingViewOnce)
{
    ViewFixture fixture(200, 2000);
    fixture.Show();
    for (int i = 0; i < 48; ++i)
        fixture.manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Wave(3000, 40 + i))));
    DeliverPosted();
    SampleView* last = fixture.View(47);
    const int64_t before = last->RenderedColumns();
    while (fixture.manager.CountChannels() > 1)
        fixture.manager.RemoveChannelAt(0);
    DeliverPosted();
    ASSERT_EQ(fixture.View(0), last);
    const double renders = double(last->RenderedColumns() - before) / last->Bitmap().width();
    EXPECT_GE(renders, 1.0);  // it did grow to the whole height
    EXPECT_LE(renders, 2.0);
}

// However the channels arrived, the views stand where the layout rule puts
// them: stacked from the top, three pixels apart, the zoom slider below.
TEST(ChannelBatchLayout, ViewsAddedTogetherStandWhereTheRulePutsThem)
{
    ViewFixture fixture(300, 700);
    fixture.Show();
    for (int i = 0; i < 9; ++i)
        fixture.manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Wave(500, 30))));
    DeliverPosted();
    const float h = (699.0f - 15 - 18) / 9;
    float previousBottom = 0;
    for (int i = 0; i < 9; ++i) {
        const float top = i == 0 ? 1 : previousBottom + 3;
        const QRect geometry = fixture.View(i)->geometry();
        EXPECT_EQ(geometry.top(), int(std::round(top))) << i;
        EXPECT_EQ(geometry.bottom(), int(std::round(top)) + int(std::round((i == 0 ? h : previousBottom + 3 + h) - top)))
            << i;
        EXPECT_EQ(fixture.View(i)->Bitmap().height(), geometry.height()) << i;
        previousBottom = float(geometry.bottom());
    }
    EXPECT_EQ(fixture.slider->geometry().top(), int(previousBottom) + 2);
}

struct Shown {
    int64_t first;
    int64_t last;
    int64_t low;
    int64_t high;
    float left;
    float right;
    bool operator==(const Shown&) const = default;
};

Shown ShownAfterAdding(const std::vector<int64_t>& lengths, bool deliverBetween)
{
    ViewFixture fixture(400, 300);
    fixture.Show();
    for (int64_t length : lengths) {
        fixture.manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Wave(length, 20))));
        if (deliverBetween)
            DeliverPosted();
    }
    DeliverPosted();
    const ZoomSlider& slider = *fixture.slider;
    return {fixture.container->FirstDisplayedFrame(), fixture.container->LastDisplayedFrame(), slider.LowValue(),
        slider.HighValue(), slider.Left(), slider.Right()};
}

// The display range follows each added channel in turn (a short first
// channel pushes it left of frame 0, and a longer one later keeps it
// there): channels that arrive together leave it where channels that
// arrive one at a time do.
TEST(ChannelBatchLayout, ChannelsAddedTogetherShowWhatChannelsAddedOneByOneShow)
{
    const std::vector<int64_t> lengths{100, 5000, 700, 20000};
    const Shown apart = ShownAfterAdding(lengths, true);
    const Shown together = ShownAfterAdding(lengths, false);
    EXPECT_LT(apart.first, 0);
    EXPECT_EQ(together, apart);
}

}  // namespace
}  // namespace glimmet::test
