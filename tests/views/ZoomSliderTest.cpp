#include <gtest/gtest.h>

#include <cmath>

#include "ViewFixture.h"
#include "WaveformReference.h"
#include "support/DiagnosticsCapture.h"
#include "support/MessageCodes.h"

namespace glimmet::test {
namespace {

/// A 400 x 15 slider over frames 0 .. 9999 with a minimum range of 100.
class ZoomSliderTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        slider.resize(400, 15);
        slider.show();
        ASSERT_TRUE(QTest::qWaitForWindowExposed(&slider));
    }

    // Geometry from the bounds' width 399, computed here.
    static constexpr float kTrack = 399.0f - 42;
    float L() const { return kTrack * slider.Left() + 17; }
    float R() const { return kTrack * slider.Right() + 25; }

    std::vector<Message> Posted() const { return window.With(kMsgSetDisplayRange); }

    RecordingWindow window;
    ZoomSlider slider{&window, 0, 9999, 100};
};

TEST_F(ZoomSliderTest, StartsWithBothHandlesAtTheEnds)
{
    EXPECT_EQ(slider.objectName(), "zoom slider");
    EXPECT_EQ(slider.Left(), 0.0f);
    EXPECT_EQ(slider.Right(), 1.0f);
    EXPECT_EQ(slider.Mode(), ZoomSlider::kDragNone);
    EXPECT_TRUE(slider.IsArmed());
    EXPECT_EQ(slider.FirstFrame(), 0);
    EXPECT_EQ(slider.LastFrame(), 9999);
    EXPECT_EQ(slider.minimumSizeHint(), QSize(10, 15));
    EXPECT_EQ(slider.Track(), kTrack);
}

// Worked by hand for frames 0 .. 9999 and a minimum range of 100: the
// handles travel over 9999 - 0 - 100 + 1 = 9900 frames, the first frame is
// 0 + trunc(9900 * left) and the last 0 + 100 + trunc(9900 * right) - 1.
TEST_F(ZoomSliderTest, FramesFromFractions)
{
    // 9900 * 0.25 = 2475; 9900 * 0.5 = 4950, 100 + 4950 - 1 = 5049.
    slider.SetLeft(0.25f, false);
    slider.SetRight(0.5f, false);
    EXPECT_EQ(slider.FirstFrame(), 2475);
    EXPECT_EQ(slider.LastFrame(), 5049);
    // Equal handles select exactly the minimum range: 100 + 2475 - 1 = 2574.
    slider.SetRight(0.25f, false);
    EXPECT_EQ(slider.LastFrame(), 2574);
    EXPECT_EQ(slider.LastFrame() - slider.FirstFrame() + 1, 100);
}

TEST_F(ZoomSliderTest, FramesAtTheEnds)
{
    // Both handles at 0: frames 0 .. 0 + 100 + 0 - 1 = 99.
    slider.SetBoth(0.0f, 0.0f);
    EXPECT_EQ(slider.FirstFrame(), 0);
    EXPECT_EQ(slider.LastFrame(), 99);
    // Both at 1: 9900 .. 100 + 9900 - 1 = 9999, the last hundred frames.
    slider.SetBoth(1.0f, 1.0f);
    EXPECT_EQ(slider.FirstFrame(), 9900);
    EXPECT_EQ(slider.LastFrame(), 9999);
    // The whole: 0 .. 9999.
    slider.SetBoth(0.0f, 1.0f);
    EXPECT_EQ(slider.FirstFrame(), 0);
    EXPECT_EQ(slider.LastFrame(), 9999);
}

TEST_F(ZoomSliderTest, FramesAreTruncatedNotRounded)
{
    // 0.3333f is 0.33329999..., 9900 * 0.3333 = 3299.67, truncated to 3299.
    // 0.99999f is 0.99998998..., 9900 * 0.99999 = 9899.90, truncated to
    // 9899, so the last frame is 100 + 9899 - 1 = 9998, one short of the end.
    slider.SetBoth(0.3333f, 0.99999f);
    EXPECT_EQ(slider.FirstFrame(), 3299);
    EXPECT_EQ(slider.LastFrame(), 9998);
}

