#include <gtest/gtest.h>

#include <QImage>

#include "TransportButtonTestSupport.h"
#include "support/MessageCodes.h"
#include "views/StopButton.h"

namespace glimmet::test {
namespace {

/// A stop button in a window, posting 'stop'.
class StopButtonTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        button->move(10, 5);
        host.Show();
    }

    RecordingWindow window;
    ButtonHost host;
    StopButton* button = new StopButton("stop", Message(kMsgStop), &window, &host);
    ButtonMouse mouse{button};
};

TEST_F(StopButtonTest, IsThirtyOneByTwentyOne)
{
    EXPECT_EQ(button->objectName(), "stop");
    EXPECT_EQ(button->size(), QSize(31, 21));
    EXPECT_EQ(button->minimumSize(), QSize(31, 21));
    EXPECT_EQ(button->maximumSize(), QSize(31, 21));
}

TEST_F(StopButtonTest, AClickSendsWhenAndSourceOnTheRelease)
{
    mouse.Press(mouse.Inside());
    EXPECT_TRUE(window.messages.empty());
    mouse.Release(mouse.Inside());
    ASSERT_EQ(window.messages.size(), 1u);
    const Message& message = window.messages[0];
    EXPECT_EQ(message.what, kMsgStop);
    EXPECT_TRUE(message.HasField(kFieldWhen));
    EXPECT_EQ(SourceOf(message), button);
    EXPECT_FALSE(message.HasField(kFieldMode));
}

TEST_F(StopButtonTest, APressInsideAndAReleaseOutsideSendsNothing)
{
    mouse.Press(mouse.Inside());
    mouse.Move(mouse.Outside());
    EXPECT_FALSE(button->IsPushed());
    EXPECT_TRUE(button->IsTracking());
    mouse.Release(mouse.Outside());
    EXPECT_FALSE(button->IsTracking());
    EXPECT_TRUE(window.messages.empty());
}

TEST_F(StopButtonTest, ADisabledButtonSendsNothing)
{
    button->SetEnabled(false);
    mouse.Click(mouse.Inside());
    EXPECT_TRUE(window.messages.empty());
}

TEST_F(StopButtonTest, EachStateShowsItsPicture)
{
    EXPECT_EQ(button->PictureName(), "Stopbutton-plain");
    EXPECT_EQ(host.Shown(button), ResourcePicture("Stopbutton-plain"));
    mouse.Press(mouse.Inside());
    EXPECT_EQ(button->PictureName(), "Stopbutton-pushed");
    EXPECT_EQ(host.Shown(button), ResourcePicture("Stopbutton-pushed"));
    mouse.Move(mouse.Outside());
    EXPECT_EQ(host.Shown(button), ResourcePicture("Stopbutton-plain"));
    mouse.Release(mouse.Outside());
    button->SetEnabled(false);
    EXPECT_EQ(button->PictureName(), "Stopbutton-disabled");
    EXPECT_EQ(host.Shown(button), ResourcePicture("Stopbutton-disabled"));
}

}  // namespace
}  // namespace glimmet::test
