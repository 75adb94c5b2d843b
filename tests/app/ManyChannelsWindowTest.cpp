#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include <QEvent>
#include <QObject>
#include <QPaintEvent>
#include <QRegion>

#include "AppTestSupport.h"
#include "sound/ChannelManager.h"
#include "views/ChannelContainerView.h"
#include "views/SampleView.h"

namespace glimmet::test {
namespace {

std::vector<std::vector<int16_t>> Channels(int count, int frames)
{
    std::vector<std::vector<int16_t>> channels(size_t(count), std::vector<int16_t>(size_t(frames), int16_t(0)));
    for (int c = 0; c < count; ++c) {
        for (int f = 0; f < frames; ++f)
            channels[size_t(c)][size_t(f)] = int16_t(((f * (c + 3)) % 400) * 150 - 30000);
    }
    return channels;
}

/// Every view's rendered columns, in whole renders of a view.
double WholeRendersPerView(ChannelContainerView& container)
{
    const int32_t count = container.CountChannelViews();
    int64_t columns = 0;
    int64_t width = 0;
    for (int32_t i = 0; i < count; ++i) {
        columns += container.SampleViewAtIndex(i)->RenderedColumns();
        width = std::max<int64_t>(width, container.SampleViewAtIndex(i)->Bitmap().width());
    }
    return count == 0 || width == 0 ? 0 : double(columns) / double(width) / count;
}

// Appending a file of many channels lays the window out and draws each
// view a few times, however many channels the file and the document have.
TEST(ManyChannelsWindow, AppendingFilesOfManyChannelsDrawsEachViewAFewTimes)
{
    AppFixture fixture;
    const std::filesystem::path file = fixture.Dir() / "many.wav";
    WriteWav(file, Channels(64, 2000));
    QuillexWindow* window = OpenWindow(fixture);
    window->SetAppendOnLoad(true);
    for (int i = 0; i < 2; ++i) {
        window->OpenFile(file);
        Drain();
    }
    ASSERT_EQ(window->Manager()->CountChannels(), 128);
    ChannelContainerView& container = *window->ContainerView();
    EXPECT_LE(WholeRendersPerView(container), 6.0);
    // Every view has its place and its picture at the end.
    for (int32_t i = 0; i < container.CountChannelViews(); ++i) {
        SampleView* view = container.SampleViewAtIndex(i);
        ASSERT_GT(view->height(), 0) << i;
        EXPECT_EQ(view->Bitmap().height(), view->height()) << i;
        if (i > 0) {
            EXPECT_EQ(view->geometry().top(), container.SampleViewAtIndex(i - 1)->geometry().bottom() + 3) << i;
        }
    }
}

int64_t ColumnsRenderedBy(ChannelContainerView& container, int32_t first, int32_t end)
{
    int64_t columns = 0;
    for (int32_t i = first; i < end; ++i)
        columns += container.SampleViewAtIndex(i)->RenderedColumns();
    return columns;
}

// A file appended to a document of the same length changes nothing the
// views already there show: drawing its channels costs pictures of the new
// views only, so a document of n channels is opened in time linear in n.
// Each append makes the window taller; a view laid out before the window
// has grown would get a height it loses again at once.
TEST(ManyChannelsWindow, AppendingAFileDrawsOnlyTheViewsOfItsChannels)
{
    AppFixture fixture;
    const std::filesystem::path file = fixture.Dir() / "many.wav";
    constexpr int kFileChannels = 32;
    WriteWav(file, Channels(kFileChannels, 2000));
    QuillexWindow* window = OpenWindow(fixture);
    window->SetAppendOnLoad(true);
    for (int i = 0; i < 2; ++i) {
        window->OpenFile(file);
        Drain();
    }
    ChannelContainerView& container = *window->ContainerView();
    ASSERT_EQ(container.CountChannelViews(), 2 * kFileChannels);
    const int64_t width = container.SampleViewAtIndex(0)->Bitmap().width();
    ASSERT_GT(width, 100);
    const int32_t heightBefore = container.SampleViewAtIndex(0)->height();
    const int64_t oldBefore = ColumnsRenderedBy(container, 0, 2 * kFileChannels);

    window->OpenFile(file);
    Drain();

    ASSERT_EQ(container.CountChannelViews(), 3 * kFileChannels);
    // The window grew with the document: the views kept their height.
    EXPECT_EQ(container.SampleViewAtIndex(0)->height(), heightBefore);
    EXPECT_EQ(ColumnsRenderedBy(container, 0, 2 * kFileChannels) - oldBefore, 0);
    // A new view is drawn about once: its first, tiny picture, then its
    // picture in place.
    const int64_t added = ColumnsRenderedBy(container, 2 * kFileChannels, 3 * kFileChannels);
    EXPECT_LE(added, kFileChannels * (width + 20));
    EXPECT_GE(added, kFileChannels * width);
}

/// Watches one widget's paint events: how many came and how many
/// rectangles the region of the largest one had.
class PaintWatcher : public QObject {
public:
    explicit PaintWatcher(QWidget* widget) { widget->installEventFilter(this); }

