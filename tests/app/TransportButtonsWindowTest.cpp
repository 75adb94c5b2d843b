#include <gtest/gtest.h>

#include <QComboBox>
#include <QTest>

#include <string>

#include "AppTestSupport.h"
#include "BatchTestSupport.h"
#include "sound/ChannelManager.h"
#include "support/MessageCodes.h"
#include "views/ChannelContainerView.h"
#include "views/PlayButton.h"
#include "views/PlayModeButton.h"
#include "views/StopButton.h"

namespace glimmet::test {
namespace {

int Left(QuillexWindow* window, QWidget* widget)
{
    return widget->mapTo(window, QPoint(0, 0)).x();
}

int Right(QuillexWindow* window, QWidget* widget)
{
    return Left(window, widget) + widget->width();
}

/// A click with the left mouse button in the middle of the button, then
/// whatever it posted.
void ClickOn(QWidget* button, Qt::MouseButton mouseButton = Qt::LeftButton)
{
    QTest::mouseClick(button, mouseButton, Qt::NoModifier, button->rect().center());
    Drain();
}

TEST(TransportButtonsInTheWindow, TheControlRowStartsWithPlayPlayModeAndStopFivePixelsApart)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture);
    Drain();
    PlayButton* play = window->GetPlayButton();
    PlayModeButton* playMode = window->GetPlayModeButton();
    StopButton* stop = window->GetStopButton();
    EXPECT_EQ(play->objectName(), "play");
    EXPECT_EQ(playMode->objectName(), "play mode");
    EXPECT_EQ(stop->objectName(), "stop");
    EXPECT_EQ(window->TransportButtonNamed("play mode"), playMode);
    EXPECT_EQ(window->TransportButtonNamed("pause"), nullptr);
    EXPECT_EQ(play->size(), QSize(38, 21));
    EXPECT_EQ(playMode->size(), QSize(46, 21));
    EXPECT_EQ(stop->size(), QSize(31, 21));
    // The row begins inside the window's border of 5 pixels.
    EXPECT_EQ(Left(window, play), Left(window, window->ContainerView()));
    EXPECT_EQ(Left(window, playMode) - Right(window, play), 5);
    EXPECT_EQ(Left(window, stop) - Right(window, playMode), 5);
    EXPECT_EQ(Left(window, window->PlayModePopup()->parentWidget()) - Right(window, stop), 5);
    // Forward, stopped, enabled.
    EXPECT_EQ(play->Mode(), 0);
    EXPECT_EQ(playMode->Mode(), 1);
    EXPECT_TRUE(play->IsEnabled() && playMode->IsEnabled() && stop->IsEnabled());
}

TEST(TransportButtonsInTheWindow, AClickOnThePlayModeButtonStartsPlaybackAndASecondStopsIt)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("toggle.wav", 1, 44100 * 5));
    ClickOn(window->GetPlayModeButton());
    EXPECT_TRUE(window->IsPlaying());
    EXPECT_EQ(window->PlayModeButtonMode(), 0);
    ClickOn(window->GetPlayModeButton());
    EXPECT_FALSE(window->IsPlaying());
    EXPECT_EQ(window->PlayModeButtonMode(), 1);
}

TEST(TransportButtonsInTheWindow, TheStopButtonStopsAndPutsThePlayModeButtonBack)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("stop.wav", 1, 44100 * 5));
    ClickOn(window->GetPlayModeButton());
    ASSERT_TRUE(window->IsPlaying());
    ClickOn(window->GetStopButton());
    EXPECT_FALSE(window->IsPlaying());
    EXPECT_EQ(window->PlayModeButtonMode(), 1);
    EXPECT_EQ(window->Manager()->CurrentFrame(), 0);
    // Stopped already, a click on stop changes nothing.
    ClickOn(window->GetStopButton());
    EXPECT_FALSE(window->IsPlaying());
    EXPECT_EQ(window->PlayModeButtonMode(), 1);
}

