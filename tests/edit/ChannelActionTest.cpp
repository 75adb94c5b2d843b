#include <gtest/gtest.h>

#include "TestDocument.h"
#include "edit/AddChannelAction.h"
#include "edit/HistoryManager.h"
#include "edit/MoveSampleAction.h"
#include "edit/RemoveChannelAction.h"

namespace glimmet {
namespace {

using test::DocumentState;
using test::TestDocument;

TEST(AddChannelActionTest, NamesAndBinding)
{
    AddChannelAction action(nullptr);
    EXPECT_STREQ(action.Name(), "Add Channel");
    EXPECT_STREQ(action.PreferredMenu(), "Channel");
    EXPECT_EQ(action.Go(), B_ERROR);
    EXPECT_EQ(action.Undo(), B_ERROR);
    EXPECT_EQ(action.Redo(), B_ERROR);
    TestDocument document;
    EXPECT_EQ(action.SetTo(nullptr, &document.position), B_BAD_VALUE);
    EXPECT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    EXPECT_EQ(action.SavedChannelCount(), 0);
}

TEST(AddChannelActionTest, AppendsAnEmptyChannelAndAnnouncesIt)
{
    TestDocument document;
    document.AddChannel({1, 2, 3});
    AddChannelAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    ASSERT_EQ(document.manager.CountChannels(), 2);
    Channel* added = document.manager.ChannelAt(1);
    EXPECT_EQ(added, action.AddedChannel());
    EXPECT_EQ(added->FrameCount(), 0);
    EXPECT_EQ(document.mirror.Count(), 2);
    EXPECT_EQ(document.mirror.shown[1], added);

    ASSERT_EQ(action.Undo(), B_OK);
    EXPECT_EQ(document.manager.CountChannels(), 1);
    EXPECT_EQ(document.mirror.Count(), 1);

    ASSERT_EQ(action.Redo(), B_OK);
    EXPECT_EQ(document.manager.ChannelAt(1), added);
    EXPECT_EQ(document.mirror.Count(), 2);
}

TEST(AddChannelActionTest, AddUndoAndDeleteHistoryDeletesTheChannel)
{
    // LeakSanitizer checks that the channel is freed; the document no
    // longer knows it.
    TestDocument document;
    HistoryManager history;
    auto* action = new AddChannelAction(nullptr);
    ASSERT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
    std::unique_ptr<Action> owned(action);
    ASSERT_EQ(history.AddAction(owned), B_OK);
    ASSERT_EQ(action->Go(), B_OK);
    ASSERT_EQ(history.Undo(), B_OK);
    history.Clear();
    EXPECT_EQ(document.manager.CountChannels(), 0);
}

TEST(AddChannelActionTest, AddUndoRedoAndDeleteHistoryKeepsTheChannel)
{
    TestDocument document;
    HistoryManager history;
    auto* action = new AddChannelAction(nullptr);
    ASSERT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
    std::unique_ptr<Action> owned(action);
    ASSERT_EQ(history.AddAction(owned), B_OK);
    ASSERT_EQ(action->Go(), B_OK);
    Channel* added = action->AddedChannel();
    ASSERT_EQ(history.Undo(), B_OK);
    ASSERT_EQ(history.Redo(), B_OK);
    history.Clear();
    ASSERT_EQ(document.manager.CountChannels(), 1);
    EXPECT_EQ(document.manager.ChannelAt(0), added);
    // Still a live channel (AddressSanitizer would catch a freed one).
    const int16_t samples[2] = {5, 6};
    EXPECT_EQ(added->InsertFrames(samples, 2, 0), B_OK);
    EXPECT_EQ(added->FrameCount(), 2);
}

TEST(AddChannelActionTest, AddThenUndoneAddDiscardedByANewActionFreesIt)
{
    TestDocument document;
    HistoryManager history;
    auto* first = new AddChannelAction(nullptr);
    ASSERT_EQ(first->SetTo(&document.manager, &document.position), B_OK);
    std::unique_ptr<Action> ownedFirst(first);
    ASSERT_EQ(history.AddAction(ownedFirst), B_OK);
    ASSERT_EQ(first->Go(), B_OK);
    ASSERT_EQ(history.Undo(), B_OK);
    auto* second = new AddChannelAction(nullptr);
    ASSERT_EQ(second->SetTo(&document.manager, &document.position), B_OK);
    std::unique_ptr<Action> ownedSecond(second);
    ASSERT_EQ(history.AddAction(ownedSecond), B_OK);
    ASSERT_EQ(second->Go(), B_OK);
    EXPECT_EQ(document.manager.CountChannels(), 1);
    EXPECT_EQ(history.RedoName(), nullptr);
}

TEST(RemoveChannelActionTest, NamesAndBinding)
{
    RemoveChannelAction action(nullptr);
    EXPECT_STREQ(action.Name(), "Remove Channel");
    EXPECT_STREQ(action.PreferredMenu(), "Channel");
    EXPECT_EQ(action.Go(), B_ERROR);
    EXPECT_EQ(action.Undo(), B_ERROR);
    EXPECT_EQ(action.Redo(), B_ERROR);
    TestDocument document;
    EXPECT_EQ(action.SetTo(&document.manager, nullptr), B_BAD_VALUE);
}

TEST(RemoveChannelActionTest, RemovesTheFocusedChannelAndUndoPutsItBack)
{
    TestDocument document;
    document.AddChannel({1, 2});
    document.AddChannel({3, 4});
    document.AddChannel({5, 6});
    document.position.SetFocusIndex(1);
    const DocumentState before = document.State();
    Channel* middle = document.manager.ChannelAt(1);
    RemoveChannelAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    EXPECT_EQ(action.Index(), 1);
    EXPECT_EQ(action.RemovedChannel(), middle);
    ASSERT_EQ(document.manager.CountChannels(), 2);
    EXPECT_EQ(document.mirror.Count(), 2);
    EXPECT_EQ(document.State().channels[1].samples, (std::vector<int16_t>{5, 6}));

    ASSERT_EQ(action.Undo(), B_OK);
    EXPECT_EQ(document.State(), before);
    EXPECT_EQ(document.manager.ChannelAt(1), middle);
    EXPECT_EQ(document.mirror.shown[1], middle);

    ASSERT_EQ(action.Redo(), B_OK);
    EXPECT_EQ(document.manager.CountChannels(), 2);
    EXPECT_EQ(document.manager.IndexOf(middle), -1);
}

TEST(RemoveChannelActionTest, WithoutAFocusedViewNothingHappensAndUndoIsHarmless)
{
    TestDocument document;
    document.AddChannel({1, 2});
    document.AddChannel({3, 4});
    const DocumentState before = document.State();
    HistoryManager history;
    auto* action = new RemoveChannelAction(nullptr);
    ASSERT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
    std::unique_ptr<Action> owned(action);
    ASSERT_EQ(history.AddAction(owned), B_OK);
    ASSERT_EQ(action->Go(), B_OK);
    EXPECT_EQ(document.State(), before);
    EXPECT_STREQ(history.UndoName(), "Remove Channel");
    EXPECT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(document.State(), before);
    EXPECT_EQ(document.mirror.Count(), 2);
    EXPECT_EQ(history.Redo(), B_OK);
    EXPECT_EQ(document.State(), before);
}

TEST(RemoveChannelActionTest, RemovedChannelIsFreedWithTheHistory)
{
    // LeakSanitizer checks that the channel outside the document is freed.
    TestDocument document;
    document.AddChannel({1, 2});
    document.position.SetFocusIndex(0);
    HistoryManager history;
    auto* action = new RemoveChannelAction(nullptr);
    ASSERT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
    std::unique_ptr<Action> owned(action);
    ASSERT_EQ(history.AddAction(owned), B_OK);
    ASSERT_EQ(action->Go(), B_OK);
    history.Clear();
    EXPECT_EQ(document.manager.CountChannels(), 0);
}

TEST(MoveSampleActionTest, BindingAndNames)
{
    MoveSampleAction action(nullptr);
    EXPECT_STREQ(action.Name(), "Move Sample");
    EXPECT_STREQ(action.PreferredMenu(), "");
    EXPECT_EQ(action.InitCheck(), B_ERROR);
    EXPECT_EQ(action.Undo(), B_ERROR);
    EXPECT_EQ(action.Redo(), B_ERROR);
    TestDocument document;
    EXPECT_EQ(action.SetTo(&document.manager, &document.position), B_ERROR);
    Channel* channel = document.AddChannel({1, 2, 3});
    EXPECT_EQ(action.SetTo(&document.manager, nullptr, 5), B_BAD_VALUE);
    EXPECT_EQ(action.SetTo(nullptr, channel, 5), B_BAD_VALUE);
    EXPECT_EQ(action.SetTo(&document.manager, channel, 5), B_OK);
    EXPECT_EQ(action.InitCheck(), B_OK);
    EXPECT_EQ(action.Go(), B_OK);
}

TEST(MoveSampleActionTest, UndoThenRedoRestoresTheDraggedPosition)
{
    TestDocument document;
    Channel* channel = document.AddChannel({1, 2, 3});
    // The drag moved the channel from frame 0 to frame 40.
    channel->SetStartFrameOffset(40);
    HistoryManager history;
    auto* action = new MoveSampleAction(nullptr);
    ASSERT_EQ(action->SetTo(&document.manager, channel, 0 - 40), B_OK);
    std::unique_ptr<Action> owned(action);
    ASSERT_EQ(history.AddAction(owned), B_OK);
    ASSERT_EQ(action->Go(), B_OK);
    EXPECT_EQ(channel->FirstFrame(), 40);

    ASSERT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(channel->FirstFrame(), 0);
    EXPECT_EQ(document.mirror.updates[0], 1);
    // A second undo in a row is impossible: the move is on the redo stack.
    EXPECT_EQ(history.Undo(), B_ERROR);
    EXPECT_EQ(channel->FirstFrame(), 0);

    ASSERT_EQ(history.Redo(), B_OK);
    EXPECT_EQ(channel->FirstFrame(), 40);
    EXPECT_EQ(document.mirror.updates[0], 2);
}

}  // namespace
}  // namespace glimmet
