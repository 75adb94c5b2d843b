#include <gtest/gtest.h>

#include <QAction>

#include "AppTestSupport.h"
#include "app/MenuTable.h"
#include "edit/HistoryManager.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/MessageCodes.h"
#include "views/ChannelContainerView.h"
#include "views/SampleView.h"

namespace glimmet::test {
namespace {

QuillexWindow* LoadedWindow(AppFixture& fixture, int channels, int frames)
{
    QuillexWindow* window = fixture.App().NewWindow();
    window->LockWindow();
    window->SetTo(fixture.MakeSound("edit.wav", channels, frames));
    window->UnlockWindow();
    Drain();
    return window;
}

TEST(EditCommands, CutWithNoSelectedChannelStillSetsUpTheRemove)
{
    AppFixture fixture;
    QuillexWindow* window = LoadedWindow(fixture, 1, 100);
    window->Manager()->SetRangeStart(10);
    window->Manager()->SetRangeEnd(19);
    window->PostMessage(kMsgCut);
    Drain();
    std::vector<const int16_t*> channels;
    int32_t count = 0;
    int64_t frames = 0;
    EXPECT_FALSE(fixture.App().GetCopyBuffer(channels, count, frames));
    EXPECT_STREQ(window->History()->UndoName(), "Remove");
    EXPECT_EQ(window->Manager()->ChannelAt(0)->FrameCount(), 100);
}

TEST(EditCommands, CutCopiesThenRemovesAndPasteInAnotherWindowUsesIt)
{
    AppFixture fixture;
    QuillexWindow* source = LoadedWindow(fixture, 1, 100);
    source->PostMessage(kMsgSelectAll);
    Drain();
    source->Manager()->SetRangeStart(10);
    source->Manager()->SetRangeEnd(19);
    source->PostMessage(kMsgCut);
    Drain();
    EXPECT_EQ(source->Manager()->ChannelAt(0)->FrameCount(), 90);
    EXPECT_EQ(source->MenuItem(KeptMenuItem::Undo)->text(), "Undo Remove");

    QuillexWindow* target = LoadedWindow(fixture, 1, 50);
    target->PostMessage(kMsgSelectAll);
    Drain();
    target->ContainerView()->SetCursorFrame(0);
    target->Manager()->SetRangeStart(-1);
    target->Manager()->SetRangeEnd(-1);
    target->PostMessage(kMsgPaste);
    Drain();
    EXPECT_STREQ(target->History()->UndoName(), "Paste");
    EXPECT_EQ(target->Manager()->ChannelAt(0)->FrameCount(), 60);
}

TEST(EditCommands, RemoveAndTruncateAreRecorded)
{
    AppFixture fixture;
    QuillexWindow* window = LoadedWindow(fixture, 1, 100);
    window->PostMessage(kMsgSelectAll);
    Drain();
    window->Manager()->SetRangeStart(0);
    window->Manager()->SetRangeEnd(9);
    window->PostMessage(kMsgRemove);
    Drain();
    EXPECT_EQ(window->Manager()->ChannelAt(0)->FrameCount(), 90);
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Undo)->text(), "Undo Remove");
    window->PostMessage(kMsgTruncate);
    Drain();
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Undo)->text(), "Undo Truncate");
}

TEST(EditCommands, ChannelAddAndRemove)
{
    AppFixture fixture;
    QuillexWindow* window = LoadedWindow(fixture, 1, 100);
    window->PostMessage(kMsgAddChannel);
    Drain();
    EXPECT_EQ(window->Manager()->CountChannels(), 2);
    EXPECT_EQ(window->ContainerView()->CountChannelViews(), 2);
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Undo)->text(), "Undo Add Channel");
    // Without a focused strip the removal has nothing to take, but it is
    // recorded all the same.
    window->PostMessage(kMsgRemoveChannel);
    Drain();
    EXPECT_EQ(window->Manager()->CountChannels(), 2);
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Undo)->text(), "Undo Remove Channel");
    window->PostMessage(kMsgUndo);
    window->PostMessage(kMsgUndo);
    Drain();
    EXPECT_EQ(window->Manager()->CountChannels(), 1);
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Redo)->text(), "Redo Add Channel");
}

TEST(EditCommands, AFinishedMoveBecomesAnUndoableMove)
{
    AppFixture fixture;
    QuillexWindow* window = LoadedWindow(fixture, 1, 100);
    Channel* channel = window->Manager()->ChannelAt(0);
    SampleView* view = window->ContainerView()->SampleViewAtIndex(0);
    channel->SetStartFrameOffset(40);  // where the drag left it
    Message moved(kMsgSampleMoved);
    moved.AddPointer("channel", channel);
    moved.AddPointer("sample view", view);
    moved.AddInt64("offset", -40);
    window->PostMessage(moved);
    Drain();
    EXPECT_STREQ(window->History()->UndoName(), "Move Sample");
    EXPECT_EQ(window->MenuItem(KeptMenuItem::Undo)->text(), "Undo Move Sample");
}

TEST(EditCommands, AMoveMessageMissingAFieldIsIgnored)
{
    AppFixture fixture;
    QuillexWindow* window = LoadedWindow(fixture, 1, 100);
    Message moved(kMsgSampleMoved);
    moved.AddPointer("channel", window->Manager()->ChannelAt(0));
    moved.AddInt64("offset", 5);
    window->PostMessage(moved);
    Drain();
    EXPECT_EQ(window->History()->UndoName(), nullptr);
    EXPECT_EQ(window->Manager()->ChannelAt(0)->FirstFrame(), 0);
}

}  // namespace
}  // namespace glimmet::test
