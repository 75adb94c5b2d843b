#include <gtest/gtest.h>

#include <QImage>

#include <string>
#include <vector>

#include "TransportButtonTestSupport.h"
#include "support/MessageCodes.h"
#include "support/SystemTime.h"
#include "views/PlayModeButton.h"

namespace glimmet::test {
namespace {

/// A play mode button in the stopped mode, in a window, posting 'cnpl'.
class PlayModeButtonTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        button->move(10, 5);
        host.Show();
    }

    std::vector<Message> Sent() const { return window.With(kMsgTogglePlay); }

    RecordingWindow window;
    ButtonHost host;
    PlayModeButton* button = new PlayModeButton("play mode", Message(kMsgTogglePlay), &window, 1, &host);
    ButtonMouse mouse{button};
};

TEST_F(PlayModeButtonTest, IsFortySixByTwentyOneAndStartsEnabledAndIdle)
{
    EXPECT_EQ(button->objectName(), "play mode");
    EXPECT_EQ(button->size(), QSize(46, 21));
    EXPECT_EQ(button->minimumSize(), QSize(46, 21));
    EXPECT_EQ(button->maximumSize(), QSize(46, 21));
    EXPECT_EQ(button->sizeHint(), QSize(46, 21));
    EXPECT_TRUE(button->IsEnabled());
    EXPECT_FALSE(button->IsTracking());
    EXPECT_FALSE(button->IsPushed());
    EXPECT_EQ(button->Mode(), 1);
}

TEST_F(PlayModeButtonTest, AClickTogglesTheModeAndSendsWhenSourceAndTheNewMode)
{
    const int64_t before = system_time();
    mouse.Click(mouse.Inside());
    const int64_t after = system_time();
    EXPECT_EQ(button->Mode(), 0);
    const std::vector<Message> sent = Sent();
    ASSERT_EQ(sent.size(), 1u);
    const Message& message = sent[0];
    std::string name;
    ASSERT_EQ(message.GetInfo(0, &name, nullptr, nullptr), B_OK);
    EXPECT_EQ(name, kFieldWhen);
    ASSERT_EQ(message.GetInfo(1, &name, nullptr, nullptr), B_OK);
    EXPECT_EQ(name, kFieldSource);
    ASSERT_EQ(message.GetInfo(2, &name, nullptr, nullptr), B_OK);
    EXPECT_EQ(name, kFieldMode);
    EXPECT_GE(window.Int64(message, kFieldWhen), before);
    EXPECT_LE(window.Int64(message, kFieldWhen), after);
    EXPECT_EQ(SourceOf(message), button);
    EXPECT_EQ(ModeOf(message), 0);
    EXPECT_FALSE(button->IsTracking());
    EXPECT_FALSE(button->IsPushed());

    mouse.Click(mouse.Inside());
    EXPECT_EQ(button->Mode(), 1);
    ASSERT_EQ(Sent().size(), 2u);
    EXPECT_EQ(ModeOf(Sent()[1]), 1);
}

TEST_F(PlayModeButtonTest, TheToggleSwapsZeroAndOneAndTwoAndThreeAndMakesAnythingElseOne)
{
    const std::vector<std::pair<int32_t, int32_t>> toggles = {{0, 1}, {1, 0}, {2, 3}, {3, 2}, {4, 1}, {-1, 1}, {99, 1}};
    for (const auto& [from, to] : toggles) {
        SCOPED_TRACE(from);
        EXPECT_EQ(PlayModeButton::ToggledMode(from), to);
        button->SetMode(from);
        window.messages.clear();
        mouse.Click(mouse.Inside());
        EXPECT_EQ(button->Mode(), to);
        ASSERT_EQ(Sent().size(), 1u);
        EXPECT_EQ(ModeOf(Sent()[0]), to);
    }
}

