#include <gtest/gtest.h>

#include <memory>

#include <cmath>

#include <QFontMetricsF>

#include "ViewFixture.h"
#include "support/MessageCodes.h"

namespace glimmet::test {
namespace {

std::vector<int16_t> Ramp(int64_t count)
{
    std::vector<int16_t> samples(static_cast<size_t>(count), int16_t(0));
    for (int64_t i = 0; i < count; ++i)
        samples[size_t(i)] = int16_t((i * 37) % 65536 - 32768);
    return samples;
}

QImage Grab(QWidget* widget)
{
    DeliverPosted();
    return widget->grab().toImage().convertToFormat(QImage::Format_RGB32);
}

QRgb Pixel(const QImage& image, int x, int y)
{
    return image.pixel(x, y) & 0xffffff;
}

TEST(ChannelContainerView, StartsWithTheWholeDocumentAndNoPlaymark)
{
    ViewFixture fixture(400, 200);
    fixture.manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Ramp(5000))));
    ChannelContainerView container(&fixture.manager, nullptr, &fixture.window);
    EXPECT_EQ(container.objectName(), "sample view");
    EXPECT_EQ(container.FirstDisplayedFrame(), 0);
    EXPECT_EQ(container.LastDisplayedFrame(), 4999);
    EXPECT_EQ(container.CursorFrame(), 0);
    EXPECT_EQ(container.PlaymarkFrame(), -1);
    EXPECT_FALSE(container.IsDragging());
    EXPECT_FALSE(container.IsMoving());
    EXPECT_EQ(container.ContextChannel(), -1);
}

TEST(ChannelContainerView, FirstDisplayedFrameAtMinusOneAndLastAtWidthMinusTwo)
{
    for (int width : {100, 333, 640, 1024}) {
        ViewFixture fixture(width, 200);
        fixture.Add(MakeChannel(Ramp(100000)));
        fixture.Show();
        fixture.container->SetDisplayRange(1234, 81234);
        EXPECT_EQ(fixture.container->PosAt(1234), -1.0f);
        EXPECT_EQ(fixture.container->PosAt(81234), float(width - 1) - 2);
        // The mapping is the container's, over its bounds' width.
        const FrameMapping mapping(float(width - 1), 1234, 81234);
        EXPECT_EQ(fixture.container->FirstFrameAt(17), mapping.FirstFrameAt(17));
        EXPECT_EQ(fixture.container->LastFrameAt(17), mapping.LastFrameAt(17));
        EXPECT_EQ(fixture.container->FrameAt(17), mapping.FrameAt(17));
    }
}

TEST(ChannelContainerView, SetDisplayRangeKeepsAtLeastOneFramePerColumn)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(10000)));
    fixture.Show();
    fixture.container->SetDisplayRange(100, 200);
    // n = trunc(399) - 1 = 398 columns: last = first + n - 1.
    EXPECT_EQ(fixture.container->FirstDisplayedFrame(), 100);
    EXPECT_EQ(fixture.container->LastDisplayedFrame(), 100 + 397);
    fixture.container->SetDisplayRange(100, 5000);
    EXPECT_EQ(fixture.container->LastDisplayedFrame(), 5000);
}

TEST(ChannelContainerView, ViewWiderThanTheFileExtendsPastItsEnd)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(100)));
    fixture.Show();
    // Layout widens to one frame per column and shifts left of frame 0.
    EXPECT_EQ(fixture.container->LastDisplayedFrame(), 99);
    EXPECT_EQ(fixture.container->FirstDisplayedFrame(), 99 - (397 - 1));
    // n is limited to frame count - 1 = 99: last = 50 + 98 reaches past 99.
    fixture.container->SetDisplayRange(50, 60);
    EXPECT_EQ(fixture.container->LastDisplayedFrame(), 148);
}

