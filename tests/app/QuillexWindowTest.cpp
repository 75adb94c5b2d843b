#include <gtest/gtest.h>

#include <QAction>
#include <QCheckBox>
#include <QComboBox>
#include <QDropEvent>
#include <QFileDialog>
#include <QLineEdit>
#include <QMessageBox>
#include <QLabel>
#include <QMimeData>
#include <QPushButton>
#include <QTest>
#include <QTimer>
#include <QUrl>

#include <algorithm>

#include "AppTestSupport.h"
#include "app/MenuTable.h"
#include "app/TextControl.h"
#include "edit/Action.h"
#include "edit/HistoryManager.h"
#include "playback/PlaybackController.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/DiagnosticsCapture.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"
#include "views/ChannelContainerView.h"
#include "sound/ChannelSamples.h"

namespace glimmet::test {
namespace {

void DropFiles(QuillexWindow* window, const std::vector<std::filesystem::path>& files, Qt::KeyboardModifiers modifiers)
{
    QMimeData data;
    QList<QUrl> urls;
    for (const std::filesystem::path& file : files)
        urls << QUrl::fromLocalFile(QString::fromStdString(file.string()));
    data.setUrls(urls);
    const QPointF where(window->width() / 2.0, window->height() / 2.0);
    QDragEnterEvent enter(where.toPoint(), Qt::CopyAction, &data, Qt::LeftButton, modifiers);
    QCoreApplication::sendEvent(window, &enter);
    ASSERT_TRUE(enter.isAccepted());
    QDropEvent drop(where, Qt::CopyAction, &data, Qt::LeftButton, modifiers);
    QCoreApplication::sendEvent(window, &drop);
    Drain();
}

TEST(QuillexWindow, IsBuiltWithTitleSizeAndControls)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    EXPECT_EQ(window->windowTitle(), "Glimmet");
    EXPECT_EQ(window->geometry().size(), QSize(701, 301));
    EXPECT_TRUE(window->isVisible());
    ASSERT_NE(window->ContainerView(), nullptr);
    EXPECT_NE(window->GetZoomSlider(), nullptr);
    EXPECT_NE(window->findChild<QWidget*>("Background"), nullptr);

    QComboBox* popup = window->PlayModePopup();
    ASSERT_EQ(popup->count(), 3);
    EXPECT_EQ(popup->itemText(0), "All");
    EXPECT_EQ(popup->itemText(1), "Range");
    EXPECT_EQ(popup->itemText(2), "Visible");
    EXPECT_EQ(popup->currentIndex(), 0);
    EXPECT_EQ(window->LoopBox()->text(), "Loop");
    EXPECT_TRUE(window->LoopBox()->isChecked());
    EXPECT_EQ(window->RangeStartField()->Label()->text(), "Range Start:");
    EXPECT_EQ(window->RangeEndField()->Label()->text(), "Range End:");
    EXPECT_EQ(window->RangeStartField()->Text(), "-1");
    EXPECT_EQ(window->RangeEndField()->Text(), "-1");
    EXPECT_FALSE(window->IsPlaying());
    EXPECT_EQ(window->PlayModeButtonMode(), 1);
}

TEST(QuillexWindow, ControlRowRunsLeftToRightWithTheFreeWidthBeforeTheRangeFields)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    window->resize(900, 400);
    Drain();
    const auto left = [window](QWidget* widget) { return widget->mapTo(window, QPoint(0, 0)).x(); };
    const auto right = [&](QWidget* widget) { return left(widget) + widget->width(); };
    EXPECT_LT(right(window->PlayModePopup()), left(window->LoopBox()) + 1);
    EXPECT_GT(left(window->RangeStartField()) - right(window->LoopBox()), 100);
    EXPECT_EQ(left(window->RangeEndField()) - right(window->RangeStartField()), 15);
    // The channel strips sit 5 pixels under the control row.
    EXPECT_EQ(window->ContainerView()->mapTo(window, QPoint(0, 0)).y()
            - (window->LoopBox()->parentWidget()->mapTo(window, QPoint(0, 0)).y()
                + window->LoopBox()->parentWidget()->height()),
        5);
}