TEST_F(PlayModeButtonTest, APressInsideAndAReleaseOutsideSendsNothingAndKeepsTheMode)
{
    mouse.Press(mouse.Inside());
    EXPECT_TRUE(button->IsTracking());
    EXPECT_TRUE(button->IsPushed());
    mouse.Move(mouse.Outside());
    mouse.Release(mouse.Outside());
    EXPECT_FALSE(button->IsTracking());
    EXPECT_FALSE(button->IsPushed());
    EXPECT_EQ(button->Mode(), 1);
    EXPECT_TRUE(window.messages.empty());
}

TEST_F(PlayModeButtonTest, AReleaseOutsideWithoutAMoveBeforeItSendsNothingEither)
{
    mouse.Press(mouse.Inside());
    mouse.Release(mouse.Outside());
    EXPECT_FALSE(button->IsPushed());
    EXPECT_EQ(button->Mode(), 1);
    EXPECT_TRUE(window.messages.empty());
}

TEST_F(PlayModeButtonTest, WhileHeldThePushedPictureFollowsThePointerInAndOut)
{
    mouse.Press(mouse.Inside());
    EXPECT_EQ(button->PictureName(), "Playbutton-pushedforplaying");
    mouse.Move(mouse.Outside());
    EXPECT_FALSE(button->IsPushed());
    EXPECT_TRUE(button->IsTracking());
    EXPECT_EQ(button->PictureName(), "Playbutton-paused");
    mouse.Move(QPoint(0, 0));
    EXPECT_TRUE(button->IsPushed());
    EXPECT_EQ(button->PictureName(), "Playbutton-pushedforplaying");
    // Back inside, the release is a click.
    mouse.Release(QPoint(0, 0));
    EXPECT_EQ(button->Mode(), 0);
    EXPECT_EQ(Sent().size(), 1u);
}

TEST_F(PlayModeButtonTest, APressOutsideTheBoundsIsNotAPress)
{
    mouse.Press(mouse.Outside());
    EXPECT_FALSE(button->IsTracking());
    mouse.Release(mouse.Inside());
    EXPECT_TRUE(window.messages.empty());
}

TEST_F(PlayModeButtonTest, ADisabledButtonIgnoresTheMouse)
{
    button->SetEnabled(false);
    mouse.Click(mouse.Inside());
    EXPECT_FALSE(button->IsTracking());
    EXPECT_EQ(button->Mode(), 1);
    EXPECT_TRUE(window.messages.empty());
}

TEST_F(PlayModeButtonTest, DisabledWhileHeldTheReleaseSendsNothing)
{
    mouse.Press(mouse.Inside());
    button->SetEnabled(false);
    mouse.Release(mouse.Inside());
    EXPECT_FALSE(button->IsTracking());
    EXPECT_EQ(button->Mode(), 1);
    EXPECT_TRUE(window.messages.empty());
}

TEST_F(PlayModeButtonTest, OnlyTheLastButtonUpEndsTheClick)
{
    mouse.Press(mouse.Inside());
    mouse.Press(mouse.Inside(), Qt::RightButton, Qt::LeftButton);
    mouse.Release(mouse.Inside(), Qt::LeftButton, Qt::RightButton);
    EXPECT_TRUE(button->IsTracking());
    EXPECT_TRUE(window.messages.empty());
    mouse.Release(mouse.Inside(), Qt::RightButton);
    EXPECT_FALSE(button->IsTracking());
    EXPECT_EQ(Sent().size(), 1u);
}

TEST_F(PlayModeButtonTest, SetModeAndSetEnabledSendNothing)
{
    button->SetMode(0);
    EXPECT_EQ(button->Mode(), 0);
    button->SetEnabled(false);
    EXPECT_FALSE(button->IsEnabled());
    button->SetEnabled(true);
    EXPECT_TRUE(window.messages.empty());
}