TEST(ChannelContainerView, SetDisplayRangeTellsTheZoomSlider)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(10000)));
    fixture.Show();
    fixture.window.messages.clear();
    fixture.slider->SetPostMessage(false);
    fixture.container->SetDisplayRange(2000, 4000);
    EXPECT_FALSE(fixture.slider->IsArmed());
    DeliverPosted();
    // The 'dprs' re-armed the slider; its handles stand for other frames, so
    // it asks the window for its own.
    EXPECT_TRUE(fixture.slider->IsArmed() || !fixture.window.With(kMsgSetDisplayRange).empty());
    const auto posted = fixture.window.With(kMsgSetDisplayRange);
    ASSERT_EQ(posted.size(), 1u);
    EXPECT_EQ(fixture.window.Int64(posted[0], "first frame"), fixture.slider->FirstFrame());
    EXPECT_EQ(fixture.window.Int64(posted[0], "last frame"), fixture.slider->LastFrame());
}

TEST(ChannelContainerView, DisplayRangeTheSliderStandsForPostsNothing)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(10000)));
    fixture.Show();
    DeliverPosted();
    fixture.window.messages.clear();
    fixture.container->SetDisplayRange(fixture.slider->FirstFrame(), fixture.slider->LastFrame());
    DeliverPosted();
    EXPECT_TRUE(fixture.slider->IsArmed());
    EXPECT_TRUE(fixture.window.With(kMsgSetDisplayRange).empty());
}

TEST(ChannelContainerView, ZoomRangeWithoutRangeShowsTheStartAtOneFramePerColumn)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(10000)));
    fixture.Show();
    fixture.container->SetDisplayRange(3000, 9000);
    fixture.container->ZoomRange();
    const int64_t d = (399 - 1) / 2;
    EXPECT_EQ(fixture.container->FirstDisplayedFrame(), 0);
    EXPECT_EQ(fixture.container->LastDisplayedFrame(), 2 * d);
}

TEST(ChannelContainerView, ZoomRangeCentresANarrowRange)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(10000)));
    fixture.Show();
    fixture.manager.SetRangeStart(5000);
    fixture.manager.SetRangeEnd(5100);
    fixture.container->ZoomRange();
    const int64_t d = (398 - 100) / 2;
    EXPECT_EQ(fixture.container->FirstDisplayedFrame(), 5000 - d);
    EXPECT_EQ(fixture.container->LastDisplayedFrame(), 5100 + d);
    // The slider follows without notifying.
    const int64_t n = 399 - 2;
    EXPECT_FLOAT_EQ(fixture.slider->Left(), float(5000 - d) / float(10000 - n));
    EXPECT_FLOAT_EQ(fixture.slider->Right(), float(5100 + d - n) / float(10000 - n));
}

TEST(ChannelContainerView, ZoomRangeNearTheEndShiftsLeft)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(10000)));
    fixture.Show();
    fixture.manager.SetRangeStart(9950);
    fixture.manager.SetRangeEnd(9990);
    fixture.container->ZoomRange();
    const int64_t d = (398 - 40) / 2;
    const int64_t last = 9990 + d;
    EXPECT_EQ(fixture.container->LastDisplayedFrame(), 10000);
    EXPECT_EQ(fixture.container->FirstDisplayedFrame(), 9950 - d - (last - 10000));
}

TEST(ChannelContainerView, ZoomRangeOfAWideRangeShowsItExactly)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(10000)));
    fixture.Show();
    fixture.manager.SetRangeStart(1000);
    fixture.manager.SetRangeEnd(8000);
    fixture.container->ZoomRange();
    EXPECT_EQ(fixture.container->FirstDisplayedFrame(), 1000);
    EXPECT_EQ(fixture.container->LastDisplayedFrame(), 8000);
}