TEST(QuillexWindow, TheWindowsOwnViewsStandOnTheViewsGrey)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    window->resize(900, 400);
    Drain();
    const QImage shot = window->grab().toImage();
    const QColor grey(216, 216, 216);
    // The free width of the control row, between the loop box and the fields.
    const QPoint row = window->LoopBox()->mapTo(window, QPoint(window->LoopBox()->width() + 20, 2));
    EXPECT_EQ(shot.pixelColor(row), grey);
    // The margin between the control row and the channel strips.
    const QPoint gap = window->ContainerView()->mapTo(window, QPoint(40, -3));
    EXPECT_EQ(shot.pixelColor(gap), grey);
    // The border around the container, left of its sunken frame.
    const QPoint border = window->ContainerView()->mapTo(window, QPoint(-3, 40));
    EXPECT_EQ(shot.pixelColor(border), grey);
}

TEST(QuillexWindow, ANumberWiderThanItsFieldShowsItsLeadingDigits)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    window->resize(window->minimumSizeHint());
    Drain();
    Message start(kMsgRangeStartChanged);
    start.AddInt64(kFieldRangeStart, 1234567890123);
    window->PostMessage(start);
    Drain();
    QLineEdit* field = window->RangeStartField()->Field();
    ASSERT_EQ(field->text(), "1234567890123");
    EXPECT_EQ(field->cursorPosition(), 0);
}

TEST(QuillexWindow, RangeFieldsAcceptOnlyDigitsAndMinus)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    QLineEdit* field = window->RangeStartField()->Field();
    field->clear();
    QTest::keyClicks(field, "12a");
    EXPECT_EQ(field->text(), "12");
    field->clear();
    QTest::keyClicks(field, "-3 x.4+5");
    EXPECT_EQ(field->text(), "-345");
    QLineEdit* end = window->RangeEndField()->Field();
    end->clear();
    QTest::keyClicks(end, "7e9");
    EXPECT_EQ(end->text(), "79");
}

TEST(QuillexWindow, ZoomRangeItemIsDisabledOnlyWhenBothFieldsReadMinusOne)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("zoom.wav", 1, 100));
    QAction* zoomRange = window->MenuItem(KeptMenuItem::ZoomRange);
    EXPECT_TRUE(zoomRange->isEnabled());  // nothing is disabled when built

    Message start(kMsgRangeStartChanged);
    start.AddInt64("range start", -1);
    Message end(kMsgRangeEndChanged);
    end.AddInt64("range end", -1);
    window->PostMessage(start);
    window->PostMessage(end);
    Drain();
    EXPECT_FALSE(zoomRange->isEnabled());

    QLineEdit* field = window->RangeStartField()->Field();
    field->selectAll();
    QTest::keyClicks(field, "0");
    ASSERT_EQ(field->text(), "0");
    ASSERT_TRUE(field->isModified());
    QTest::keyClick(field, Qt::Key_Return);
    Drain();
    EXPECT_TRUE(zoomRange->isEnabled());
    EXPECT_EQ(window->Manager()->RangeStart(), 0);

    // The document moved the end along with the start.
    EXPECT_EQ(window->RangeEndField()->Text(), "0");

    const auto type = [](TextControl* control, const char* text) {
        control->Field()->selectAll();
        QTest::keyClicks(control->Field(), text);
        QTest::keyClick(control->Field(), Qt::Key_Return);
        Drain();
    };
    type(window->RangeStartField(), "-1");
    EXPECT_TRUE(zoomRange->isEnabled());
    type(window->RangeEndField(), "-1");
    EXPECT_FALSE(zoomRange->isEnabled());
    type(window->RangeEndField(), "0");
    EXPECT_TRUE(zoomRange->isEnabled());
    EXPECT_EQ(window->Manager()->RangeEnd(), 0);
}

TEST(QuillexWindow, RangeFieldValuesAreReadAsThirtyTwoBitNumbers)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    window->RangeStartField()->SetText("4294967295");
    window->RangeEndField()->SetText("-1");
    window->PostMessage(kMsgSetRangeStart);
    Drain();
    EXPECT_EQ(window->Manager()->RangeStart(), -1);
    EXPECT_FALSE(window->MenuItem(KeptMenuItem::ZoomRange)->isEnabled());
}

