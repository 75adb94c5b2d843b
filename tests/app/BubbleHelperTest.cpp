#include <gtest/gtest.h>

#include <QComboBox>
#include <QMenuBar>
#include <QPointer>
#include <QTest>
#include <QWidget>

#include <memory>
#include <string>

#include "AppTestSupport.h"
#include "app/BubbleHelper.h"
#include "app/BubbleWindow.h"
#include "app/HelpTexts.h"
#include "app/MenuTable.h"
#include "app/PointerProbe.h"
#include "support/MessageCodes.h"
#include "views/ChannelContainerView.h"
#include "views/PlayButton.h"
#include "views/PlayModeButton.h"
#include "views/StopButton.h"

namespace glimmet::test {
namespace {

/// The desktop as a test sets it.
struct Desk {
    QPoint position{500, 300};
    Qt::MouseButtons buttons = Qt::NoButton;
    QWidget* under = nullptr;
    QRect screen{0, 0, 1024, 768};
};

class DeskProbe : public PointerProbe {
public:
    explicit DeskProbe(const Desk* desk) : desk_(desk) {}
    QPoint Position() const override { return desk_->position; }
    Qt::MouseButtons Buttons() const override { return desk_->buttons; }
    QWidget* WidgetAt(QPoint) const override { return desk_->under; }
    QRect MainScreen() const override { return desk_->screen; }

private:
    const Desk* desk_;
};

/// A helper polled by the test over a desk the test controls, with one
/// widget that has help under the pointer.
struct Polled {
    Desk desk;
    QWidget widget;
    BubbleHelper helper{std::make_unique<DeskProbe>(&desk), BubbleHelper::Polling::Manual};