TEST_F(ZoomSliderTest, FramesCountFromTheLowValue)
{
    // Low 1000: travel 9999 - 1000 - 100 + 1 = 8900; 8900 * 0.5 = 4450, so
    // the first frame is 1000 + 4450 = 5450 and the last 1000 + 100 + 4450
    // - 1 = 5549; at 0 .. 1 the frames are 1000 .. 1000 + 100 + 8900 - 1.
    slider.SetLowValue(1000, false);
    slider.SetBoth(0.5f, 0.5f);
    EXPECT_EQ(slider.FirstFrame(), 5450);
    EXPECT_EQ(slider.LastFrame(), 5549);
    slider.SetBoth(0.0f, 1.0f);
    EXPECT_EQ(slider.FirstFrame(), 1000);
    EXPECT_EQ(slider.LastFrame(), 9999);
}

TEST_F(ZoomSliderTest, NotificationCarriesTheFramesAndDisarms)
{
    slider.SetLeft(0.5f, true);
    const auto posted = Posted();
    ASSERT_EQ(posted.size(), 1u);
    const Message& message = posted[0];
    EXPECT_EQ(window.Int64(message, "first frame"), slider.FirstFrame());
    EXPECT_EQ(window.Int64(message, "last frame"), slider.LastFrame());
    void* source = nullptr;
    ASSERT_EQ(message.FindPointer("source", &source), B_OK);
    EXPECT_EQ(source, &slider);
    int64_t when = 0;
    ASSERT_EQ(message.FindInt64("when", &when), B_OK);
    EXPECT_LE(when, system_time());
    EXPECT_FALSE(slider.IsArmed());
    slider.SetLeft(0.6f, true);
    EXPECT_EQ(Posted().size(), 1u);
    slider.SetPostMessage(true);
    slider.SetLeft(0.7f, true);
    EXPECT_EQ(Posted().size(), 2u);
}

TEST_F(ZoomSliderTest, SettersNotifyOnlyOnChange)
{
    slider.SetLeft(0.0f, true);
    slider.SetRight(1.0f, true);
    slider.SetBoth(0.0f, 1.0f);
    EXPECT_TRUE(Posted().empty());
    slider.SetBoth(0.1f, 1.0f);
    EXPECT_EQ(Posted().size(), 1u);
    slider.SetPostMessage(true);
    slider.SetRight(0.9f, false);
    EXPECT_EQ(Posted().size(), 1u);
    EXPECT_EQ(slider.Right(), 0.9f);
}

TEST_F(ZoomSliderTest, InvalidValuesArePrintedAndKept)
{
    DiagnosticsCapture capture;
    slider.SetLowValue(-1, false);
    slider.SetLowValue(9950, false);
    slider.SetHighValue(50, false);
    slider.SetMinRange(20000);
    const std::string out = capture.Finish();
    EXPECT_EQ(out, "ZoomSlider::SetLowValue() - Error: f=-1, l=9999, r=100\n"
                   "ZoomSlider::SetLowValue() - Error: f=9950, l=9999, r=100\n"
                   "ZoomSlider::SetHighValue() - Error: f=0, l=50, r=100\n"
                   "ZoomSlider::SetMinRange() - Error: f=0, l=9999, r=20000\n");
    EXPECT_EQ(slider.LowValue(), 0);
    EXPECT_EQ(slider.HighValue(), 9999);
    EXPECT_EQ(slider.MinRange(), 100);
    slider.SetLowValue(10, true);
    EXPECT_EQ(slider.LowValue(), 10);
    EXPECT_EQ(Posted().size(), 1u);
}

TEST_F(ZoomSliderTest, LeftHandleDragZooms)
{
    slider.SetBoth(0.2f, 0.8f);
    window.messages.clear();
    slider.SetPostMessage(false);
    const int x = int(L()) - 5;
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(x, 7));
    EXPECT_EQ(slider.Mode(), ZoomSlider::kDragLeft);
    EXPECT_TRUE(slider.IsArmed());
    const float grab = float(x) - L();
    QTest::mouseMove(&slider, QPoint(x + 40, 7));
    EXPECT_FLOAT_EQ(slider.Left(), (float(x + 40) - grab - 17) / kTrack);
    ASSERT_EQ(Posted().size(), 1u);
    EXPECT_EQ(window.Int64(Posted()[0], "first frame"), slider.FirstFrame());
    // Past the right handle the left one stops there.
    QTest::mouseMove(&slider, QPoint(395, 7));
    EXPECT_EQ(slider.Left(), slider.Right());
    EXPECT_EQ(Posted().size(), 1u);  // not re-armed
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(395, 7));
    EXPECT_EQ(slider.Mode(), ZoomSlider::kDragNone);
}