TEST(ChannelContainerView, ShowAllKeepsTheFirstFrameAndLetsTheSliderReset)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(10000)));
    fixture.Show();
    fixture.manager.SetRangeStart(5000);
    fixture.manager.SetRangeEnd(5100);
    fixture.container->ZoomRange();
    DeliverPosted();
    fixture.window.messages.clear();
    const int64_t first = fixture.container->FirstDisplayedFrame();
    fixture.slider->SetPostMessage(true);
    fixture.container->ShowAll();
    EXPECT_EQ(fixture.container->FirstDisplayedFrame(), first);
    EXPECT_EQ(fixture.container->LastDisplayedFrame(), 9999);
    EXPECT_EQ(fixture.slider->Left(), 0.0f);
    EXPECT_EQ(fixture.slider->Right(), 1.0f);
    const auto posted = fixture.window.With(kMsgSetDisplayRange);
    ASSERT_EQ(posted.size(), 1u);
    EXPECT_EQ(fixture.window.Int64(posted[0], "first frame"), 0);
    EXPECT_EQ(fixture.window.Int64(posted[0], "last frame"), 9999);
}

TEST(ChannelContainerView, CheckZoomSliderSetsValuesAndMinimumRange)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(10000)));
    fixture.Show();
    EXPECT_EQ(fixture.slider->LowValue(), 0);
    EXPECT_EQ(fixture.slider->HighValue(), 9999);
    EXPECT_EQ(fixture.slider->MinRange(), 398);

    ViewFixture small(400, 200);
    small.Add(MakeChannel(Ramp(50)));
    small.Show();
    EXPECT_EQ(small.slider->MinRange(), 49);
}

TEST(ChannelContainerView, OneFrameFileLeavesTheSliderAlone)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel({123}));
    fixture.Show();
    EXPECT_EQ(fixture.slider->LowValue(), 0);
    EXPECT_EQ(fixture.slider->HighValue(), 0);
    EXPECT_EQ(fixture.slider->MinRange(), 0);
}

TEST(ChannelContainerView, UpdateZoomSliderAtTheEndUsesTheLastFrame)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(10000)));
    fixture.Show();
    fixture.container->SetDisplayRange(6000, 9999);
    fixture.container->UpdateZoomSlider();
    const int64_t n = 399 - 2;
    EXPECT_FLOAT_EQ(fixture.slider->Left(), float(6000) / float(9999 - n));
    EXPECT_EQ(fixture.slider->Right(), 1.0f);
}

TEST(ChannelContainerView, LaysOutChannelsAndSliderFromTheTop)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(1000)));
    fixture.Add(MakeChannel(Ramp(1000)));
    fixture.Show();
    // Height 199: h = (199 - 15 - 2 * 2) / 2 = 90.
    const float h = (199.0f - 15 - 4) / 2;
    const QRect first = fixture.View(0)->geometry();
    EXPECT_EQ(first, QRect(QPoint(1, 1), QPoint(398, int(std::round(h)))));
    const int secondTop = first.bottom() + 3;
    EXPECT_EQ(fixture.View(1)->geometry(), QRect(QPoint(1, secondTop), QPoint(398, secondTop + int(std::round(h)))));
    EXPECT_EQ(fixture.slider->geometry(), QRect(QPoint(0, fixture.View(1)->geometry().bottom() + 2), QPoint(399, 199)));
}

TEST(ChannelContainerView, UnevenHeightsRoundEachView)
{
    ViewFixture fixture(300, 151);
    for (int i = 0; i < 3; ++i)
        fixture.Add(MakeChannel(Ramp(500)));
    fixture.Show();
    const float h = (150.0f - 15 - 6) / 3;  // 43
    float previousBottom = 0;
    for (int i = 0; i < 3; ++i) {
        const float top = i == 0 ? 1 : previousBottom + 3;
        const float bottom = i == 0 ? h : previousBottom + 3 + h;
        const QRect geometry = fixture.View(i)->geometry();
        EXPECT_EQ(geometry.top(), int(std::round(top))) << i;
        EXPECT_EQ(geometry.bottom(), int(std::round(top)) + int(std::round(bottom - top))) << i;
        previousBottom = float(geometry.bottom());
    }
    EXPECT_EQ(fixture.slider->geometry().top(), int(previousBottom) + 2);
    EXPECT_EQ(fixture.slider->height(), 150 - (int(previousBottom) + 2) + 1);
}

