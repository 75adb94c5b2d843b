#include <gtest/gtest.h>

#include <QKeyEvent>

#include "ViewFixture.h"
#include "support/MessageCodes.h"

namespace glimmet::test {
namespace {

/// Records the key presses that a sample view passed on to its parent.
class KeyRecorder : public QObject {
public:
    explicit KeyRecorder(QObject* watched) { watched->installEventFilter(this); }
    std::vector<int> keys;

protected:
    bool eventFilter(QObject*, QEvent* event) override
    {
        if (event->type() == QEvent::KeyPress)
            keys.push_back(static_cast<QKeyEvent*>(event)->key());
        return false;
    }
};

class SampleViewKeys : public ::testing::Test {
protected:
    void SetUp() override
    {
        fixture.Add(MakeChannel(std::vector<int16_t>(1000, 0)));
        fixture.Show();
        fixture.window.messages.clear();
    }

    void Press(Qt::Key key, Qt::KeyboardModifiers modifiers = Qt::NoModifier, int64_t after = 100000)
    {
        ManualClock::Advance(after);
        QTest::keyClick(fixture.View(0), key, modifiers);
    }

    std::vector<uint32_t> Codes() const
    {
        std::vector<uint32_t> codes;
        for (const Message& message : fixture.window.messages)
            codes.push_back(message.what);
        return codes;
    }

    ViewFixture fixture{300, 150};
};

TEST_F(SampleViewKeys, SpaceTogglesPlaybackAndShiftSpacePlaysFromTheCursor)
{
    Press(Qt::Key_Space);
    Press(Qt::Key_Space, Qt::ShiftModifier);
    EXPECT_EQ(Codes(), (std::vector<uint32_t>{kMsgTogglePlay, kMsgPlayFromCursor}));
    for (const Message& message : fixture.window.messages)
        EXPECT_TRUE(message.IsEmpty());
}

TEST_F(SampleViewKeys, SecondSpaceWithin15MillisecondsIsIgnored)
{
    Press(Qt::Key_Space);
    Press(Qt::Key_Space, Qt::NoModifier, 10000);
    EXPECT_EQ(Codes(), (std::vector<uint32_t>{kMsgTogglePlay}));
    // The ignored key did not restart the gate: 20 ms after the first one
    // a key counts again.
    Press(Qt::Key_Space, Qt::NoModifier, 10000);
    EXPECT_EQ(Codes(), (std::vector<uint32_t>{kMsgTogglePlay, kMsgTogglePlay}));
}

TEST_F(SampleViewKeys, GateEndsJustAfter15Milliseconds)
{
    Press(Qt::Key_Space);
    Press(Qt::Key_Space, Qt::NoModifier, 15000);
    EXPECT_EQ(Codes().size(), 1u);
    Press(Qt::Key_Space, Qt::NoModifier, 1);
    EXPECT_EQ(Codes().size(), 2u);
}

TEST_F(SampleViewKeys, ArrowsAreSwallowed)
{
    KeyRecorder parent(fixture.container.get());
    Press(Qt::Key_Left);
    Press(Qt::Key_Right);
    Press(Qt::Key_Up);
    Press(Qt::Key_Down);
    EXPECT_TRUE(parent.keys.empty());
    EXPECT_TRUE(fixture.window.messages.empty());
}

TEST_F(SampleViewKeys, DeleteAsksToRemoveAndPassesTheKeyOn)
{
    KeyRecorder parent(fixture.container.get());
    Press(Qt::Key_Delete);
    EXPECT_EQ(Codes(), (std::vector<uint32_t>{kMsgRemove}));
    EXPECT_EQ(parent.keys, (std::vector<int>{Qt::Key_Delete}));
}

TEST_F(SampleViewKeys, OtherKeysArePassedOnAndStillGate)
{
    KeyRecorder parent(fixture.container.get());
    Press(Qt::Key_A);
    Press(Qt::Key_Space, Qt::NoModifier, 5000);
    EXPECT_EQ(parent.keys, (std::vector<int>{Qt::Key_A, Qt::Key_Space}));
    EXPECT_TRUE(fixture.window.messages.empty());
}

TEST_F(SampleViewKeys, KeyWithoutCharacterDoesNothingAndLeavesTheGate)
{
    KeyRecorder parent(fixture.container.get());
    Press(Qt::Key_Space);
    Press(Qt::Key_Shift, Qt::NoModifier, 20000);
    EXPECT_TRUE(parent.keys.empty());
    // The Shift key alone did not count as a handled key.
    Press(Qt::Key_Space, Qt::NoModifier, 1000);
    EXPECT_EQ(Codes(), (std::vector<uint32_t>{kMsgTogglePlay, kMsgTogglePlay}));
}

TEST_F(SampleViewKeys, ClickGivesFocusAndMovesTheFocusFrame)
{
    fixture.container->activateWindow();
    ASSERT_TRUE(QTest::qWaitForWindowActive(fixture.container.get()));
    EXPECT_FALSE(fixture.View(0)->IsFocus());
    ManualClock::Advance(1000000);
    QTest::mouseClick(fixture.View(0), Qt::LeftButton, Qt::NoModifier, QPoint(10, 10));
    EXPECT_TRUE(fixture.View(0)->IsFocus());
    DeliverPosted();
    const QImage image = fixture.container->grab().toImage();
    EXPECT_EQ(image.pixel(0, 10) & 0xffffff, 0x0000e5u);
}

}  // namespace
}  // namespace glimmet::test