TEST(TransportButtonsInTheWindow, ThePlayButtonStartsFromTheBeginningAndThePlayModeButtonFollows)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("play.wav", 1, 44100 * 5));
    window->Manager()->SetCurrentFrame(1000);
    ClickOn(window->GetPlayButton());
    EXPECT_TRUE(window->IsPlaying());
    EXPECT_EQ(window->PlayModeButtonMode(), 0);
    // Playing already: back to the beginning, still playing.
    ClickOn(window->GetPlayButton());
    EXPECT_TRUE(window->IsPlaying());
    EXPECT_EQ(window->PlayModeButtonMode(), 0);
    ClickOn(window->GetPlayModeButton());
    EXPECT_FALSE(window->IsPlaying());
}

TEST(TransportButtonsInTheWindow, ARightClickOnThePlayButtonPlaysFromTheCursor)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("cursor.wav", 1, 44100 * 5));
    window->ContainerView()->SetCursorFrame(30000);
    ClickOn(window->GetPlayButton(), Qt::RightButton);
    EXPECT_TRUE(window->IsPlaying());
    EXPECT_EQ(window->PlayModeButtonMode(), 0);
    EXPECT_GE(window->Manager()->CurrentFrame(), 30000);
    window->PostMessage(kMsgStop);
    Drain();
}

TEST(TransportButtonsInTheWindow, TheEndOfPlaybackAndTheKeyboardKeepThePlayModeButtonInStep)
{
    AppFixture fixture;
    QuillexWindow* window = OpenWindow(fixture, fixture.MakeSound("end.wav", 1, 44100 * 5));
    window->PostMessage(kMsgTogglePlay);
    Drain();
    EXPECT_EQ(window->PlayModeButtonMode(), 0);
    // What the mixer posts when a range that does not loop has been played.
    window->PostMessage(kMsgStop);
    Drain();
    EXPECT_FALSE(window->IsPlaying());
    EXPECT_EQ(window->PlayModeButtonMode(), 1);
}

// -------------------------------------------------------------------------
// The batch mode's press command

TEST_F(BatchTest, PressClicksTheNamedTransportButton)
{
    const auto file = fixture_.MakeSound("press.wav", 1, 44100 * 5);
    ASSERT_EQ(Run("open " + file.string() + "\npress play mode\nprint\n"), BatchRunner::kSucceeded) << Errors();
    EXPECT_TRUE(window_->IsPlaying());
    EXPECT_NE(LastState().find("\"transport\": {\"play mode\": 0, \"play\": 0, \"enabled\": true}"),
        std::string::npos)
        << LastState();
    ASSERT_EQ(Run("press stop left\n"), BatchRunner::kSucceeded) << Errors();
    EXPECT_FALSE(window_->IsPlaying());
    EXPECT_EQ(window_->PlayModeButtonMode(), 1);
    ASSERT_EQ(Run("press play right\n"), BatchRunner::kSucceeded) << Errors();
    EXPECT_TRUE(window_->IsPlaying());
    ASSERT_EQ(Run("press stop\n"), BatchRunner::kSucceeded) << Errors();
    EXPECT_FALSE(window_->IsPlaying());
}

TEST_F(BatchTest, PressTakesAButtonsNameAndLeftOrRight)
{
    EXPECT_EQ(Run("press pause\n"), BatchRunner::kFailed);
    EXPECT_EQ(Run("press stop middle\n"), BatchRunner::kFailed);
    EXPECT_EQ(Run("press play mode left now\n"), BatchRunner::kFailed);
    EXPECT_EQ(Run("press\n"), BatchRunner::kFailed);
    const std::string errors = Errors();
    EXPECT_NE(errors.find("line 1: press takes play, play mode or stop"), std::string::npos) << errors;
    EXPECT_NE(errors.find("line 1: press takes left or right"), std::string::npos) << errors;
    EXPECT_FALSE(window_->IsPlaying());
}

}  // namespace
}  // namespace glimmet::test
