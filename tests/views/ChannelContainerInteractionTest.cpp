#include <gtest/gtest.h>

#include <QActionGroup>
#include <QApplication>
#include <QMenu>
#include <QMouseEvent>

#include "ViewFixture.h"
#include "support/MessageCodes.h"
#include "support/MessageEvent.h"

namespace glimmet::test {
namespace {

std::vector<int16_t> Samples(int64_t count)
{
    std::vector<int16_t> samples(static_cast<size_t>(count), int16_t(0));
    for (int64_t i = 0; i < count; ++i)
        samples[size_t(i)] = int16_t((i * 131) % 60000 - 30000);
    return samples;
}

/// Counts the messages of one code that reach a widget.
class MessageCounter : public QObject {
public:
    MessageCounter(QObject* watched, uint32_t what) : what_(what) { watched->installEventFilter(this); }
    int count = 0;

protected:
    bool eventFilter(QObject*, QEvent* event) override
    {
        if (event->type() == MessageEvent::EventType() && static_cast<MessageEvent*>(event)->message().what == what_)
            ++count;
        return false;
    }

private:
    uint32_t what_;
};

/// Two channels of 10000 frames in a 400 x 200 container, on screen.
class Interaction : public ::testing::Test {
protected:
    void SetUp() override
    {
        fixture.Add(MakeChannel(Samples(10000)));
        fixture.Add(MakeChannel(Samples(10000)));
        fixture.Show();
        fixture.container->SetDisplayRange(0, 9999);
        fixture.window.messages.clear();
    }

    void Click(int view, QPoint at, Qt::MouseButton button = Qt::LeftButton,
               Qt::KeyboardModifiers modifiers = Qt::NoModifier)
    {
        ManualClock::Advance(1000000);
        QTest::mouseClick(fixture.View(view), button, modifiers, at);
    }

    ChannelContainerView& Container() { return *fixture.container; }
    Channel* ChannelAt(int index) { return fixture.manager.ChannelAt(index); }
    /// The field of the last message of that code (the channel manager
    /// posts some of its own while a drag runs).
    int64_t Posted(uint32_t what, const char* field)
    {
        const auto found = fixture.window.With(what);
        EXPECT_FALSE(found.empty());
        return found.empty() ? -99 : fixture.window.Int64(found.back(), field);
    }

