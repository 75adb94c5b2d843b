#include "edit/Action.h"

#include <gtest/gtest.h>

#include "TestDocument.h"

namespace glimmet {
namespace {

using test::DocumentState;
using test::TestDocument;

/// The base class with a Go that only counts, and sees the lock it runs under.
class CountingAction : public Action {
public:
    using Action::Action;

    status_t Go() override
    {
        goes++;
        return B_OK;
    }

    int goes = 0;
};

TEST(ActionTest, BaseDefaults)
{
    Action action(nullptr);
    EXPECT_STREQ(action.Name(), "Name of action goes here.");
    EXPECT_STREQ(action.PreferredMenu(), "Tools");
    EXPECT_FALSE(action.SupportsConfiguration());
    EXPECT_EQ(action.InitCheck(), B_NO_INIT);
    EXPECT_EQ(action.Go(), B_ERROR);
    EXPECT_EQ(action.Undo(), B_ERROR);
    EXPECT_EQ(action.Redo(), B_ERROR);
    EXPECT_EQ(action.FrameCount(), 0);
    EXPECT_EQ(action.SavedChannelCount(), 0);
}

TEST(ActionTest, SetToWithANullPointerFailsAndBindsNothing)
{
    TestDocument document;
    Action action(nullptr);
    EXPECT_EQ(action.SetTo(nullptr, &document.position), B_BAD_VALUE);
    EXPECT_EQ(action.SetTo(&document.manager, nullptr), B_BAD_VALUE);
    EXPECT_EQ(action.InitCheck(), B_NO_INIT);
    EXPECT_EQ(action.Manager(), nullptr);
}

TEST(ActionTest, SetToSnapshotsTheRangeOfTheSelectedChannels)
{
    TestDocument document;
    document.AddChannel({1, 2, 3, 4, 5}, 0, true);
    document.AddChannel({6, 7, 8, 9, 10}, 0, false);
    document.AddChannel({11, 12, 13, 14, 15}, 0, true);
    document.SetRange(1, 3);
    document.position.SetCursorFrame(4);
    Action action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    EXPECT_EQ(action.InitCheck(), B_OK);
    EXPECT_EQ(action.RangeStart(), 1);
    EXPECT_EQ(action.RangeEnd(), 3);
    EXPECT_EQ(action.Cursor(), 4);
    EXPECT_EQ(action.FrameCount(), 3);
    EXPECT_EQ(action.SavedChannelCount(), 2);
    EXPECT_EQ(action.SnapshotBytes(), 2 * 3 * 2);
}

TEST(ActionTest, UndoWritesTheSnapshotBackAndWalksTheSelection)
{
    TestDocument document;
    document.AddChannel({1, 2, 3, 4, 5}, 0, false);
    document.AddChannel({6, 7, 8, 9, 10}, 0, true);
    document.AddChannel({11, 12, 13, 14, 15}, 0, false);
    document.AddChannel({16, 17, 18, 19, 20}, 0, true);
    document.AddChannel({21, 22, 23, 24, 25}, 0, false);
    document.SetRange(1, 2);
    CountingAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    const DocumentState before = document.State();

    // Change data, selection and range behind the action's back.
    for (int32_t i = 0; i < 5; i++) {
        Channel* channel = document.manager.ChannelAt(i);
        const int16_t zeros[2] = {0, 0};
        channel->ReplaceFrames(zeros, 2, 1, 2);
        channel->SetSelected(i != 1);
    }
    document.SetRange(0, 0);

    ASSERT_EQ(action.Undo(), B_OK);
    DocumentState after = document.State();
    EXPECT_EQ(after.rangeStart, 1);
    EXPECT_EQ(after.rangeEnd, 2);
    // Recorded channels come back with their samples and selected.
    EXPECT_EQ(after.channels[1], before.channels[1]);
    EXPECT_EQ(after.channels[3], before.channels[3]);
    // Channels met before the last record are deselected; unrecorded data
    // is left as it was changed.
    EXPECT_FALSE(after.channels[0].selected);
    EXPECT_FALSE(after.channels[2].selected);
    EXPECT_EQ(after.channels[0].samples, (std::vector<int16_t>{1, 0, 0, 4, 5}));
    EXPECT_EQ(after.channels[2].samples, (std::vector<int16_t>{11, 0, 0, 14, 15}));
    // Channels after the last record keep their state.
    EXPECT_TRUE(after.channels[4].selected);
}

TEST(ActionTest, UndoWithoutSelectedChannelsOnlyResetsTheRange)
{
    TestDocument document;
    document.AddChannel({1, 2, 3}, 0, false);
    document.AddChannel({4, 5, 6}, 0, false);
    document.SetRange(0, 1);
    CountingAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    EXPECT_EQ(action.SavedChannelCount(), 0);
    EXPECT_EQ(action.SnapshotBytes(), 0);
    document.Select({true, true});
    document.SetRange(2, 2);
    ASSERT_EQ(action.Undo(), B_OK);
    const DocumentState after = document.State();
    EXPECT_EQ(after.rangeStart, 0);
    EXPECT_EQ(after.rangeEnd, 1);
    EXPECT_TRUE(after.channels[0].selected);
    EXPECT_TRUE(after.channels[1].selected);
}

TEST(ActionTest, RedoRestoresRangeAndSelectionThenRunsGo)
{
    TestDocument document;
    document.AddChannel({1, 2, 3}, 0, true);
    document.AddChannel({4, 5, 6}, 0, false);
    document.AddChannel({7, 8, 9}, 0, true);
    document.SetRange(0, 1);
    CountingAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    document.Select({false, true, false});
    document.SetRange(2, 2);
    const int16_t changed[2] = {100, 100};
    document.manager.ChannelAt(0)->ReplaceFrames(changed, 2, 0, 1);

    ASSERT_EQ(action.Redo(), B_OK);
    EXPECT_EQ(action.goes, 1);
    const DocumentState after = document.State();
    EXPECT_EQ(after.rangeStart, 0);
    EXPECT_EQ(after.rangeEnd, 1);
    EXPECT_TRUE(after.channels[0].selected);
    EXPECT_FALSE(after.channels[1].selected);
    EXPECT_TRUE(after.channels[2].selected);
    // Redo writes no samples of its own.
    EXPECT_EQ(after.channels[0].samples, (std::vector<int16_t>{100, 100, 3}));
}

TEST(ActionTest, BaseRedoReportsTheFailureOfTheBaseGo)
{
    TestDocument document;
    document.AddChannel({1, 2, 3});
    document.SetRange(0, 1);
    Action action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    EXPECT_EQ(action.Redo(), B_ERROR);
}

TEST(ActionTest, SnapshotOfARangePastTheDataHoldsSilence)
{
    TestDocument document;
    document.AddChannel({1, 2, 3}, 0, true);
    document.AddChannel({4, 5, 6, 7, 8, 9}, 0, false);
    document.SetRange(2, 5);
    CountingAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    EXPECT_EQ(action.SnapshotBytes(), 4 * 2);
    ASSERT_EQ(action.Undo(), B_OK);
    // The zeros read past the end are written back over the range.
    EXPECT_EQ(document.State().channels[0].samples, (std::vector<int16_t>{1, 2, 3, 0, 0, 0}));
}

}  // namespace
}  // namespace glimmet