    void Reset()
    {
        paints_ = 0;
        mostRects_ = 0;
    }
    int Paints() const { return paints_; }
    int MostRects() const { return mostRects_; }

protected:
    bool eventFilter(QObject*, QEvent* event) override
    {
        if (event->type() == QEvent::Paint) {
            paints_++;
            mostRects_ = std::max(mostRects_, int(static_cast<QPaintEvent*>(event)->region().rectCount()));
        }
        return false;
    }

private:
    int paints_ = 0;
    int mostRects_ = 0;
};

QuillexWindow* WindowWithChannels(AppFixture& fixture, int files, int channelsPerFile)
{
    const std::filesystem::path file = fixture.Dir() / "many.wav";
    WriteWav(file, Channels(channelsPerFile, 500));
    QuillexWindow* window = OpenWindow(fixture);
    window->SetAppendOnLoad(true);
    for (int i = 0; i < files; ++i) {
        window->OpenFile(file);
        Drain();
    }
    return window;
}

// A window of 64 channels, two files of 32, laid out and drawn.
class SixtyFourChannels : public ::testing::Test {
protected:
    void SetUp() override
    {
        window = WindowWithChannels(fixture, 2, 32);
        ASSERT_EQ(window->ContainerView()->CountChannelViews(), 64);
    }

    ChannelContainerView& Container() { return *window->ContainerView(); }

    AppFixture fixture;
    QuillexWindow* window = nullptr;
};

// The views leave the area beneath them to the container, so that Qt need
// not cut each view out of the region it repaints: cutting them one by one
// costs the square of the channel count. A repaint of the whole container
// is then one rectangle, however many views it holds.
TEST_F(SixtyFourChannels, RepaintingTheWholeContainerKeepsItsRegionOneRectangle)
{
    ChannelContainerView& container = Container();
    PaintWatcher watcher(&container);

    container.update();
    Drain();

    EXPECT_GE(watcher.Paints(), 1);
    EXPECT_EQ(watcher.MostRects(), 1);
}

// Removing a channel moves every view below it. The moves are not gathered
// into a dirty region of two pieces per view: the container is repainted
// whole, in one rectangle, and each view once.
TEST_F(SixtyFourChannels, RemovingAChannelRepaintsTheContainerInOneRectangle)
{
    ChannelContainerView& container = Container();
    PaintWatcher containerWatcher(&container);
    PaintWatcher viewWatcher(container.SampleViewAtIndex(40));

    ASSERT_TRUE(window->Manager()->RemoveChannelAt(0));
    Drain();

    ASSERT_EQ(container.CountChannelViews(), 63);
    EXPECT_GE(containerWatcher.Paints(), 1);
    EXPECT_EQ(containerWatcher.MostRects(), 1);
    EXPECT_EQ(viewWatcher.Paints(), 1);
}

// Selecting all re-renders every view at once; their repaints reach Qt as
// one rectangle, not as a piece per view, and each view is painted once.
TEST_F(SixtyFourChannels, SelectingAllRepaintsTheViewsInOneRectangle)
{
    ChannelContainerView& container = Container();
    PaintWatcher containerWatcher(&container);
    PaintWatcher viewWatcher(container.SampleViewAtIndex(40));

    container.SelectAll();
    Drain();

    EXPECT_GE(containerWatcher.Paints(), 1);
    EXPECT_EQ(containerWatcher.MostRects(), 1);
    EXPECT_EQ(viewWatcher.Paints(), 1);
}

}  // namespace
}  // namespace glimmet::test