TEST(ChannelContainerView, SizeHintsCountEveryChannel)
{
    ViewFixture fixture(400, 200);
    EXPECT_EQ(fixture.container->minimumSizeHint(), QSize(0, 30 + 15));
    fixture.Add(MakeChannel(Ramp(10)));
    fixture.Add(MakeChannel(Ramp(10)));
    EXPECT_EQ(fixture.container->minimumSizeHint(), QSize(0, 30 + 15 + 2 * 17));
    EXPECT_EQ(fixture.container->maximumSize(), QSize(2000, 2000 + 2 * 2002));
}

TEST(ChannelContainerView, DrawsSunkenFramesAndTheFocusFrame)
{
    ViewFixture fixture(200, 150);
    fixture.Add(MakeChannel(Ramp(1000)));
    fixture.Add(MakeChannel(Ramp(1000)));
    fixture.Show();
    const auto check = [&](int focused) {
        const QImage image = Grab(fixture.container.get());
        for (int i = 0; i < 2; ++i) {
            const QRect r = fixture.View(i)->geometry().adjusted(-1, -1, 1, 1);
            const QRgb dark = i == focused ? 0x0000e5u : 0x989898u;
            const QRgb light = i == focused ? 0x0000e5u : 0xffffffu;
            for (int y = r.top(); y <= r.bottom(); ++y) {
                ASSERT_EQ(Pixel(image, r.left(), y), dark) << i << " left " << y;
                if (y > r.top()) {
                    ASSERT_EQ(Pixel(image, r.right(), y), light) << i << " right " << y;
                }
            }
            for (int x = r.left() + 1; x <= r.right(); ++x)
                ASSERT_EQ(Pixel(image, x, r.top()), dark) << i << " top " << x;
            for (int x = r.left() + 1; x < r.right(); ++x)
                ASSERT_EQ(Pixel(image, x, r.bottom()), light) << i << " bottom " << x;
        }
    };
    check(-1);
    EXPECT_EQ(fixture.container->FocusedChannel(), 0);
    fixture.container->activateWindow();
    ASSERT_TRUE(QTest::qWaitForWindowActive(fixture.container.get()));
    fixture.View(1)->setFocus();
    DeliverPosted();
    EXPECT_EQ(fixture.container->FocusedChannel(), 1);
    check(1);
}

TEST(ChannelContainerView, FocusedChannelIsZeroWhenNothingHasFocus)
{
    ViewFixture fixture(200, 150);
    fixture.Add(MakeChannel(Ramp(1000)));
    fixture.Add(MakeChannel(Ramp(1000)));
    EXPECT_EQ(fixture.container->FocusedChannel(), 0);
}

TEST(ChannelContainerView, EmptyStateTextIsCentredAboveTheSlider)
{
    ViewFixture fixture(500, 200);
    fixture.Show();
    const QImage image = Grab(fixture.container.get());
    const int bottom = 199 - 15;
    // Sunken frame around the area above the slider.
    for (int y = 0; y <= bottom; ++y)
        ASSERT_EQ(Pixel(image, 0, y), 0x989898u) << y;
    for (int x = 1; x <= 499; ++x)
        ASSERT_EQ(Pixel(image, x, 0), 0x989898u) << x;
    for (int y = 1; y <= bottom; ++y)
        ASSERT_EQ(Pixel(image, 499, y), 0xffffffu) << y;
    for (int x = 1; x < 499; ++x)
        ASSERT_EQ(Pixel(image, x, bottom), 0xffffffu) << x;

    const QString text = "Drag files with audio tracks into here!";
    const QFontMetricsF metrics(fixture.container->font());
    const qreal left = 499.0 / 2 - metrics.horizontalAdvance(text) / 2;
    const qreal baseline = bottom / 2.0;
    const QRectF box = metrics.boundingRect(text).translated(left, baseline).adjusted(-2, -2, 2, 2);
    int inked = 0;
    for (int y = 1; y < bottom; ++y) {
        for (int x = 1; x < 499; ++x) {
            if (Pixel(image, x, y) == 0xd8d8d8u)
                continue;
            ++inked;
            ASSERT_TRUE(box.contains(x, y)) << "ink at " << x << "," << y;
        }
    }
    EXPECT_GT(inked, 50);
    EXPECT_LT(std::abs(box.center().x() - 249.5), 3.0);
}