TEST(QuillexWindow, RangeMessagesWriteTheFieldsAndMissingFieldsAreIgnored)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    Message start(kMsgRangeStartChanged);
    start.AddInt64("range start", 1234567890123);
    window->PostMessage(start);
    Message wrongType(kMsgRangeEndChanged);
    wrongType.AddInt32("range end", 5);
    window->PostMessage(wrongType);
    Drain();
    EXPECT_EQ(window->RangeStartField()->Text(), "1234567890123");
    EXPECT_EQ(window->RangeEndField()->Text(), "-1");
}

TEST(QuillexWindow, PlayModePopupAndLoopBoxSetTheDocument)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    window->PlayModePopup()->setCurrentIndex(2);
    emit window->PlayModePopup()->activated(2);
    Drain();
    EXPECT_EQ(window->Manager()->PlayMode(), ChannelManager::kPlayVisible);
    QTest::mouseClick(window->LoopBox(), Qt::LeftButton);
    Drain();
    EXPECT_FALSE(window->LoopBox()->isChecked());
    EXPECT_FALSE(window->Manager()->Loop());
    QTest::mouseClick(window->LoopBox(), Qt::LeftButton);
    Drain();
    EXPECT_TRUE(window->Manager()->Loop());
}

TEST(QuillexWindow, SpaceTwiceStartsAndStopsPlaybackAndTheModeFollows)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("play.wav", 1, 44100));
    window->PostMessage(kMsgTogglePlay);
    Drain();
    EXPECT_TRUE(window->IsPlaying());
    EXPECT_EQ(window->PlayModeButtonMode(), 0);
    window->PostMessage(kMsgTogglePlay);
    Drain();
    EXPECT_FALSE(window->IsPlaying());
    EXPECT_EQ(window->PlayModeButtonMode(), 1);
}

TEST(QuillexWindow, ControlSpaceIsTheWindowsPlaybackShortcut)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("shortcut.wav", 1, 44100));
    QApplication::setActiveWindow(window);
    ASSERT_TRUE(QTest::qWaitForWindowActive(window));
    QTest::keyClick(window, Qt::Key_Space, Qt::ControlModifier);
    Drain();
    EXPECT_TRUE(window->IsPlaying());
    QTest::keyClick(window, Qt::Key_Space, Qt::ControlModifier);
    Drain();
    EXPECT_FALSE(window->IsPlaying());
}

TEST(QuillexWindow, StopWhileStoppedResetsThePositionAndMovesThePlaymark)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("stop.wav", 1, 1000));
    window->Manager()->SetCurrentFrame(500);
    window->ContainerView()->SetPlaymarkFrame(500);
    Drain();
    window->PostMessage(kMsgStop);
    Drain();
    EXPECT_FALSE(window->IsPlaying());
    EXPECT_NE(window->Manager()->CurrentFrame(), 500);
    EXPECT_EQ(window->ContainerView()->PlaymarkFrame(), window->Manager()->CurrentFrame());
}

TEST(QuillexWindow, ABurstOfPlaymarkUpdatesMovesThePlaymarkOnce)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("burst.wav", 1, 1000));
    for (int64_t frame : {100, 200, 300}) {
        Message update(kMsgUpdatePlaymark);
        update.AddInt64("current frame", frame);
        window->PostMessage(update);
    }
    Drain();
    EXPECT_EQ(window->ContainerView()->PlaymarkFrame(), 100);
    // Acknowledged by now, so the next one moves it again.
    Message next(kMsgUpdatePlaymark);
    next.AddInt64("current frame", 400);
    window->PostMessage(next);
    window->PostMessage(kMsgUpdatePlaymark);  // no field: ignored
    Drain();
    EXPECT_EQ(window->ContainerView()->PlaymarkFrame(), 400);
}