TEST_F(ZoomSliderTest, RightHandleDragZooms)
{
    slider.SetBoth(0.2f, 0.8f);
    const int x = int(R()) + 6;
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(x, 7));
    EXPECT_EQ(slider.Mode(), ZoomSlider::kDragRight);
    const float grab = R() - float(x);
    QTest::mouseMove(&slider, QPoint(x - 50, 7));
    EXPECT_FLOAT_EQ(slider.Right(), (float(x - 50) + grab - 25) / kTrack);
    QTest::mouseMove(&slider, QPoint(399, 7));
    EXPECT_EQ(slider.Right(), 1.0f);
    QTest::mouseMove(&slider, QPoint(0, 7));
    EXPECT_EQ(slider.Right(), slider.Left());
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(0, 7));
}

TEST_F(ZoomSliderTest, BarDragScrollsAndPinsAtTheRightEnd)
{
    slider.SetBoth(0.2f, 0.5f);
    window.messages.clear();
    slider.SetPostMessage(false);
    const int x = int((L() + R()) / 2);
    const float leftEdge = L();
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(x, 7));
    EXPECT_EQ(slider.Mode(), ZoomSlider::kDragBar);
    const float grab = (float(x) - leftEdge) - 7.5f;
    QTest::mouseMove(&slider, QPoint(x + 30, 7));
    const float left = std::max((float(x + 30) - grab - 25) / kTrack, 0.0f);
    EXPECT_FLOAT_EQ(slider.Left(), left);
    EXPECT_FLOAT_EQ(slider.Right(), 0.5f - (0.2f - left));
    ASSERT_EQ(Posted().size(), 1u);
    EXPECT_EQ(window.Int64(Posted()[0], "last frame"), slider.LastFrame());
    const float width = slider.Right() - slider.Left();
    QTest::mouseMove(&slider, QPoint(x + 1000, 7));
    EXPECT_EQ(slider.Right(), 1.0f);
    EXPECT_NEAR(slider.Right() - slider.Left(), width, 1e-5);
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(x + 1000, 7));
}

TEST_F(ZoomSliderTest, PagingLeftByHalfTheBarStartsAutoRepeat)
{
    slider.SetBoth(0.5f, 0.7f);
    slider.SetPostMessage(false);
    window.messages.clear();
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(int(L()) - 30, 7));
    EXPECT_FLOAT_EQ(slider.Left(), 0.4f);
    EXPECT_FLOAT_EQ(slider.Right(), 0.6f);
    EXPECT_EQ(Posted().size(), 1u);
    EXPECT_TRUE(slider.IsAutoRepeating());
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(int(L()) - 30, 7));
    EXPECT_FALSE(slider.IsAutoRepeating());
}

TEST_F(ZoomSliderTest, PagingAtTheStartStopsAtZeroWithoutRepeat)
{
    slider.SetBoth(0.05f, 0.25f);
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(3, 7));
    EXPECT_EQ(slider.Left(), 0.0f);
    EXPECT_FLOAT_EQ(slider.Right(), 0.2f);
    EXPECT_FALSE(slider.IsAutoRepeating());
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(3, 7));
}

TEST_F(ZoomSliderTest, PagingRightCutShortStopsAtOne)
{
    slider.SetBoth(0.6f, 0.9f);
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(396, 7));
    EXPECT_EQ(slider.Right(), 1.0f);
    EXPECT_FLOAT_EQ(slider.Left(), 0.7f);
    EXPECT_FALSE(slider.IsAutoRepeating());
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(396, 7));
}

TEST_F(ZoomSliderTest, EqualHandlesPageByHalfTheMinimumRange)
{
    slider.SetBoth(0.5f, 0.5f);
    const float step = 100.0f / (2.0f * 9999.0f);
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(396, 7));
    EXPECT_FLOAT_EQ(slider.Left(), 0.5f + step);
    EXPECT_FLOAT_EQ(slider.Right(), 0.5f + step);
    EXPECT_TRUE(slider.IsAutoRepeating());
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(396, 7));
}