TEST(ChannelContainerView, CursorBeyondTheDocumentIsIgnored)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(1000)));
    fixture.container->SetCursorFrame(1001);
    EXPECT_EQ(fixture.container->CursorFrame(), 0);
    fixture.container->SetCursorFrame(1000);
    EXPECT_EQ(fixture.container->CursorFrame(), 1000);
    fixture.container->SetCursorFrame(500);
    EXPECT_EQ(fixture.container->CursorFrame(), 500);
}

TEST(ChannelContainerView, PlaymarkAlwaysAnswersWithPmup)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(1000)));
    fixture.window.messages.clear();
    fixture.container->SetPlaymarkFrame(300);
    EXPECT_EQ(fixture.container->PlaymarkFrame(), 300);
    fixture.container->SetPlaymarkFrame(5000);
    EXPECT_EQ(fixture.container->PlaymarkFrame(), 300);
    ASSERT_EQ(fixture.window.messages.size(), 2u);
    EXPECT_EQ(fixture.window.messages[0].what, kMsgPlaymarkUpdated);
    EXPECT_EQ(fixture.window.messages[1].what, kMsgPlaymarkUpdated);
    EXPECT_TRUE(fixture.window.messages[1].IsEmpty());
}

TEST(ChannelContainerView, PlaymarkToCursorSetsThePlayPosition)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(1000)));
    fixture.container->SetCursorFrame(777);
    fixture.container->SetPlaymarkToCursor();
    EXPECT_EQ(fixture.manager.CurrentFrame(), 777);
}

TEST(ChannelContainerView, SelectAllAndDeselectAll)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(1000)));
    fixture.Add(MakeChannel(Ramp(600), 200));
    fixture.container->SelectAll();
    EXPECT_EQ(fixture.manager.RangeStart(), 0);
    EXPECT_EQ(fixture.manager.RangeEnd(), 999);
    EXPECT_EQ(fixture.container->CursorFrame(), 999);
    EXPECT_TRUE(fixture.manager.ChannelAt(0)->IsSelected());
    EXPECT_TRUE(fixture.manager.ChannelAt(1)->IsSelected());
    fixture.container->DeselectAll();
    EXPECT_EQ(fixture.manager.RangeStart(), -1);
    EXPECT_EQ(fixture.manager.RangeEnd(), -1);
    EXPECT_FALSE(fixture.manager.ChannelAt(0)->IsSelected());
    EXPECT_FALSE(fixture.manager.ChannelAt(1)->IsSelected());
}

