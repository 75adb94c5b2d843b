#include <gtest/gtest.h>

#include "TestDocument.h"
#include "edit/RemoveAction.h"
#include "edit/TruncateAction.h"

namespace glimmet {
namespace {

using test::DocumentState;
using test::Ramp;
using test::TestDocument;

TEST(RemoveActionTest, NameAndUnboundFailures)
{
    RemoveAction action(nullptr);
    EXPECT_STREQ(action.Name(), "Remove");
    EXPECT_STREQ(action.PreferredMenu(), "Tools");
    EXPECT_EQ(action.Go(), B_ERROR);
    EXPECT_EQ(action.Undo(), B_ERROR);
}

TEST(RemoveActionTest, RemoveLeavesNoRangeNoSelectionAndUndoGivesBothBack)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 20), 0, true);
    document.AddChannel(Ramp(100, 20), 0, false);
    document.AddChannel(Ramp(200, 20), 3, true);
    document.SetRange(5, 9);
    const DocumentState before = document.State();
    RemoveAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    const DocumentState after = document.State();
    EXPECT_EQ(after.rangeStart, -1);
    EXPECT_EQ(after.rangeEnd, -1);
    for (const auto& channel : after.channels)
        EXPECT_FALSE(channel.selected);
    std::vector<int16_t> first = Ramp(0, 5);
    const std::vector<int16_t> rest = Ramp(10, 10);
    first.insert(first.end(), rest.begin(), rest.end());
    EXPECT_EQ(after.channels[0].samples, first);
    EXPECT_EQ(after.channels[1].samples, before.channels[1].samples);
    EXPECT_EQ(after.channels[2].samples.size(), 15u);

    ASSERT_EQ(action.Undo(), B_OK);
    EXPECT_EQ(document.State(), before);
    ASSERT_EQ(action.Redo(), B_OK);
    EXPECT_EQ(document.State(), after);
}

TEST(RemoveActionTest, CutWithNoSelectedChannelKeepsTheRange)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 20), 0, false);
    document.SetRange(5, 9);
    const DocumentState before = document.State();
    RemoveAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    EXPECT_EQ(document.State(), before);
    ASSERT_EQ(action.Undo(), B_OK);
    EXPECT_EQ(document.State(), before);
}

TEST(TruncateActionTest, NameAndUnboundFailures)
{
    TruncateAction action(nullptr);
    EXPECT_STREQ(action.Name(), "Truncate");
    EXPECT_EQ(action.SetTo(nullptr, nullptr), B_BAD_VALUE);
    EXPECT_EQ(action.InitCheck(), B_NO_INIT);
    EXPECT_EQ(action.Go(), B_ERROR);
    EXPECT_EQ(action.Undo(), B_ERROR);
    EXPECT_EQ(action.Redo(), B_ERROR);
}

TEST(TruncateActionTest, KeepsOnlyTheRangeAndUndoRestores)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 20), 0, true);
    document.AddChannel(Ramp(100, 20), 0, false);
    document.SetRange(5, 9);
    const DocumentState before = document.State();
    TruncateAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    EXPECT_EQ(action.KeptChannelCount(), 1);
    EXPECT_EQ(action.SavedChannelCount(), 0);
    ASSERT_EQ(action.Go(), B_OK);
    DocumentState after = document.State();
    EXPECT_EQ(after.channels[0].samples, Ramp(5, 5));
    EXPECT_FALSE(after.channels[0].selected);
    EXPECT_EQ(after.channels[1], before.channels[1]);
    EXPECT_EQ(after.rangeStart, 5);
    EXPECT_EQ(after.rangeEnd, 9);

    ASSERT_EQ(action.Undo(), B_OK);
    EXPECT_EQ(document.State(), before);
    ASSERT_EQ(action.Redo(), B_OK);
    EXPECT_EQ(document.State(), after);
}

TEST(TruncateActionTest, ChannelStartingAfterTheRangeStartKeepsNoHead)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 30), 0, false);
    document.AddChannel(Ramp(100, 20), 8, true);
    document.SetRange(5, 15);
    const DocumentState before = document.State();
    TruncateAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    ASSERT_EQ(action.Undo(), B_OK);
    const DocumentState after = document.State();
    EXPECT_EQ(after.channels[1].first, 8);
    EXPECT_EQ(after.channels[1].samples, before.channels[1].samples);
    EXPECT_EQ(after, before);
}

}  // namespace
}  // namespace glimmet