TEST(QuillexWindow, DroppingThreeFilesLoadsOnlyTheFirst)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("base.wav", 2));
    ASSERT_EQ(window->Manager()->CountChannels(), 2);
    const auto a = fixture.MakeSound("a.wav", 1);
    const auto b = fixture.MakeSound("b.wav", 2);
    const auto c = fixture.MakeSound("c.wav", 2);
    DropFiles(window, {a, b, c}, Qt::NoModifier);
    EXPECT_EQ(window->Manager()->CountChannels(), 1);
    EXPECT_EQ(window->windowTitle(), "Glimmet - a.wav");
    EXPECT_EQ(window->FileEntry(), a);
    EXPECT_EQ(fixture.App().CountWindows(), 1);
}

TEST(QuillexWindow, DroppingWithShiftAddsTheChannels)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("base.wav", 1));
    const auto stereo = fixture.MakeSound("stereo.wav", 2);
    DropFiles(window, {stereo, fixture.MakeSound("ignored.wav", 1)}, Qt::ShiftModifier);
    EXPECT_TRUE(window->AppendOnLoad());
    EXPECT_EQ(window->Manager()->CountChannels(), 3);
    EXPECT_EQ(window->ContainerView()->CountChannelViews(), 3);
    EXPECT_EQ(window->windowTitle(), "Glimmet - base.wav");
}

TEST(QuillexWindow, OpeningAFileIntoTheWindowEmptiesItsHistory)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("first.wav", 2, 1000));
    window->PostMessage(kMsgSelectAll);
    window->PostMessage(kMsgFadeOut);
    Drain();
    ASSERT_NE(window->History()->UndoName(), nullptr);
    const auto second = fixture.MakeSound("second.wav", 2, 1000);
    DropFiles(window, {second}, Qt::NoModifier);
    ASSERT_EQ(window->windowTitle(), "Glimmet - second.wav");
    const int16_t before = test::SamplesOf(*window->Manager()->ChannelAt(0)).at(999);
    EXPECT_EQ(window->History()->UndoName(), nullptr);
    EXPECT_TRUE(window->History()->IsSaved());
    EXPECT_FALSE(window->MenuItem(KeptMenuItem::Save)->isEnabled());
    EXPECT_FALSE(window->MenuItem(KeptMenuItem::Undo)->isEnabled());
    window->PostMessage(kMsgUndo);
    Drain();
    EXPECT_EQ(test::SamplesOf(*window->Manager()->ChannelAt(0)).at(999), before);
}

TEST(QuillexWindow, AppendingAFileKeepsTheHistory)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("first.wav", 1, 1000));
    window->PostMessage(kMsgSelectAll);
    window->PostMessage(kMsgFadeOut);
    Drain();
    DropFiles(window, {fixture.MakeSound("more.wav", 1, 1000)}, Qt::ShiftModifier);
    ASSERT_EQ(window->Manager()->CountChannels(), 2);
    EXPECT_STREQ(window->History()->UndoName(), "Fade Out");
    EXPECT_FALSE(window->History()->IsSaved());
}

TEST(QuillexWindow, DropMessageWithoutRefsIsIgnored)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("kept.wav", 1));
    window->PostMessage(kMsgSimpleData);
    Drain();
    EXPECT_EQ(window->windowTitle(), "Glimmet - kept.wav");
    EXPECT_EQ(window->Manager()->CountChannels(), 1);
}

TEST(QuillexWindow, VisibleFramesAreTheContainersDisplayRange)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("visible.wav", 1, 5000));
    window->ContainerView()->SetDisplayRange(1000, 3999);
    int64_t first = -5;
    int64_t last = -5;
    window->GetVisibleFrames(&first, &last);
    EXPECT_EQ(first, window->ContainerView()->FirstDisplayedFrame());
    EXPECT_EQ(last, window->ContainerView()->LastDisplayedFrame());
    EXPECT_EQ(first, 1000);
}

TEST(QuillexWindow, DisplayRangeMessageNeedsBothFrames)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("range.wav", 1, 5000));
    const int64_t before = window->ContainerView()->FirstDisplayedFrame();
    Message half(kMsgSetDisplayRange);
    half.AddInt64("first frame", 2000);
    window->PostMessage(half);
    Drain();
    EXPECT_EQ(window->ContainerView()->FirstDisplayedFrame(), before);
    Message both(kMsgSetDisplayRange);
    both.AddInt64("first frame", 2000);
    both.AddInt64("last frame", 4999);
    window->MessageReceived(both);
    EXPECT_EQ(window->ContainerView()->FirstDisplayedFrame(), 2000);
}

