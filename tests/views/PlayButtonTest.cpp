#include <gtest/gtest.h>

#include <QImage>

#include <string>
#include <vector>

#include "TransportButtonTestSupport.h"
#include "support/MessageCodes.h"
#include "views/PlayButton.h"

namespace glimmet::test {
namespace {

/// A forward play button in a window: 'play' for the left button, 'pfcr'
/// for the right one.
class PlayButtonTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        button->move(10, 5);
        host.Show();
    }

    RecordingWindow window;
    ButtonHost host;
    PlayButton* button = new PlayButton("play", Message(kMsgPlay), Message(kMsgPlayFromCursor), &window, 0, &host);
    ButtonMouse mouse{button};
};

TEST_F(PlayButtonTest, IsThirtyEightByTwentyOne)
{
    EXPECT_EQ(button->objectName(), "play");
    EXPECT_EQ(button->size(), QSize(38, 21));
    EXPECT_EQ(button->minimumSize(), QSize(38, 21));
    EXPECT_EQ(button->maximumSize(), QSize(38, 21));
    EXPECT_EQ(button->Mode(), 0);
    EXPECT_TRUE(button->IsEnabled());
}

TEST_F(PlayButtonTest, TheLeftButtonSendsTheLeftTemplateAtThePress)
{
    mouse.Press(mouse.Inside());
    ASSERT_EQ(window.messages.size(), 1u);
    const Message& message = window.messages[0];
    EXPECT_EQ(message.what, kMsgPlay);
    EXPECT_TRUE(message.HasField(kFieldWhen));
    EXPECT_EQ(SourceOf(message), button);
    EXPECT_FALSE(message.HasField(kFieldMode));
    EXPECT_TRUE(button->IsTracking());
    EXPECT_TRUE(button->IsPushed());
    mouse.Release(mouse.Inside());
    EXPECT_EQ(window.messages.size(), 1u);
    EXPECT_FALSE(button->IsTracking());
    EXPECT_FALSE(button->IsPushed());
}

TEST_F(PlayButtonTest, TheRightButtonSendsTheRightTemplate)
{
    mouse.Click(mouse.Inside(), Qt::RightButton);
    ASSERT_EQ(window.messages.size(), 1u);
    EXPECT_EQ(window.messages[0].what, kMsgPlayFromCursor);
    EXPECT_EQ(SourceOf(window.messages[0]), button);
}

TEST_F(PlayButtonTest, ThePressSendsEvenIfTheReleaseIsOutside)
{
    mouse.Press(mouse.Inside());
    mouse.Move(mouse.Outside());
    EXPECT_FALSE(button->IsPushed());
    mouse.Release(mouse.Outside());
    ASSERT_EQ(window.messages.size(), 1u);
    EXPECT_EQ(window.messages[0].what, kMsgPlay);
}

TEST_F(PlayButtonTest, TheMiddleButtonPushesButSendsNothing)
{
    mouse.Press(mouse.Inside(), Qt::MiddleButton);
    EXPECT_TRUE(button->IsPushed());
    mouse.Release(mouse.Inside(), Qt::MiddleButton);
    EXPECT_TRUE(window.messages.empty());
}

TEST_F(PlayButtonTest, ASecondButtonWhileOneIsHeldSendsNothingMore)
{
    mouse.Press(mouse.Inside());
    mouse.Press(mouse.Inside(), Qt::RightButton, Qt::LeftButton);
    mouse.Release(mouse.Inside(), Qt::RightButton, Qt::LeftButton);
    mouse.Release(mouse.Inside());
    ASSERT_EQ(window.messages.size(), 1u);
    EXPECT_EQ(window.messages[0].what, kMsgPlay);
}

TEST_F(PlayButtonTest, ADisabledButtonSendsNothing)
{
    button->SetEnabled(false);
    mouse.Click(mouse.Inside());
    mouse.Click(mouse.Inside(), Qt::RightButton);
    EXPECT_FALSE(button->IsTracking());
    EXPECT_TRUE(window.messages.empty());
}

TEST(PlayButtonAlone, AButtonInNoWindowSendsNothing)
{
    RecordingWindow window;
    PlayButton button("play", Message(kMsgPlay), Message(kMsgPlayFromCursor), &window, 0);
    button.show();
    ButtonMouse{&button}.Click(QPoint(5, 5));
    EXPECT_TRUE(window.messages.empty());
}

TEST_F(PlayButtonTest, SetModeSendsNothing)
{
    button->SetMode(1);
    EXPECT_EQ(button->Mode(), 1);
    EXPECT_TRUE(window.messages.empty());
}

struct PictureCase {
    int32_t mode;
    bool enabled;
    bool pushed;
    const char* name;     // asked for
    const char* picture;  // shown; empty: nothing drawn
};

TEST_F(PlayButtonTest, EachStateShowsItsPictureOrNothing)
{
    const std::vector<PictureCase> cases = {
        {0, true, false, "ForwardFromBeginning-normal", "ForwardFromBeginning-normal"},
        {0, true, true, "ForwardFromBeginning-pushed", "ForwardFromBeginning-pushed"},
        {0, false, false, "ForwardFromBeginning-disabled", "ForwardFromBeginning-disabled"},
        // The backward pictures are not among the resources.
        {1, true, false, "BackwardFromBeginning-normal", ""},
        {1, true, true, "BackwardFromBeginning-pushed", ""},
        {1, false, false, "BackwardFromBeginning-disabled", ""},
        {2, true, false, "", ""},
        {-1, false, false, "", ""},
    };
    for (const PictureCase& state : cases) {
        SCOPED_TRACE(testing::Message() << "mode " << state.mode << (state.enabled ? "" : " disabled")
                                        << (state.pushed ? " pushed" : ""));
        button->SetEnabled(true);
        button->SetMode(state.mode);
        if (state.pushed)
            mouse.Press(mouse.Inside(), Qt::MiddleButton);
        button->SetEnabled(state.enabled);
        EXPECT_EQ(button->PictureName(), state.name);
        const QImage expected = *state.picture != '\0' ? ResourcePicture(state.picture) : HostOnly(button->size());
        ASSERT_FALSE(expected.isNull());
        EXPECT_EQ(host.Shown(button), expected);
        if (state.pushed)
            mouse.Release(mouse.Outside(), Qt::MiddleButton);
    }
}

}  // namespace
}  // namespace glimmet::test