    explicit Polled(const QString& text = QStringLiteral("Stops"))
    {
        widget.resize(100, 40);
        helper.SetHelp(&widget, text);
        desk.under = &widget;
    }
    void Poll(int times = 1)
    {
        for (int i = 0; i < times; ++i)
            helper.Poll();
    }
    /// Moves the pointer and polls once, the poll that sees the move.
    void MoveTo(QPoint where)
    {
        desk.position = where;
        Poll();
    }
    bool Shown() const { return helper.IsBubbleShown(); }
    /// Polls at rest until the bubble shows; the number of polls, or -1
    /// after limit polls.
    int PollsUntilShown(int limit = 50)
    {
        for (int poll = 1; poll <= limit; ++poll) {
            Poll();
            if (Shown())
                return poll;
        }
        return -1;
    }
    /// Polls until the bubble is gone; the polls it stayed for.
    int PollsWhileShown(int limit = 500)
    {
        for (int poll = 1; poll <= limit; ++poll) {
            Poll();
            if (!Shown())
                return poll - 1;
        }
        return limit;
    }
};

// --- One helper ------------------------------------------------------------------

TEST(BubbleHelper, IsTheInstanceWhileItLivesAndCanBeMadeAgainAfter)
{
    {
        Desk desk;
        BubbleHelper helper(std::make_unique<DeskProbe>(&desk), BubbleHelper::Polling::Manual);
        EXPECT_EQ(BubbleHelper::Instance(), &helper);
        EXPECT_TRUE(helper.IsEnabled());
    }
    EXPECT_EQ(BubbleHelper::Instance(), nullptr);
    Desk desk;
    BubbleHelper again(std::make_unique<DeskProbe>(&desk), BubbleHelper::Polling::Manual);
    EXPECT_EQ(BubbleHelper::Instance(), &again);
}

TEST(BubbleHelperDeathTest, ASecondInstanceStopsTheProgramWithItsMessage)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_DEATH(
        {
            Desk desk;
            BubbleHelper first(std::make_unique<DeskProbe>(&desk), BubbleHelper::Polling::Manual);
            BubbleHelper second(std::make_unique<DeskProbe>(&desk), BubbleHelper::Polling::Manual);
        },
        "only one BubbleHelper instance allowed/necessary");
}

TEST(BubbleHelper, TheApplicationHasOneSwitchedOffThatPollsEvery100ms)
{
    AppFixture fixture;
    BubbleHelper* helper = fixture.App().Helper();
    ASSERT_NE(helper, nullptr);
    EXPECT_EQ(BubbleHelper::Instance(), helper);
    EXPECT_FALSE(helper->IsEnabled());
    EXPECT_FALSE(fixture.App().IsBubbleHelpEnabled());
    EXPECT_EQ(helper->PollIntervalMillis(), 100);
}

// --- Help texts -------------------------------------------------------------------

TEST(BubbleHelper, SetHelpReplacesAndANullTextRemoves)
{
    Polled polled;
    EXPECT_EQ(polled.helper.GetHelp(&polled.widget), "Stops");
    polled.helper.SetHelp(&polled.widget, QStringLiteral("Plays"));
    EXPECT_EQ(polled.helper.GetHelp(&polled.widget), "Plays");
    polled.helper.SetHelp(&polled.widget, QString());
    EXPECT_TRUE(polled.helper.GetHelp(&polled.widget).isNull());
    polled.helper.SetHelp(nullptr, QStringLiteral("nobody"));
    EXPECT_TRUE(polled.helper.GetHelp(nullptr).isNull());
}

TEST(BubbleHelper, RegisterHelpReachesTheLiveHelperAndIsHarmlessWithout)
{
    QWidget view;
    ASSERT_EQ(BubbleHelper::Instance(), nullptr);
    BubbleHelper::RegisterHelp(&view, "nobody hears");
    Polled polled;
    EXPECT_TRUE(polled.helper.GetHelp(&view).isNull());
    BubbleHelper::RegisterHelp(&view, "Immediatly stops playback");
    EXPECT_EQ(polled.helper.GetHelp(&view), "Immediatly stops playback");
}

TEST(BubbleHelper, TheNearestAncestorWithHelpGivesTheText)
{
    Polled polled(QStringLiteral("outer"));
    auto* middle = new QWidget(&polled.widget);
    auto* inner = new QWidget(middle);
    polled.desk.under = inner;
    EXPECT_EQ(polled.helper.HelpAt({}), "outer");
    polled.helper.SetHelp(middle, QStringLiteral("middle"));
    EXPECT_EQ(polled.helper.HelpAt({}), "middle");
    polled.helper.SetHelp(inner, QStringLiteral("inner"));
    EXPECT_EQ(polled.helper.HelpAt({}), "inner");
    // Help does not reach from one window into another.
    QWidget dialog(&polled.widget, Qt::Dialog);
    polled.desk.under = &dialog;
    EXPECT_TRUE(polled.helper.HelpAt({}).isNull());
}

TEST(BubbleHelper, AWidgetThatIsGoneLosesItsHelp)
{
    Polled polled;
    auto* gone = new QWidget(&polled.widget);
    polled.helper.SetHelp(gone, QStringLiteral("gone"));
    delete gone;
    polled.desk.under = &polled.widget;
    EXPECT_EQ(polled.helper.HelpAt({}), "Stops");
}

// --- Polls ---------------------------------------------------------------------------

TEST(BubbleHelper, TheSeventhPollAtRestShowsTheBubble)
{
    Polled polled;
    polled.MoveTo({500, 300});
    EXPECT_EQ(polled.PollsUntilShown(), 7);
    EXPECT_EQ(polled.helper.Bubble()->Text(), "Stops");
}

TEST(BubbleHelper, WithHelpSwitchedOffNoBubbleAppears)
{
    Polled polled;
    polled.helper.EnableHelp(false);
    polled.MoveTo({500, 300});
    EXPECT_EQ(polled.PollsUntilShown(100), -1);
    // Switched off, the polls did not even look at the pointer; the first
    // one after switching on sees it arrive.
    polled.helper.EnableHelp(true);
    EXPECT_EQ(polled.PollsUntilShown(), 8);
}

TEST(BubbleHelper, SwitchingOffLeavesABubbleOnScreenToItsTime)
{
    Polled polled;
    polled.MoveTo({500, 300});
    polled.PollsUntilShown();
    polled.helper.EnableHelp(false);
    EXPECT_EQ(polled.PollsWhileShown(), 20);
}

TEST(BubbleHelper, AButtonDownRestartsTheRest)
{
    Polled polled;
    polled.MoveTo({500, 300});
    polled.Poll(5);
    polled.desk.buttons = Qt::LeftButton;
    polled.Poll();
    polled.desk.buttons = Qt::NoButton;
    EXPECT_EQ(polled.PollsUntilShown(), 7);
}

TEST(BubbleHelper, NoWidgetOrNoTextShowsNothing)
{
    Polled polled;
    polled.desk.under = nullptr;
    polled.MoveTo({500, 300});
    EXPECT_EQ(polled.PollsUntilShown(100), -1);
    QWidget bare;
    polled.desk.under = &bare;
    EXPECT_EQ(polled.PollsUntilShown(100), -1);
}

TEST(BubbleHelper, AShortTextStays20Polls)
{
    Polled shortText(QStringLiteral("Short"));
    shortText.MoveTo({500, 300});
    shortText.PollsUntilShown();
    EXPECT_EQ(shortText.PollsWhileShown(), 20);  // about 2 s at 100 ms a poll
}

TEST(BubbleHelper, A120CharacterTextStays120Polls)
{
    Polled longText(QString(120, QLatin1Char('x')));
    longText.MoveTo({500, 300});
    longText.PollsUntilShown();
    EXPECT_EQ(longText.PollsWhileShown(), 120);  // about 12 s
}

TEST(BubbleHelper, AOnePixelMoveHidesTheBubbleAtTheNextPoll)
{
    Polled polled;
    polled.MoveTo({500, 300});
    polled.PollsUntilShown();
    polled.Poll(3);
    ASSERT_TRUE(polled.Shown());
    polled.MoveTo({501, 300});
    EXPECT_FALSE(polled.Shown());
    // A new rest at the new place shows it again.
    EXPECT_EQ(polled.PollsUntilShown(), 7);
}

TEST(BubbleHelper, AButtonHidesTheBubbleAndItWaitsForAMove)
{
    Polled polled;
    polled.MoveTo({500, 300});
    polled.PollsUntilShown();
    polled.desk.buttons = Qt::RightButton;
    polled.Poll();
    EXPECT_FALSE(polled.Shown());
    polled.desk.buttons = Qt::NoButton;
    EXPECT_EQ(polled.PollsUntilShown(100), -1);
    polled.MoveTo({490, 300});
    EXPECT_EQ(polled.PollsUntilShown(), 7);
}

TEST(BubbleHelper, ShowsOncePerRest)
{
    Polled polled;
    polled.MoveTo({500, 300});
    polled.PollsUntilShown();
    polled.PollsWhileShown();
    EXPECT_EQ(polled.PollsUntilShown(300), -1);
    polled.MoveTo({500, 301});
    EXPECT_EQ(polled.PollsUntilShown(), 7);
}

TEST(BubbleHelper, NeverFindsItsOwnBubble)
{
    Polled polled;
    polled.MoveTo({500, 300});
    polled.PollsUntilShown();
    polled.desk.under = polled.helper.Bubble();
    EXPECT_EQ(polled.helper.FindView({}), nullptr);
}

// --- The bubble ------------------------------------------------------------------------

TEST(BubbleHelper, PlacementNearEachEdge)
{
    const QRect screen(0, 0, 1024, 768);
    const int width = 150;
    const int height = 30;
    // Anywhere else, 20 pixels below the pointer.
    EXPECT_EQ(BubbleHelper::BubblePosition({500, 300}, width, height, screen), QPoint(500, 320));
    EXPECT_EQ(BubbleHelper::BubblePosition({0, 0}, width, height, screen), QPoint(0, 20));
    // Near the bottom: above the pointer, clear of its picture.
    EXPECT_EQ(BubbleHelper::BubblePosition({500, 760}, width, height, screen), QPoint(500, 760 + 20 - 54));
    // Exactly fitting above the last three rows stays below.
    EXPECT_EQ(BubbleHelper::BubblePosition({500, 714}, width, height, screen), QPoint(500, 734));
    EXPECT_EQ(BubbleHelper::BubblePosition({500, 715}, width, height, screen), QPoint(500, 681));
    // Near the right edge: pushed left so that it ends at the last column.
    EXPECT_EQ(BubbleHelper::BubblePosition({1000, 300}, width, height, screen), QPoint(1023 - 154, 320));
    EXPECT_EQ(BubbleHelper::BubblePosition({869, 300}, width, height, screen), QPoint(869, 320));
    // In the bottom right corner, both.
    EXPECT_EQ(BubbleHelper::BubblePosition({1020, 765}, width, height, screen), QPoint(869, 731));
    // On a screen that does not start at 0.
    EXPECT_EQ(BubbleHelper::BubblePosition({2000, 300}, width, height, QRect(1024, 0, 1024, 768)),
        QPoint(2047 - 154, 320));
}

TEST(BubbleHelper, TheBubbleFitsItsTextAndStandsBesideThePointer)
{
    Polled polled(QStringLiteral("one line\nand a longer second line"));
    polled.MoveTo({1010, 760});
    polled.PollsUntilShown();
    BubbleWindow* bubble = polled.helper.Bubble();
    const int width = bubble->MaxLineWidth();
    const int height = bubble->TextHeight() + 4;
    EXPECT_EQ(bubble->TextHeight(), 2 * bubble->fontMetrics().lineSpacing());
    EXPECT_EQ(bubble->size(), QSize(width + 4, height));
    EXPECT_EQ(bubble->pos(), QPoint(1023 - width - 4, 760 + 20 - (height + 24)));
    EXPECT_TRUE(bubble->windowFlags().testFlag(Qt::FramelessWindowHint));
    EXPECT_TRUE(bubble->testAttribute(Qt::WA_ShowWithoutActivating));
    EXPECT_EQ(bubble->windowTitle(), "one line\nand a longer second line");
}

TEST(BubbleHelper, PaleYellowWithBlackText)
{
    Polled polled(QStringLiteral("Immediatly stops playback"));
    polled.MoveTo({100, 100});
    polled.PollsUntilShown();
    const QImage image = polled.helper.Bubble()->grab().toImage().convertToFormat(QImage::Format_RGB32);
    const QRgb yellow = qRgb(240, 240, 100);
    int black = 0;
    for (int y = 0; y < image.height(); ++y) {
        for (int x = 0; x < image.width(); ++x) {
            const QRgb pixel = image.pixel(x, y);
            // A last letter's ink may reach past its advance into the right
            // margin; the other margins stay clear.
            const bool margin = x < 2 || y < 2 || y >= image.height() - 2;
            if (margin) {
                ASSERT_EQ(pixel, yellow) << "margin pixel (" << x << ", " << y << ")";
            }
            // Text is black; its antialiased edges lie between black and yellow.
            ASSERT_EQ(qRed(pixel), qGreen(pixel)) << "(" << x << ", " << y << ")";
            ASSERT_LE(qBlue(pixel), 100);
            black += pixel == qRgb(0, 0, 0) ? 1 : 0;
        }
    }
    EXPECT_GT(black, 0);  // the cores of the stems
}

TEST(BubbleHelper, HidingMovesTheBubbleAway)
{
    Polled polled;
    polled.MoveTo({500, 300});
    polled.PollsUntilShown();
    polled.helper.HideBubble();
    EXPECT_FALSE(polled.Shown());
    EXPECT_EQ(polled.helper.Bubble()->pos(), QPoint(-1000, -1000));
}

// --- Document windows ---------------------------------------------------------------------

TEST(BubbleHelp, EveryWindowRegistersItsTextsWordForWord)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    BubbleHelper* helper = fixture.App().Helper();
    EXPECT_EQ(helper->GetHelp(window->ContainerView()),
        "Click left to select a range of the sample.\n"
        "Click right to get a context menu for that channel.\n"
        "Click and drag with the middle mouse button to\n"
        "to move the sample in the channel you clicked in.\n"
        "Double click with your left mouse button to select\n"
        "the whole sample in that channel.");
    EXPECT_EQ(helper->GetHelp(window->PlayModePopup()->parentWidget()),
        "You can pick what part of the sample will be looped.");
    // The popup's parts find the text through their parent.
    EXPECT_TRUE(helper->GetHelp(window->PlayModePopup()).isNull());
    EXPECT_EQ(helper->GetHelp(window->GetPlayButton()), help::kPlayButton);
    EXPECT_EQ(helper->GetHelp(window->GetPlayModeButton()), help::kPlayModeButton);
    EXPECT_EQ(helper->GetHelp(window->GetStopButton()), "Immediatly stops playback");
    // Qt's own tooltips stay out of the way.
    EXPECT_TRUE(window->ContainerView()->toolTip().isEmpty());
    EXPECT_TRUE(window->PlayModePopup()->toolTip().isEmpty());
}