TEST_F(ZoomSliderTest, HoldingThePageClickRepeatsAfterADelay)
{
    slider.SetBoth(0.6f, 0.65f);
    const QPoint at(20, 7);
    ASSERT_LT(float(at.x()), L() - 15);
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, at);
    EXPECT_FLOAT_EQ(slider.Left(), 0.575f);
    // Nothing more before the first delay of 400 ms.
    QTest::qWait(100);
    EXPECT_FLOAT_EQ(slider.Left(), 0.575f);
    // Then one page every 10 ms while the pointer stays left of the bar.
    for (int i = 0; i < 300 && float(at.x()) < L() - 15 && slider.Left() > 0; ++i)
        QTest::qWait(10);
    // It paged until the bar reached the pointer.
    EXPECT_GE(float(at.x()), L() - 15);
    EXPECT_LT(slider.Left(), 0.1f);
    EXPECT_GT(slider.Left(), 0.0f);
    EXPECT_NEAR(slider.Right() - slider.Left(), 0.05f, 1e-5);
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, at);
    const float stopped = slider.Left();
    QTest::qWait(50);
    EXPECT_EQ(slider.Left(), stopped);
}

TEST_F(ZoomSliderTest, TickPagesTowardsThePointer)
{
    slider.SetBoth(0.3f, 0.4f);
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(396, 7));
    EXPECT_FLOAT_EQ(slider.Left(), 0.35f);
    slider.MessageReceived(Message(kMsgFirstTick));
    EXPECT_TRUE(slider.IsAutoRepeating());
    window.messages.clear();
    slider.SetPostMessage(true);
    slider.MessageReceived(Message(kMsgTick));
    EXPECT_FLOAT_EQ(slider.Left(), 0.4f);
    EXPECT_EQ(Posted().size(), 1u);
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(396, 7));
    // A tick still queued after the release pages no more.
    slider.MessageReceived(Message(kMsgTick));
    EXPECT_FLOAT_EQ(slider.Left(), 0.4f);
}

TEST_F(ZoomSliderTest, DprsRearmsAndPostsOnlyWhenTheDisplayDiffers)
{
    slider.SetBoth(0.25f, 0.5f);
    window.messages.clear();
    Message same(kMsgDisplayRangeChanged);
    same.AddInt64("low value", slider.FirstFrame());
    same.AddInt64("high value", slider.LastFrame());
    slider.MessageReceived(same);
    EXPECT_TRUE(slider.IsArmed());
    EXPECT_TRUE(Posted().empty());

    Message other(kMsgDisplayRangeChanged);
    other.AddInt64("low value", slider.FirstFrame());
    other.AddInt64("high value", slider.LastFrame() + 7);
    slider.MessageReceived(other);
    ASSERT_EQ(Posted().size(), 1u);
    EXPECT_EQ(window.Int64(Posted()[0], "last frame"), slider.LastFrame());

    Message incomplete(kMsgDisplayRangeChanged);
    incomplete.AddInt64("low value", 3);
    slider.MessageReceived(incomplete);
    EXPECT_TRUE(slider.IsArmed());
    EXPECT_EQ(Posted().size(), 1u);
}

// A window that can never show the handles' frames exactly hears of them
// twice more, not for ever; moving a handle starts the count again.
TEST_F(ZoomSliderTest, AWindowThatCannotFollowIsToldTwiceNotForEver)
{
    slider.SetBoth(0.25f, 0.5f);
    window.messages.clear();
    for (int i = 0; i < 10; i++) {
        Message differs(kMsgDisplayRangeChanged);
        differs.AddInt64("low value", slider.FirstFrame() + 1);
        differs.AddInt64("high value", slider.LastFrame());
        slider.MessageReceived(differs);
    }
    EXPECT_EQ(Posted().size(), 2u);
    slider.SetLeft(0.3f, true);
    window.messages.clear();
    Message differs(kMsgDisplayRangeChanged);
    differs.AddInt64("low value", slider.FirstFrame() + 1);
    differs.AddInt64("high value", slider.LastFrame());
    slider.MessageReceived(differs);
    EXPECT_EQ(Posted().size(), 1u);
}

TEST_F(ZoomSliderTest, ClickOnTheBorderOnlyArms)
{
    slider.SetBoth(0.2f, 0.4f);
    slider.SetPostMessage(false);
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(1, 7));
    EXPECT_TRUE(slider.IsArmed());
    EXPECT_EQ(slider.Mode(), ZoomSlider::kDragNone);
    EXPECT_FLOAT_EQ(slider.Left(), 0.2f);
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(1, 7));
}