TEST(QuillexWindow, SelectAllAndSelectNoneReachTheChannels)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("select.wav", 2, 100));
    window->PostMessage(kMsgSelectAll);
    Drain();
    EXPECT_TRUE(window->Manager()->ChannelAt(0)->IsSelected());
    EXPECT_TRUE(window->Manager()->ChannelAt(1)->IsSelected());
    EXPECT_EQ(window->Manager()->RangeEnd(), 99);
    window->PostMessage(kMsgSelectNone);
    Drain();
    EXPECT_FALSE(window->Manager()->ChannelAt(0)->IsSelected());
}

/// An edit that asks for parameters before it runs, counting its runs.
class ConfiguredAction : public Action {
public:
    explicit ConfiguredAction(int* runs) : Action(nullptr), runs_(runs) {}
    status_t Go() override
    {
        ++*runs_;
        return B_OK;
    }
    const char* Name() override { return "Configured"; }
    bool SupportsConfiguration() override { return true; }

private:
    int* runs_;
};

/// An edit that never becomes ready.
class UnreadyAction : public Action {
public:
    UnreadyAction() : Action(nullptr) {}
    status_t InitCheck() override { return B_NO_INIT; }
};

TEST(QuillexWindow, AConfiguredActionWaitsForItsDialog)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("pending.wav", 1, 100));
    int runs = 0;
    auto* action = new ConfiguredAction(&runs);
    window->SetupAction(std::unique_ptr<Action>(action));
    Drain();
    EXPECT_EQ(window->PendingAction(), action);
    EXPECT_EQ(runs, 0);
    window->PostMessage(kMsgActionGo);
    Drain();
    EXPECT_EQ(runs, 1);
    EXPECT_EQ(window->PendingAction(), nullptr);
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Undo)->text(), "Undo Configured");
}

TEST(QuillexWindow, ActionCancelDropsThePendingAction)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("cancel.wav", 1, 100));
    int runs = 0;
    window->SetupAction(std::make_unique<ConfiguredAction>(&runs));
    window->PostMessage(kMsgActionCancel);
    window->PostMessage(kMsgActionGo);
    Drain();
    EXPECT_EQ(window->PendingAction(), nullptr);
    EXPECT_EQ(runs, 0);
    EXPECT_EQ(window->History()->UndoName(), nullptr);
}

TEST(QuillexWindow, AnActionThatFailsItsCheckIsDroppedAtOnce)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    window->SetupAction(std::make_unique<UnreadyAction>());
    EXPECT_EQ(window->PendingAction(), nullptr);
    window->PostMessage(kMsgActionGo);
    Drain();
    EXPECT_EQ(window->History()->UndoName(), nullptr);
    window->SetupAction(nullptr);
    EXPECT_EQ(window->PendingAction(), nullptr);
}

TEST(QuillexWindow, ANewActionReplacesOneStillWaitingForItsDialog)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("replace.wav", 1, 100));
    int firstRuns = 0;
    int secondRuns = 0;
    window->SetupAction(std::make_unique<ConfiguredAction>(&firstRuns));
    auto* second = new ConfiguredAction(&secondRuns);
    window->SetupAction(std::unique_ptr<Action>(second));
    EXPECT_EQ(window->PendingAction(), second);
    window->PostMessage(kMsgActionGo);
    Drain();
    EXPECT_EQ(firstRuns, 0);
    EXPECT_EQ(secondRuns, 1);
}

TEST(QuillexWindow, UndoAndRedoFailuresArePrinted)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    DiagnosticsCapture capture;
    window->MessageReceived(Message(kMsgUndo));
    window->MessageReceived(Message(kMsgRedo));
    const std::string output = capture.Finish();
    EXPECT_EQ(output, std::string("Error doing undo: ") + StatusText(B_ERROR) + "\nError doing redo: "
            + StatusText(B_ERROR) + "\n");
    // A failure leaves the menu as it was built.
    EXPECT_TRUE(window->MenuItem(KeptMenuItem::Undo)->isEnabled());
}

}  // namespace
}  // namespace glimmet::test