TEST(ChannelContainerView, FollowsTheChannelsOfTheDocument)
{
    ViewFixture fixture(400, 200);
    Channel* a = MakeChannel(Ramp(100));
    Channel* b = MakeChannel(Ramp(100));
    Channel* c = MakeChannel(Ramp(100));
    fixture.manager.AddChannel(std::unique_ptr<Channel>(a));
    SampleView* first = fixture.View(0);
    fixture.manager.AddChannel(std::unique_ptr<Channel>(c));
    ASSERT_EQ(fixture.manager.AddChannel(std::unique_ptr<Channel>(b), 1), nullptr);
    ASSERT_EQ(fixture.container->CountChannelViews(), 3);
    EXPECT_EQ(fixture.View(0), first);
    EXPECT_EQ(fixture.View(0)->GetChannel(), a);
    EXPECT_EQ(fixture.View(1)->GetChannel(), b);
    EXPECT_EQ(fixture.View(2)->GetChannel(), c);
    EXPECT_EQ(fixture.View(1)->parentWidget(), fixture.container.get());

    // A channel the document does not hold changes nothing.
    Channel stranger;
    EXPECT_EQ(fixture.manager.RemoveChannel(&stranger), nullptr);
    EXPECT_EQ(fixture.container->CountChannelViews(), 3);
    std::unique_ptr<Channel> removed = fixture.manager.RemoveChannel(a);
    ASSERT_EQ(removed.get(), a);
    EXPECT_EQ(fixture.container->CountChannelViews(), 2);
    EXPECT_EQ(fixture.View(0)->GetChannel(), b);
    EXPECT_FALSE(fixture.manager.RemoveChannelAt(5));
    EXPECT_EQ(fixture.container->CountChannelViews(), 2);
    EXPECT_TRUE(fixture.manager.RemoveChannelAt(1));
    ASSERT_EQ(fixture.container->CountChannelViews(), 1);
    EXPECT_EQ(fixture.View(0)->GetChannel(), b);
    EXPECT_EQ(fixture.View(1), nullptr);
}

TEST(ChannelContainerView, MakesViewsForChannelsItFindsAndRedrawsChangedOnes)
{
    RecordingWindow window;
    ChannelManager manager(&window);
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Ramp(100))));
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Ramp(100))));
    ChannelContainerView container(&manager, new ZoomSlider(&window, 0, 0, 0), &window);
    ASSERT_EQ(container.CountChannelViews(), 2);
    EXPECT_EQ(container.SampleViewAtIndex(1)->GetChannel(), manager.ChannelAt(1));

}

TEST(ChannelContainerView, RedrawsTheChannelTheDocumentSaysChanged)
{
    ViewFixture fixture(200, 100);
    fixture.Add(MakeChannel(Ramp(100)));
    Channel* moved = MakeChannel(Ramp(100));
    fixture.Add(moved);
    fixture.Show();
    // A moved channel's view shows it at its new place once told, and only
    // that view is drawn again.
    moved->SetStartFrameOffset(50);
    const QImage first = fixture.View(0)->Bitmap();
    const QImage before = fixture.View(1)->Bitmap();
    fixture.manager.ChannelChanged(moved);
    EXPECT_NE(fixture.View(1)->Bitmap(), before);
    EXPECT_EQ(fixture.View(0)->Bitmap().cacheKey(), first.cacheKey());
}

TEST(ChannelContainerView, FirstChannelSetsTheLastDisplayedFrame)
{
    ViewFixture fixture(400, 200);
    EXPECT_EQ(fixture.container->LastDisplayedFrame(), -1);
    fixture.Add(MakeChannel(Ramp(5000)));
    EXPECT_EQ(fixture.container->LastDisplayedFrame(), 4999);
}

