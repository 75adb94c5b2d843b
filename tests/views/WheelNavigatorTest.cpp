#include <gtest/gtest.h>

#include <QApplication>
#include <QTest>
#include <QWheelEvent>

#include <cmath>

#include "ViewFixture.h"
#include "support/MessageCodes.h"
#include "views/FrameMapping.h"
#include "views/WheelNavigator.h"

namespace glimmet::test {
namespace {

constexpr int64_t kFrames = 100000;

std::vector<int16_t> Samples(int64_t count)
{
    std::vector<int16_t> samples(size_t(count), 0);
    for (int64_t i = 0; i < count; ++i)
        samples[size_t(i)] = int16_t(i % 3000);
    return samples;
}

/// Plays the window's part: every 'stdr' the slider posted is applied to the
/// container, whose 'dprs' goes back to the slider, until nothing is left.
void ActAsWindow(ViewFixture& fixture)
{
    for (int round = 0; round < 20; ++round) {
        DeliverPosted();
        const auto posted = fixture.window.With(kMsgSetDisplayRange);
        fixture.window.messages.clear();
        if (posted.empty())
            return;
        for (const Message& message : posted) {
            fixture.container->SetDisplayRange(fixture.window.Int64(message, "first frame"),
                fixture.window.Int64(message, "last frame"));
        }
    }
    ADD_FAILURE() << "the slider and the container never settled";
}

class WheelFixture : public ::testing::Test {
protected:
    WheelFixture()
    {
        fixture.Add(MakeChannel(Samples(kFrames)));
        fixture.Show();
        ActAsWindow(fixture);
    }

    /// Shows the part of the document between the fractions, through the
    /// slider, as a drag would.
    void ShowPart(float left, float right)
    {
        fixture.slider->SetPostMessage(true);
        fixture.slider->SetBoth(left, right);
        ActAsWindow(fixture);
    }

    /// A wheel event over the channels as the container gets it (the sample
    /// views leave wheel events to it), x in container coordinates; then
    /// the window's part.
    void Wheel(QPoint angle, Qt::KeyboardModifiers modifiers = Qt::NoModifier, float x = 150,
        QPoint pixels = QPoint())
    {
        ChannelContainerView* container = fixture.container.get();
        const QPointF at(x, 20);
        QWheelEvent event(at, container->mapToGlobal(at), pixels, angle, Qt::NoButton, modifiers,
            Qt::NoScrollPhase, false);
        QApplication::sendEvent(container, &event);
        EXPECT_TRUE(event.isAccepted());
        ActAsWindow(fixture);
    }

    int64_t First() const { return fixture.container->FirstDisplayedFrame(); }
    int64_t Last() const { return fixture.container->LastDisplayedFrame(); }
    int64_t Span() const { return Last() - First() + 1; }

    void ExpectInStep()
    {
        EXPECT_EQ(fixture.slider->FirstFrame(), First());
        EXPECT_EQ(fixture.slider->LastFrame(), Last());
    }