// The picture, painted here line by line from the drawing rules.
QImage ReferenceSlider(int width, int height, float L, float R, bool leftPressed, bool rightPressed)
{
    QImage image(width, height, QImage::Format_RGB32);
    const auto px = [](float v) { return int(std::floor(v + 0.5f)); };
    const auto line = [&](float x0, float y0, float x1, float y1, int grey, int blue = -1) {
        const QRgb colour = blue < 0 ? qRgb(grey, grey, grey) : qRgb(grey, grey, blue);
        for (int y = std::min(px(y0), px(y1)); y <= std::max(px(y0), px(y1)); ++y)
            for (int x = std::min(px(x0), px(x1)); x <= std::max(px(x0), px(x1)); ++x)
                if (x >= 0 && y >= 0 && x < width && y < height)
                    image.setPixel(x, y, colour);
    };
    const float l = 0, t = 0, r = float(width - 1), b = float(height - 1);
    line(l, t, r, b, 194);
    line(l, b, l, t, 194);
    line(l + 1, t, r, t, 194);
    line(r, t + 1, r, b, 255);
    line(r - 1, b, l + 1, b, 255);
    line(l + 1, b - 1, l + 1, t + 1, 108);
    line(l + 2, t + 1, r - 1, t + 1, 108);
    line(l + 2, b - 2, l + 2, t + 2, 152);
    line(l + 3, t + 2, r - 2, t + 2, 152);
    line(r - 1, t + 2, r - 1, b - 1, 152);
    line(r - 2, b - 1, l + 2, b - 1, 152);
    line(L - 16, b - 2, L - 16, t + 2, 152);
    line(R + 16, t + 2, R + 16, b - 1, 108);
    line(R + 15, b - 1, L - 15, b - 1, 108);
    line(L - 15, b - 3, L - 15, t + 2, 255);
    line(L - 14, t + 2, R + 15, t + 2, 255);
    line(R + 15, t + 3, R + 15, b - 2, 194);
    line(R + 14, b - 2, L - 15, b - 2, 194);
    line(L - 14, t + 3, R + 14, b - 3, 232);
    const int lFirst = leftPressed ? 194 : 255, lLast = leftPressed ? 255 : 194;
    const int rFirst = rightPressed ? 194 : 255, rLast = rightPressed ? 255 : 194;
    line(L - 14, b - 4, L - 14, t + 3, lFirst);
    line(L - 13, t + 3, L - 1, t + 3, lFirst);
    line(L - 1, t + 4, L - 1, b - 3, lLast);
    line(L - 2, b - 3, L - 14, b - 3, lLast);
    line(R + 1, b - 4, R + 1, t + 3, rFirst);
    line(R + 2, t + 3, R + 14, t + 3, rFirst);
    line(R + 14, t + 4, R + 14, b - 3, rLast);
    line(R + 13, b - 3, R + 1, b - 3, rLast);
    return image;
}

TEST_F(ZoomSliderTest, DrawsGrooveBarAndHandles)
{
    for (const auto& fractions : {std::pair{0.0f, 1.0f}, std::pair{0.25f, 0.75f}, std::pair{0.333f, 0.334f}}) {
        slider.SetBoth(fractions.first, fractions.second);
        const QImage expected = ReferenceSlider(400, 15, L(), R(), false, false);
        EXPECT_EQ(FirstDifference(slider.Render(), expected), "") << fractions.first;
        const QImage shown = slider.grab().toImage().convertToFormat(QImage::Format_RGB32);
        EXPECT_EQ(FirstDifference(shown, expected), "") << fractions.first;
    }
}

TEST_F(ZoomSliderTest, DraggedHandlesLookPressed)
{
    slider.SetBoth(0.3f, 0.6f);
    const int x = int((L() + R()) / 2);
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(x, 7));
    EXPECT_EQ(FirstDifference(slider.Render(), ReferenceSlider(400, 15, L(), R(), true, true)), "");
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(x, 7));
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(int(R()) + 8, 7));
    EXPECT_EQ(FirstDifference(slider.Render(), ReferenceSlider(400, 15, L(), R(), false, true)), "");
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(int(R()) + 8, 7));
}

}  // namespace
}  // namespace glimmet::test