    ViewFixture fixture{400, 200};
};

TEST_F(Interaction, DragAcrossTwoChannelsSelectsBothAndReportsTheRange)
{
    SampleView* top = fixture.View(0);
    ManualClock::Advance(1000000);
    QTest::mousePress(top, Qt::LeftButton, Qt::NoModifier, QPoint(50, 40));
    const int64_t anchor = Container().FirstFrameAt(50);
    EXPECT_EQ(Container().CursorFrame(), Container().FrameAt(50));
    EXPECT_TRUE(Container().IsDragging());
    // Over the second channel, in the first view's coordinates.
    const QPoint over = fixture.View(1)->geometry().center() - top->pos();
    QTest::mouseMove(top, over);
    QTest::mouseRelease(top, Qt::LeftButton, Qt::NoModifier, over);
    const float containerX = float(over.x() + top->x()) + 1;
    EXPECT_TRUE(ChannelAt(0)->IsSelected());
    EXPECT_TRUE(ChannelAt(1)->IsSelected());
    EXPECT_FALSE(Container().IsDragging());
    EXPECT_EQ(Posted(kMsgRangeStartChanged, "range start"), anchor);
    EXPECT_EQ(Posted(kMsgRangeEndChanged, "range end"), Container().LastFrameAt(containerX));
    EXPECT_EQ(fixture.manager.RangeStart(), anchor);
    EXPECT_EQ(fixture.manager.RangeEnd(), Container().LastFrameAt(containerX));
    // 'rsch' comes first.
    const auto& all = fixture.window.messages;
    ASSERT_GE(all.size(), 2u);
    EXPECT_EQ(all[all.size() - 2].what, kMsgRangeStartChanged);
    EXPECT_EQ(all.back().what, kMsgRangeEndChanged);
}

TEST_F(Interaction, DragLeftPastTheStartClampsToZero)
{
    SampleView* top = fixture.View(0);
    ManualClock::Advance(1000000);
    QTest::mousePress(top, Qt::LeftButton, Qt::NoModifier, QPoint(100, 40));
    const int64_t anchor = Container().FirstFrameAt(100);
    QTest::mouseMove(top, QPoint(-60, 40));
    QTest::mouseRelease(top, Qt::LeftButton, Qt::NoModifier, QPoint(-60, 40));
    EXPECT_EQ(Posted(kMsgRangeStartChanged, "range start"), 0);
    EXPECT_EQ(Posted(kMsgRangeEndChanged, "range end"), anchor);
    EXPECT_TRUE(ChannelAt(0)->IsSelected());
    EXPECT_FALSE(ChannelAt(1)->IsSelected());
}

TEST_F(Interaction, DragRightPastTheEndClampsToTheFrameCount)
{
    SampleView* top = fixture.View(0);
    ManualClock::Advance(1000000);
    QTest::mousePress(top, Qt::LeftButton, Qt::NoModifier, QPoint(300, 40));
    QTest::mouseMove(top, QPoint(520, 40));
    QTest::mouseRelease(top, Qt::LeftButton, Qt::NoModifier, QPoint(520, 40));
    // The container asks for frame 10000 itself; the manager keeps 9999
    // and says so, then the drag's end reports it.
    const auto ends = fixture.window.With(kMsgRangeEndChanged);
    ASSERT_EQ(ends.size(), 3u);
    EXPECT_EQ(fixture.window.Int64(ends[1], "range end"), 9999);
    EXPECT_EQ(fixture.window.Int64(ends[2], "range end"), 9999);
    EXPECT_EQ(fixture.manager.RangeEnd(), 9999);
}

TEST_F(Interaction, DragBelowTheLastChannelKeepsExtendingIntoTheSliderArea)
{
    SampleView* top = fixture.View(0);
    ManualClock::Advance(1000000);
    QTest::mousePress(top, Qt::LeftButton, Qt::NoModifier, QPoint(80, 20));
    const QPoint inSlider = fixture.slider->geometry().center() - top->pos();
    QTest::mouseMove(top, inSlider);
    QTest::mouseRelease(top, Qt::LeftButton, Qt::NoModifier, inSlider);
    EXPECT_TRUE(ChannelAt(0)->IsSelected());
    EXPECT_TRUE(ChannelAt(1)->IsSelected());
}

TEST_F(Interaction, DragAboveTheFirstChannelKeepsExtending)
{
    SampleView* bottom = fixture.View(1);
    ManualClock::Advance(1000000);
    QTest::mousePress(bottom, Qt::LeftButton, Qt::NoModifier, QPoint(300, 20));
    const QPoint above(100, -bottom->y() - 10);
    QTest::mouseMove(bottom, above);
    QTest::mouseRelease(bottom, Qt::LeftButton, Qt::NoModifier, above);
    EXPECT_TRUE(ChannelAt(0)->IsSelected());
    EXPECT_TRUE(ChannelAt(1)->IsSelected());
    EXPECT_EQ(fixture.manager.RangeStart(), Container().FirstFrameAt(float(above.x() + bottom->x() + 1)));
}

TEST_F(Interaction, DragBackToOneChannelDeselectsTheOther)
{
    SampleView* top = fixture.View(0);
    ManualClock::Advance(1000000);
    QTest::mousePress(top, Qt::LeftButton, Qt::NoModifier, QPoint(50, 40));
    QTest::mouseMove(top, fixture.View(1)->geometry().center() - top->pos());
    EXPECT_TRUE(ChannelAt(1)->IsSelected());
    QTest::mouseMove(top, QPoint(150, 40));
    QTest::mouseRelease(top, Qt::LeftButton, Qt::NoModifier, QPoint(150, 40));
    EXPECT_TRUE(ChannelAt(0)->IsSelected());
    EXPECT_FALSE(ChannelAt(1)->IsSelected());
}

TEST_F(Interaction, GapBetweenViewsBelongsToTheNearestView)
{
    Container().StartDragging(fixture.View(0), 100);
    const int gapY = fixture.View(0)->geometry().bottom() + 2;
    ASSERT_EQ(Container().SampleViewAt(QPointF(200, gapY)), nullptr);
    Container().MouseMoved(QPointF(200, gapY));
    EXPECT_TRUE(ChannelAt(0)->IsSelected());
    EXPECT_TRUE(ChannelAt(1)->IsSelected());
}

TEST_F(Interaction, PlainClickPlacesTheCursorAndReportsTheUnchangedRange)
{
    Click(0, QPoint(120, 30));
    EXPECT_EQ(Container().CursorFrame(), Container().FrameAt(120));
    EXPECT_EQ(Posted(kMsgRangeStartChanged, "range start"), -1);
    EXPECT_EQ(Posted(kMsgRangeEndChanged, "range end"), -1);
}

TEST_F(Interaction, ShiftClickWithoutRangeAnchorsAtTheCursor)
{
    Container().SetCursorFrame(3000);
    const float x = Container().PosAt(6000);
    Click(0, QPoint(int(x), 30), Qt::LeftButton, Qt::ShiftModifier);
    EXPECT_EQ(fixture.manager.RangeStart(), 3000);
    EXPECT_EQ(fixture.manager.RangeEnd(), Container().LastFrameAt(float(int(x))));
    EXPECT_EQ(Container().CursorFrame(), 3000);
    EXPECT_EQ(Posted(kMsgRangeStartChanged, "range start"), 3000);
}

TEST_F(Interaction, ShiftClickRightOfTheMiddleMovesTheEnd)
{
    fixture.manager.SetRangeStart(2000);
    fixture.manager.SetRangeEnd(4000);
    ChannelAt(0)->SetSelected(true);
    const int x = int(Container().PosAt(7000));
    Click(0, QPoint(x, 30), Qt::LeftButton, Qt::ShiftModifier);
    EXPECT_EQ(fixture.manager.RangeStart(), 2000);
    EXPECT_EQ(fixture.manager.RangeEnd(), Container().LastFrameAt(float(x)));
    EXPECT_EQ(Container().CursorFrame(), 2000);
}

TEST_F(Interaction, ShiftClickLeftOfTheMiddleMovesTheStart)
{
    fixture.manager.SetRangeStart(5000);
    fixture.manager.SetRangeEnd(8000);
    ChannelAt(1)->SetSelected(true);
    const int x = int(Container().PosAt(1000));
    Click(1, QPoint(x, 30), Qt::LeftButton, Qt::ShiftModifier);
    EXPECT_EQ(fixture.manager.RangeStart(), Container().FirstFrameAt(float(x)));
    EXPECT_EQ(fixture.manager.RangeEnd(), 8000);
    EXPECT_EQ(Container().CursorFrame(), 8000);
    EXPECT_TRUE(ChannelAt(1)->IsSelected());
}

TEST_F(Interaction, DoubleClickSelectsAMovedChannelsOwnExtent)
{
    ChannelAt(1)->RemoveFrames(7000, 9999);  // 7000 frames left
    ChannelAt(1)->SetStartFrameOffset(2500);
    ChannelAt(0)->SetSelected(true);
    fixture.manager.SetRangeStart(100);
    fixture.manager.SetRangeEnd(200);
    SampleView* view = fixture.View(1);
    ManualClock::Advance(1000000);
    QTest::mouseClick(view, Qt::LeftButton, Qt::NoModifier, QPoint(200, 30));
    ManualClock::Advance(100000);
    QTest::mouseClick(view, Qt::LeftButton, Qt::NoModifier, QPoint(200, 30));
    EXPECT_EQ(fixture.manager.RangeStart(), 2500);
    EXPECT_EQ(fixture.manager.RangeEnd(), 2500 + 7000 - 1);
    EXPECT_EQ(Container().CursorFrame(), 2500);
    EXPECT_TRUE(ChannelAt(1)->IsSelected());
    EXPECT_FALSE(ChannelAt(0)->IsSelected());
}

// What an X server gives a widget for a double click: press, release, then
// the second press only as a double-click event, then its release.
void SendLikeX11(QWidget* view, QEvent::Type type, QPoint point)
{
    const Qt::MouseButtons held = type == QEvent::MouseButtonRelease ? Qt::NoButton : Qt::LeftButton;
    QMouseEvent event(type, QPointF(point), view->mapToGlobal(QPointF(point)), Qt::LeftButton, held, Qt::NoModifier);
    QApplication::sendEvent(view, &event);
}

TEST_F(Interaction, SecondPressArrivingOnlyAsADoubleClickEventSelectsTheChannel)
{
    SampleView* view = fixture.View(1);
    ManualClock::Advance(1000000);
    SendLikeX11(view, QEvent::MouseButtonPress, QPoint(200, 30));
    SendLikeX11(view, QEvent::MouseButtonRelease, QPoint(200, 30));
    ManualClock::Advance(120000);
    SendLikeX11(view, QEvent::MouseButtonDblClick, QPoint(200, 30));
    SendLikeX11(view, QEvent::MouseButtonRelease, QPoint(200, 30));
    EXPECT_EQ(fixture.manager.RangeStart(), 0);
    EXPECT_EQ(fixture.manager.RangeEnd(), ChannelAt(1)->FrameCount() - 1);
    EXPECT_TRUE(ChannelAt(1)->IsSelected());
}

TEST_F(Interaction, ADoubleClickEventAfterItsOwnPressIsNotASecondClick)
{
    // Some platforms send the press and then the double-click event for the
    // same button press; that press counts once.
    SampleView* view = fixture.View(1);
    ManualClock::Advance(1000000);
    SendLikeX11(view, QEvent::MouseButtonPress, QPoint(200, 30));
    ManualClock::Advance(1000);
    SendLikeX11(view, QEvent::MouseButtonDblClick, QPoint(200, 30));
    SendLikeX11(view, QEvent::MouseButtonRelease, QPoint(200, 30));
    EXPECT_EQ(fixture.manager.RangeStart(), -1);
    EXPECT_FALSE(ChannelAt(1)->IsSelected());
    EXPECT_EQ(Container().CursorFrame(), Container().FrameAt(200));
}

TEST_F(Interaction, ClicksFurtherApartThanTheDoubleClickIntervalAreSingle)
{
    SampleView* view = fixture.View(1);
    ManualClock::Advance(1000000);
    QTest::mouseClick(view, Qt::LeftButton, Qt::NoModifier, QPoint(200, 30));
    ManualClock::Advance(int64_t(QApplication::doubleClickInterval()) * 1000);
    QTest::mouseClick(view, Qt::LeftButton, Qt::NoModifier, QPoint(200, 30));
    EXPECT_EQ(fixture.manager.RangeStart(), -1);
    EXPECT_EQ(fixture.window.With(kMsgRangeStartChanged).size(), 2u);
}

TEST_F(Interaction, ContextMenuItemsMuteAndPan)
{
    Channel* channel = ChannelAt(1);
    Click(1, QPoint(100, 20), Qt::RightButton);
    QMenu* menu = Container().OpenContextMenu();
    ASSERT_NE(menu, nullptr);
    EXPECT_EQ(menu->objectName(), "channel menu");
    const QList<QAction*> items = menu->actions();
    ASSERT_EQ(items.size(), 7);
    EXPECT_EQ(items[0]->text(), "Mute");
    EXPECT_TRUE(items[1]->isSeparator());
    EXPECT_EQ(items[2]->text(), "Left");
    EXPECT_EQ(items[3]->text(), "Middle");
    EXPECT_EQ(items[4]->text(), "Right");
    EXPECT_TRUE(items[5]->isSeparator());
    EXPECT_EQ(items[6]->text(), "Remove");
    EXPECT_FALSE(items[0]->isChecked());
    EXPECT_TRUE(items[3]->isChecked());
    EXPECT_FALSE(items[2]->isChecked());
    items[0]->trigger();
    items[2]->trigger();
    menu->close();
    DeliverPosted();
    EXPECT_TRUE(channel->IsMuted());
    EXPECT_EQ(channel->PanPosition(), -128);
    EXPECT_FALSE(ChannelAt(0)->IsMuted());
    EXPECT_EQ(Container().OpenContextMenu(), nullptr);  // deleted on close

    Click(1, QPoint(100, 20), Qt::RightButton);
    menu = Container().OpenContextMenu();
    ASSERT_NE(menu, nullptr);
    EXPECT_TRUE(menu->actions()[0]->isChecked());
    EXPECT_TRUE(menu->actions()[2]->isChecked());
    EXPECT_FALSE(menu->actions()[3]->isChecked());
    menu->actions()[4]->trigger();
    menu->actions()[6]->trigger();
    menu->close();
    DeliverPosted();
    EXPECT_EQ(channel->PanPosition(), 127);
    EXPECT_EQ(fixture.window.With(kMsgRemoveChannel).size(), 1u);
    EXPECT_TRUE(fixture.window.With(kMsgRemoveChannel)[0].IsEmpty());
}

TEST_F(Interaction, ThePanItemsAreOneExclusiveChoice)
{
    Click(1, QPoint(100, 20), Qt::RightButton);
    QMenu* menu = Container().OpenContextMenu();
    ASSERT_NE(menu, nullptr);
    const QList<QAction*> items = menu->actions();
    QActionGroup* group = items[2]->actionGroup();
    ASSERT_NE(group, nullptr);
    EXPECT_TRUE(group->isExclusive());
    EXPECT_EQ(items[3]->actionGroup(), group);
    EXPECT_EQ(items[4]->actionGroup(), group);
    EXPECT_EQ(items[0]->actionGroup(), nullptr);
    EXPECT_EQ(items[6]->actionGroup(), nullptr);
    items[4]->trigger();  // a marked Middle gives way to Right
    EXPECT_EQ(group->checkedAction(), items[4]);
    EXPECT_FALSE(items[3]->isChecked());
    menu->close();
}

TEST_F(Interaction, MiddleButtonMovesTheChannelAndReportsTheMove)
{
    SampleView* view = fixture.View(1);
    ManualClock::Advance(1000000);
    QTest::mousePress(view, Qt::MiddleButton, Qt::NoModifier, QPoint(100, 20));
    EXPECT_TRUE(Container().IsMoving());
    const int64_t grab = Container().FirstFrameAt(100);
    QTest::mouseMove(view, QPoint(160, 25));
    const int64_t expected = Container().FirstFrameAt(float(160 + view->x())) - grab;
    EXPECT_EQ(ChannelAt(1)->FirstFrame(), expected);
    QTest::mouseRelease(view, Qt::MiddleButton, Qt::NoModifier, QPoint(160, 25));
    EXPECT_FALSE(Container().IsMoving());
    const auto moved = fixture.window.With(kMsgSampleMoved);
    ASSERT_EQ(moved.size(), 1u);
    Channel* channel = nullptr;
    SampleView* sampleView = nullptr;
    ASSERT_EQ(moved[0].FindPointer("channel", &channel), B_OK);
    ASSERT_EQ(moved[0].FindPointer("sample view", &sampleView), B_OK);
    EXPECT_EQ(channel, ChannelAt(1));
    EXPECT_EQ(sampleView, view);
    EXPECT_EQ(fixture.window.Int64(moved[0], "offset"), 0 - expected);
    EXPECT_EQ(fixture.slider->HighValue(), fixture.manager.FrameCount() - 1);
}

TEST_F(Interaction, CtrlWithThePrimaryButtonMovesToo)
{
    SampleView* view = fixture.View(0);
    ManualClock::Advance(1000000);
    QTest::mousePress(view, Qt::LeftButton, Qt::ControlModifier, QPoint(50, 20));
    EXPECT_TRUE(Container().IsMoving());
    EXPECT_FALSE(Container().IsDragging());
    QTest::mouseMove(view, QPoint(90, 20));
    QTest::mouseRelease(view, Qt::LeftButton, Qt::ControlModifier, QPoint(90, 20));
    EXPECT_GT(ChannelAt(0)->FirstFrame(), 0);
    EXPECT_EQ(fixture.window.With(kMsgSampleMoved).size(), 1u);
    EXPECT_TRUE(fixture.window.With(kMsgRangeStartChanged).empty());
}

TEST_F(Interaction, MovingPostsOneRedrawRequestUntilTheViewHasDrawn)
{
    SampleView* view = fixture.View(1);
    MessageCounter redraws(view, kMsgMovingSample);
    DeliverPosted();
    Container().StartMoving(view, 1000);
    Container().Moving(150);
    Container().Moving(160);
    Container().Moving(170);
    DeliverPosted();
    EXPECT_EQ(redraws.count, 1);
    // The view drew (and said so with a bare 'smmd'): the next move may ask.
    view->repaint();
    DeliverPosted();
    Container().Moving(180);
    Container().Moving(190);
    DeliverPosted();
    EXPECT_EQ(redraws.count, 2);
    Container().StopMoving();
    EXPECT_EQ(ChannelAt(1)->FirstFrame(), Container().FirstFrameAt(190) - 1000);
}

TEST_F(Interaction, MovingAViewWithoutChannelStopsAtOnce)
{
    Container().StartMoving(nullptr, 500);
    EXPECT_FALSE(Container().IsMoving());
    EXPECT_TRUE(fixture.window.With(kMsgSampleMoved).empty());
}

TEST_F(Interaction, MovedChannelIsRedrawnWhereItNowLies)
{
    SampleView* view = fixture.View(1);
    Container().StartMoving(view, 0);
    Container().Moving(Container().PosAt(5000) + 1);
    DeliverPosted();
    Container().StopMoving();
    // Columns before the channel's new first frame are empty (grey).
    EXPECT_EQ(view->Bitmap().pixel(10, 5) & 0xffffff, 0x505050u);
}

}  // namespace
}  // namespace glimmet::test