    ViewFixture fixture{400, 200};
};

TEST_F(WheelFixture, NotchDownScrollsATenthOfTheViewTowardsTheEnd)
{
    ShowPart(0.2f, 0.3f);
    const int64_t first = First();
    const int64_t span = Span();
    ASSERT_GT(span, 1000);
    Wheel(QPoint(0, -120));
    EXPECT_NEAR(double(First() - first), double(span) / 10.0, 1.0);
    EXPECT_EQ(Span(), span);
    ExpectInStep();
}

TEST_F(WheelFixture, NotchUpScrollsBackWhereItCameFrom)
{
    ShowPart(0.4f, 0.5f);
    const int64_t first = First();
    const int64_t last = Last();
    Wheel(QPoint(0, -120));
    ASSERT_NE(First(), first);
    Wheel(QPoint(0, 120));
    EXPECT_NEAR(double(First()), double(first), 1.0);
    EXPECT_NEAR(double(Last()), double(last), 1.0);
    ExpectInStep();
}

TEST_F(WheelFixture, HorizontalWheelScrollsLikeTheVerticalOne)
{
    ShowPart(0.2f, 0.3f);
    const int64_t first = First();
    Wheel(QPoint(-120, 0));
    const int64_t moved = First() - first;
    EXPECT_GT(moved, 0);
    Wheel(QPoint(0, -120));
    EXPECT_NEAR(double(First() - first), 2.0 * double(moved), 2.0);
    ExpectInStep();
}

TEST_F(WheelFixture, TouchpadPixelsMoveTheWaveformAlongWithTheFingers)
{
    ShowPart(0.2f, 0.3f);
    const int64_t first = First();
    const double perColumn = double(Span()) / (fixture.container->Bounds().Width() - 1);
    // Fingers moving left by 30 pixels bring 30 columns' worth of later
    // frames into view.
    Wheel(QPoint(0, 0), Qt::NoModifier, 150, QPoint(-30, 0));
    EXPECT_NEAR(double(First() - first), 30.0 * perColumn, 2.0);
    ExpectInStep();
}

TEST_F(WheelFixture, ScrollingEndsAreTheDocumentsEnds)
{
    ShowPart(0.0f, 0.1f);
    const int64_t span = Span();
    ASSERT_EQ(First(), 0);
    fixture.window.messages.clear();
    Wheel(QPoint(0, 120));
    EXPECT_EQ(First(), 0);
    EXPECT_EQ(Span(), span);
    EXPECT_FLOAT_EQ(fixture.slider->Left(), 0.0f);

    // A notch moves a tenth of the view, a tenth of the document here.
    for (int notch = 0; notch < 110; ++notch)
        Wheel(QPoint(0, -120));
    EXPECT_EQ(Last(), kFrames - 1);
    EXPECT_NEAR(double(Span()), double(span), 1.0);
    EXPECT_FLOAT_EQ(fixture.slider->Right(), 1.0f);
    Wheel(QPoint(0, -120));
    EXPECT_EQ(Last(), kFrames - 1);
    ExpectInStep();
}

TEST_F(WheelFixture, ScrollEndsWhereADragOfTheBarEnds)
{
    ShowPart(0.3f, 0.4f);
    const int64_t first = First();
    const int64_t spanBefore = Span();
    // Drag the bar 40 pixels to the right.
    ZoomSlider& slider = *fixture.slider;
    const int x = int((slider.LeftEdge() + slider.RightEdge()) / 2);
    QTest::mousePress(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(x, 7));
    QTest::mouseMove(&slider, QPoint(x + 40, 7));
    QTest::mouseRelease(&slider, Qt::LeftButton, Qt::NoModifier, QPoint(x + 40, 7));
    ActAsWindow(fixture);
    const int64_t draggedFirst = First();
    const int64_t draggedLast = Last();
    const float draggedLeft = slider.Left();
    ASSERT_GT(draggedFirst, first);

    ShowPart(0.3f, 0.4f);
    ASSERT_EQ(First(), first);
    WheelNavigator(*fixture.container).ScrollBy(draggedFirst - first);
    ActAsWindow(fixture);
    EXPECT_EQ(First(), draggedFirst);
    // The bar drag moves both float fractions by the same amount, which
    // may round the far end a frame either way; the wheel keeps the span.
    EXPECT_NEAR(double(Last()), double(draggedLast), 1.0);
    EXPECT_EQ(Span(), spanBefore);
    EXPECT_NEAR(slider.Left(), draggedLeft, 1e-5);
    ExpectInStep();
}

TEST_F(WheelFixture, CtrlNotchUpZoomsInAroundThePointer)
{
    ShowPart(0.2f, 0.6f);
    for (float x : {40.0f, 200.0f, 333.0f}) {
        const int64_t span = Span();
        const int64_t under = fixture.container->FrameAt(x);
        Wheel(QPoint(0, 120), Qt::ControlModifier, x);
        EXPECT_NEAR(double(Span()), 0.8 * double(span), 2.0);
        // The frame lies in the same column, or the next one at worst.
        const float column = std::floor(fixture.container->PosAt(under) + 1.0f);
        EXPECT_NEAR(column, x, 1.0f) << "x " << x;
        EXPECT_LE(fixture.container->FirstFrameAt(x - 1), under);
        EXPECT_GE(fixture.container->LastFrameAt(x + 1), under);
        ExpectInStep();
    }
}

TEST_F(WheelFixture, CtrlNotchDownZoomsOutAroundThePointer)
{
    ShowPart(0.4f, 0.45f);
    const float x = 260.0f;
    const int64_t span = Span();
    const int64_t under = fixture.container->FrameAt(x);
    Wheel(QPoint(0, -120), Qt::ControlModifier, x);
    EXPECT_NEAR(double(Span()), 1.25 * double(span), 2.0);
    EXPECT_LE(fixture.container->FirstFrameAt(x - 1), under);
    EXPECT_GE(fixture.container->LastFrameAt(x + 1), under);
    ExpectInStep();
}

TEST_F(WheelFixture, ZoomingInStopsAtTheSlidersMinimumRange)
{
    ShowPart(0.5f, 0.6f);
    for (int notch = 0; notch < 60; ++notch)
        Wheel(QPoint(0, 120), Qt::ControlModifier, 100);
    EXPECT_EQ(Span(), fixture.slider->MinRange());
    EXPECT_GT(fixture.slider->MinRange(), 1);
    const int64_t first = First();
    fixture.window.messages.clear();
    Wheel(QPoint(0, 120), Qt::ControlModifier, 100);
    EXPECT_EQ(First(), first);
    EXPECT_EQ(Span(), fixture.slider->MinRange());
    ExpectInStep();
}

TEST_F(WheelFixture, ZoomingOutStopsAtTheWholeDocument)
{
    ShowPart(0.7f, 0.75f);
    for (int notch = 0; notch < 40; ++notch)
        Wheel(QPoint(0, -120), Qt::ControlModifier, 380);
    EXPECT_EQ(First(), 0);
    EXPECT_EQ(Last(), kFrames - 1);
    EXPECT_FLOAT_EQ(fixture.slider->Left(), 0.0f);
    EXPECT_FLOAT_EQ(fixture.slider->Right(), 1.0f);
    ExpectInStep();
}

TEST_F(WheelFixture, ABurstBeforeTheWindowAnswersAddsUp)
{
    ShowPart(0.2f, 0.3f);
    const int64_t first = First();
    const int64_t span = Span();
    WheelNavigator navigator(*fixture.container);
    // Three notches arrive before the window applies the first.
    for (int notch = 0; notch < 3; ++notch)
        navigator.Wheel(QPointF(150, 20), QPoint(0, -120), QPoint(), false);
    ActAsWindow(fixture);
    EXPECT_NEAR(double(First() - first), 0.3 * double(span), 3.0);
    ExpectInStep();
}

TEST(WheelNavigator, FractionsLandOnTheFrameTheSliderComputes)
{
    for (int64_t travel : {int64_t(7), int64_t(99601), int64_t(1000003), int64_t(9999991)}) {
        for (int64_t offset = 0; offset <= travel; offset += 1 + travel / 997) {
            const float fraction = WheelNavigator::FractionFor(offset, travel);
            EXPECT_GE(fraction, 0.0f);
            EXPECT_LE(fraction, 1.0f);
            EXPECT_EQ(TruncateToFrame(float(travel) * fraction), offset) << travel << " " << offset;
        }
    }
}

TEST(WheelNavigator, NoSliderNoMove)
{
    ChannelManager manager(nullptr);
    ChannelContainerView container(&manager, nullptr, nullptr);
    WheelNavigator navigator(container);
    EXPECT_FALSE(navigator.Wheel(QPointF(5, 5), QPoint(0, -120), QPoint(), false));
    EXPECT_FALSE(navigator.Wheel(QPointF(5, 5), QPoint(0, 120), QPoint(), true));
}

}  // namespace
}  // namespace glimmet::test