TEST(BubbleHelp, TheButtonTextsAreKeptWordForWord)
{
    EXPECT_STREQ(help::kPlayButton,
        "Click left to start playing from the beginning\nor click right to start playing from the current\n"
        "cursor position. (Shift + Space)");
    EXPECT_STREQ(help::kPlayModeButton,
        "Toggles playback (Space, if a sample view\nhas keyboard focus, Control + Space otherwise)");
    EXPECT_STREQ(help::kStopButton, "Immediatly stops playback");
}

TEST(BubbleHelp, TheRealDesktopFindsThePopupsText)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    ASSERT_TRUE(QTest::qWaitForWindowExposed(window));
    QComboBox* popup = window->PlayModePopup();
    const QPoint inside = popup->mapToGlobal(popup->rect().center());
    EXPECT_EQ(fixture.App().Helper()->HelpAt(inside), "You can pick what part of the sample will be looped.");
}

TEST(BubbleHelp, TheMenuItemTogglesHelpAndEveryWindowsMark)
{
    AppFixture fixture;
    QuillexWindow* first = OpenWindow(fixture);
    QuillexWindow* second = OpenWindow(fixture);
    for (bool expected : {true, false}) {
        second->MenuItem(KeptMenuItem::BubbleHelp)->trigger();
        Drain();
        EXPECT_EQ(fixture.App().Helper()->IsEnabled(), expected);
        EXPECT_EQ(first->MenuItem(KeptMenuItem::BubbleHelp)->isChecked(), expected);
        EXPECT_EQ(second->MenuItem(KeptMenuItem::BubbleHelp)->isChecked(), expected);
    }
}

}  // namespace
}  // namespace glimmet::test
