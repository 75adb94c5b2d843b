#include <gtest/gtest.h>

#include <cstdint>
#include <memory>

#include "TestDocument.h"
#include "edit/AddChannelAction.h"
#include "edit/HistoryManager.h"
#include "edit/MoveSampleAction.h"
#include "edit/RemoveChannelAction.h"
#include "sound/Channel.h"

// Actions that name a channel must never reach one that has left the
// document by a path the history did not take part in: the document replaced
// by an opened file, a channel removed directly, the history cleared. These
// run under AddressSanitizer in CI, where a stale pointer is a report.

namespace glimmet {
namespace {

using test::TestDocument;

std::unique_ptr<Action> BoundMove(TestDocument& document, Channel* channel, int64_t offset)
{
    auto action = std::make_unique<MoveSampleAction>(nullptr);
    EXPECT_EQ(action->SetTo(&document.manager, channel, offset), B_OK);
    return action;
}

TEST(ChannelLifetimeTest, UndoOfAMoveWhoseChannelWasDeletedFailsAndIsDropped)
{
    TestDocument document;
    document.AddChannel({1, 2, 3});
    Channel* moved = document.AddChannel({4, 5, 6}, 500);
    HistoryManager history;
    std::unique_ptr<Action> move = BoundMove(document, moved, -500);
    ASSERT_EQ(history.AddAction(move), B_OK);
    // The document loses every channel, as when another file is opened into
    // the window, and gets a new one.
    while (document.manager.CountChannels() > 0)
        ASSERT_TRUE(document.manager.RemoveChannelAt(0));
    Channel* fresh = document.AddChannel({7, 8}, 20);
    EXPECT_NE(history.Undo(), B_OK);
    EXPECT_EQ(history.UndoName(), nullptr) << "the failed move is dropped";
    EXPECT_EQ(history.RedoName(), nullptr);
    EXPECT_EQ(fresh->FirstFrame(), 20);
    EXPECT_EQ(document.manager.CountChannels(), 1);
}

TEST(ChannelLifetimeTest, AChannelAtTheSameAddressIsNotTheMovedOne)
{
    TestDocument document;
    Channel* moved = document.AddChannel({4, 5, 6}, 100);
    std::unique_ptr<Action> move = BoundMove(document, moved, 40);
    ASSERT_TRUE(document.manager.RemoveChannelAt(0));
    // Likely to reuse the freed memory; found by address it would be moved.
    for (int i = 0; i < 4; i++)
        document.AddChannel({1}, 7);
    EXPECT_EQ(move->Undo(), B_ERROR);
    EXPECT_EQ(move->Redo(), B_ERROR);
    for (int32_t i = 0; i < document.manager.CountChannels(); i++)
        EXPECT_EQ(document.manager.ChannelAt(i)->FirstFrame(), 7);
}

TEST(ChannelLifetimeTest, MoveStillFollowsItsChannelToAnotherPosition)
{
    TestDocument document;
    Channel* first = document.AddChannel({1, 2}, 10);
    document.AddChannel({3, 4}, 0);
    std::unique_ptr<Action> move = BoundMove(document, first, 5);
    // Another channel goes in front of it: the move finds it where it is.
    document.manager.AddChannel(std::make_unique<Channel>(), 0);
    ASSERT_EQ(move->Undo(), B_OK);
    EXPECT_EQ(document.manager.ChannelAt(1)->FirstFrame(), 15);
    EXPECT_EQ(document.manager.ChannelAt(2)->FirstFrame(), 0);
    ASSERT_EQ(move->Redo(), B_OK);
    EXPECT_EQ(document.manager.ChannelAt(1)->FirstFrame(), 10);
}

TEST(ChannelLifetimeTest, UndoOfAnAddWhoseChannelIsGoneTakesNothingOut)
{
    TestDocument document;
    document.AddChannel({1, 2, 3});
    AddChannelAction add(nullptr);
    ASSERT_EQ(add.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(add.Go(), B_OK);
    ASSERT_NE(add.AddedChannel(), nullptr);
    ASSERT_TRUE(document.manager.RemoveChannelAt(1));
    EXPECT_EQ(add.AddedChannel(), nullptr);
    document.AddChannel({9});
    ASSERT_EQ(add.Undo(), B_OK);
    EXPECT_EQ(document.manager.CountChannels(), 2) << "the other channel stays";
    ASSERT_EQ(add.Redo(), B_OK);
    EXPECT_EQ(document.manager.CountChannels(), 2);
}

TEST(ChannelLifetimeTest, ChannelsHeldByTheHistoryGoWithIt)
{
    TestDocument document;
    document.AddChannel({1, 2, 3});
    document.AddChannel({4, 5, 6});
    document.position.SetFocusIndex(0);
    HistoryManager history;
    std::unique_ptr<Action> remove = std::make_unique<RemoveChannelAction>(nullptr);
    ASSERT_EQ(remove->SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(remove->Go(), B_OK);
    ASSERT_EQ(history.AddAction(remove), B_OK);
    std::unique_ptr<Action> add = std::make_unique<AddChannelAction>(nullptr);
    ASSERT_EQ(add->SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(add->Go(), B_OK);
    ASSERT_EQ(history.AddAction(add), B_OK);
    ASSERT_EQ(history.Undo(), B_OK);  // the added channel now belongs to the action
    ASSERT_EQ(document.manager.CountChannels(), 1);
    // Clearing frees both held channels (the leak checker would report them
    // otherwise) and touches none of the document's.
    history.Clear();
    ASSERT_EQ(document.manager.CountChannels(), 1);
    EXPECT_EQ(document.manager.ChannelAt(0)->FrameCount(), 3);
}

TEST(ChannelLifetimeTest, ShiftsSaturateAtTheTimelinesEnds)
{
    TestDocument document;
    Channel* channel = document.AddChannel({1, 2}, 10);
    std::unique_ptr<Action> far = BoundMove(document, channel, INT64_MIN);
    ASSERT_EQ(far->Redo(), B_OK);  // moves by -offset, which does not fit
    EXPECT_EQ(channel->FirstFrame(), Channel::kLastFirstFrame);
    ASSERT_EQ(far->Undo(), B_OK);
    EXPECT_EQ(channel->FirstFrame(), 0);
    channel->SetStartFrameOffset(INT64_MAX);
    EXPECT_EQ(channel->FirstFrame(), Channel::kLastFirstFrame);
    EXPECT_EQ(channel->EndFrame(), Channel::kLastFirstFrame + 2);
}

TEST(ChannelLifetimeTest, IdsAreNeverShared)
{
    Channel a;
    Channel b;
    EXPECT_NE(a.Id(), 0u);
    EXPECT_NE(a.Id(), b.Id());
    auto c = std::make_unique<Channel>();
    const uint64_t old = c->Id();
    c = std::make_unique<Channel>();
    EXPECT_NE(c->Id(), old);
}

}  // namespace
}  // namespace glimmet