TEST(ChannelContainerView, ContextMessagesChangeTheContextChannel)
{
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(Ramp(100)));
    fixture.Add(MakeChannel(Ramp(100)));
    Channel* second = fixture.manager.ChannelAt(1);
    // No context channel yet: dropped.
    fixture.container->PostMessage(kMsgToggleMute);
    DeliverPosted();
    EXPECT_FALSE(fixture.manager.ChannelAt(0)->IsMuted());
    EXPECT_FALSE(second->IsMuted());

    fixture.container->Clicked(fixture.View(1), QPointF(5, 5), Qt::RightButton, Qt::NoModifier);
    EXPECT_EQ(fixture.container->ContextChannel(), 1);
    if (QMenu* menu = fixture.container->OpenContextMenu())
        menu->close();
    fixture.container->PostMessage(kMsgToggleMute);
    fixture.container->PostMessage(kMsgPanLeft);
    DeliverPosted();
    EXPECT_TRUE(second->IsMuted());
    EXPECT_EQ(second->PanPosition(), -128);
    fixture.container->PostMessage(kMsgPanRight);
    DeliverPosted();
    EXPECT_EQ(second->PanPosition(), 127);
    fixture.container->PostMessage(kMsgPanMiddle);
    fixture.container->PostMessage(kMsgToggleMute);
    DeliverPosted();
    EXPECT_EQ(second->PanPosition(), 0);
    EXPECT_FALSE(second->IsMuted());
    EXPECT_FALSE(fixture.manager.ChannelAt(0)->IsMuted());
}

TEST(ChannelContainerView, UpdateAllRedrawsAndChecksTheSlider)
{
    ViewFixture fixture(200, 100);
    fixture.Add(MakeChannel(Ramp(1000)));
    fixture.Show();
    Channel* channel = fixture.manager.ChannelAt(0);
    channel->RemoveFrames(0, 499);
    fixture.container->UpdateAll();
    EXPECT_EQ(fixture.slider->HighValue(), 499);
    // Column 0 still shows frames 0.., now only 500 of them hold data.
    const QImage& image = fixture.View(0)->Bitmap();
    EXPECT_EQ(image.pixel(image.width() - 1, 3) & 0xffffff, 0x505050u);
}

}  // namespace
}  // namespace glimmet::test

namespace glimmet::test {
namespace {

/// Applies each 'stdr' to the container later, as the document window does.
class ForwardingWindow : public RecordingWindow {
public:
    status_t PostMessage(const Message& message) override
    {
        RecordingWindow::PostMessage(message);
        int64_t first = 0;
        int64_t last = 0;
        if (message.what == kMsgSetDisplayRange && container != nullptr &&
            message.FindInt64("first frame", &first) == B_OK && message.FindInt64("last frame", &last) == B_OK) {
            ChannelContainerView* target = container;
            QMetaObject::invokeMethod(
                target, [target, first, last] { target->SetDisplayRange(first, last); }, Qt::QueuedConnection);
        }
        return B_OK;
    }
    ChannelContainerView* container = nullptr;
};

TEST(ZoomSliderAndWindow, HandleDragsSetTheDisplayAndSettle)
{
    ForwardingWindow window;
    ChannelManager manager(&window);
    auto* slider = new ZoomSlider(&window, 0, 0, 0);
    ChannelContainerView container(&manager, slider, &window);
    window.container = &container;
    container.resize(500, 150);
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(std::vector<int16_t>(100000, 0))));
    container.show();
    ASSERT_TRUE(QTest::qWaitForWindowExposed(&container));
    DeliverPosted();

    const float track = 499.0f - 42;
    const int leftEdge = int(track * slider->Left() + 17);
    const QPoint grab(leftEdge - 5, 7);
    QTest::mousePress(slider, Qt::LeftButton, Qt::NoModifier, grab);
    for (int dx = 20; dx <= 200; dx += 20) {
        QTest::mouseMove(slider, grab + QPoint(dx, 0));
        DeliverPosted();
        // Every move is followed by the display.
        EXPECT_EQ(container.FirstDisplayedFrame(), slider->FirstFrame()) << dx;
        EXPECT_EQ(container.LastDisplayedFrame(), slider->LastFrame()) << dx;
    }
    QTest::mouseRelease(slider, Qt::LeftButton, Qt::NoModifier, grab + QPoint(200, 0));
    DeliverPosted();
    const size_t posted = window.messages.size();
    DeliverPosted();
    DeliverPosted();
    EXPECT_EQ(window.messages.size(), posted);
    EXPECT_GT(container.FirstDisplayedFrame(), 0);
}

}  // namespace
}  // namespace glimmet::test