namespace glimmet::test {
namespace {

TEST_F(Interaction, SecondaryDoubleClickOpensTheMenuAndTertiaryDoesNothing)
{
    Container().DoubleClicked(fixture.View(1), QPointF(30, 10), Qt::RightButton, Qt::NoModifier);
    EXPECT_EQ(Container().ContextChannel(), 1);
    ASSERT_NE(Container().OpenContextMenu(), nullptr);
    Container().OpenContextMenu()->close();
    DeliverPosted();
    Container().DoubleClicked(fixture.View(0), QPointF(30, 10), Qt::MiddleButton, Qt::NoModifier);
    EXPECT_FALSE(Container().IsMoving());
    EXPECT_EQ(fixture.manager.RangeStart(), -1);
    EXPECT_EQ(Container().ContextChannel(), 1);
}

TEST(ShortDocument, ViewAsWideAsTheDocumentStaysDefined)
{
    // 397 frames in a container 400 wide: the slider's divisor
    // (frame count - (width - 2)) is 0.
    ViewFixture fixture(400, 200);
    fixture.Add(MakeChannel(std::vector<int16_t>(397, 100)));
    fixture.Show();
    fixture.container->UpdateZoomSlider();
    EXPECT_FALSE(fixture.slider->Render().isNull());
    fixture.container->ZoomRange();
    fixture.container->SelectAll();
    EXPECT_EQ(fixture.manager.RangeEnd(), 396);
}

}  // namespace
}  // namespace glimmet::test