TEST_F(PlayModeButtonTest, TheTemplatesOwnFieldsTravelWithIt)
{
    Message withField(kMsgTogglePlay);
    withField.AddInt32("extra", 7);
    auto* other = new PlayModeButton("other", withField, &window, 1, &host);
    other->move(10, 30);
    other->show();
    ButtonMouse{other}.Click(QPoint(3, 3));
    ASSERT_EQ(Sent().size(), 1u);
    int32_t extra = 0;
    EXPECT_EQ(Sent()[0].FindInt32("extra", &extra), B_OK);
    EXPECT_EQ(extra, 7);
}

TEST(PlayModeButtonAlone, AButtonInNoWindowSendsNothing)
{
    RecordingWindow window;
    PlayModeButton button("play mode", Message(kMsgTogglePlay), &window, 1);
    button.show();
    ButtonMouse{&button}.Click(QPoint(5, 5));
    EXPECT_EQ(button.Mode(), 0);
    EXPECT_TRUE(window.messages.empty());
}

// -------------------------------------------------------------------------
// Pictures

struct PictureCase {
    int32_t mode;
    bool enabled;
    bool pushed;
    const char* picture;  // empty: nothing drawn
};

TEST_F(PlayModeButtonTest, EachStateShowsItsPictureOrNothing)
{
    const std::vector<PictureCase> cases = {
        {0, true, false, "Playbutton-playing"},
        {0, true, true, "Playbutton-pushedforpause"},
        {1, true, false, "Playbutton-paused"},
        {1, true, true, "Playbutton-pushedforplaying"},
        // The backward pictures are not among the resources.
        {2, true, false, ""},
        {2, true, true, ""},
        {3, true, false, ""},
        {3, true, true, ""},
        {4, true, false, ""},
        {-1, true, true, ""},
        {0, false, false, "Playbutton-disabled"},
        {1, false, false, "Playbutton-disabled"},
        {2, false, false, "Playbutton-disabled"},
        {7, false, false, "Playbutton-disabled"},
    };
    for (const PictureCase& state : cases) {
        SCOPED_TRACE(testing::Message() << "mode " << state.mode << (state.enabled ? "" : " disabled")
                                        << (state.pushed ? " pushed" : ""));
        button->SetEnabled(true);
        button->SetMode(state.mode);
        if (state.pushed)
            mouse.Press(mouse.Inside());
        button->SetEnabled(state.enabled);
        const QImage expected = *state.picture != '\0' ? ResourcePicture(state.picture) : HostOnly(button->size());
        ASSERT_FALSE(expected.isNull());
        EXPECT_EQ(host.Shown(button), expected);
        EXPECT_EQ(button->CurrentPicture().isNull(), *state.picture == '\0');
        if (state.pushed)
            mouse.Release(mouse.Outside());
    }
}

TEST_F(PlayModeButtonTest, TheBackwardPicturesAreAskedForByName)
{
    button->SetMode(2);
    EXPECT_EQ(button->PictureName(), "Playbutton-playingbackward");
    button->SetMode(3);
    EXPECT_EQ(button->PictureName(), "Playbutton-pausedbackwards");
    mouse.Press(mouse.Inside());
    EXPECT_EQ(button->PictureName(), "Playbutton-pushedforplayingbackward");
    button->SetMode(2);
    EXPECT_EQ(button->PictureName(), "Playbutton-pushedforpausebackward");
    button->SetMode(5);
    EXPECT_EQ(button->PictureName(), "");
}

TEST_F(PlayModeButtonTest, AClickRedrawsWithThePictureOfTheNewMode)
{
    EXPECT_EQ(host.Shown(button), ResourcePicture("Playbutton-paused"));
    mouse.Press(mouse.Inside());
    EXPECT_EQ(host.Shown(button), ResourcePicture("Playbutton-pushedforplaying"));
    mouse.Release(mouse.Inside());
    EXPECT_EQ(host.Shown(button), ResourcePicture("Playbutton-playing"));
}

}  // namespace
}  // namespace glimmet::test
