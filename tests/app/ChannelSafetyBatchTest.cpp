#include "BatchTestSupport.h"

#include "sound/Channel.h"
#include "sound/ChannelManager.h"

// The history never reaches a channel that another file took the place of:
// a move, then another file opened into the same window, then undo.

namespace glimmet::test {
namespace {

TEST_F(BatchTest, UndoAfterAnotherFileWasOpenedLeavesTheNewDocumentAlone)
{
    const auto three = fixture_.MakeSound("three.wav", 3, 1000);
    const auto mono = fixture_.MakeSound("mono.wav", 1, 300);
    ASSERT_EQ(Run("open " + three.string() + "\nmove 0 500\n"), BatchRunner::kSucceeded);
    ASSERT_EQ(window_->Manager()->ChannelAt(0)->FirstFrame(), 500);
    ASSERT_EQ(Run("open " + mono.string() + "\nundo\nredo\nprint\n"), BatchRunner::kSucceeded) << Errors();
    ASSERT_EQ(window_->Manager()->CountChannels(), 1);
    EXPECT_EQ(window_->Manager()->ChannelAt(0)->FirstFrame(), 0);
    EXPECT_EQ(window_->Manager()->ChannelAt(0)->FrameCount(), 300);
    EXPECT_NE(LastState().find("\"undo\": null"), std::string::npos) << LastState();
}

TEST_F(BatchTest, UndoOfAMoveAfterItsChannelWasRemovedAndTheRemovalUndone)
{
    const auto file = fixture_.MakeSound("two.wav", 2, 200);
    ASSERT_EQ(Run("open " + file.string() + "\nmove 1 50\nfocus 1\nremc\nundo\nundo\n"), BatchRunner::kSucceeded)
        << Errors();
    ASSERT_EQ(window_->Manager()->CountChannels(), 2);
    EXPECT_EQ(window_->Manager()->ChannelAt(1)->FirstFrame(), 0) << "the channel came back and moved back";
}

// A move as far as a 64-bit offset goes ends at the latest first frame a
// channel can have; undo brings the channel back exactly, and the document's
// length follows without wrapping.
TEST_F(BatchTest, AMoveByAnAbsurdOffsetStopsAtTheLatestFirstFrame)
{
    const auto file = fixture_.MakeSound("two.wav", 2, 200);
    ASSERT_EQ(Run("open " + file.string() + "\nmove 1 9223372036854775000\nprint\n"), BatchRunner::kSucceeded)
        << Errors();
    EXPECT_EQ(window_->Manager()->ChannelAt(1)->FirstFrame(), Channel::kLastFirstFrame);
    EXPECT_EQ(window_->Manager()->FrameCount(), Channel::kLastFirstFrame + 200);
    ASSERT_EQ(Run("move 1 9223372036854775000\nmove 1 -9223372036854775807\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->Manager()->ChannelAt(1)->FirstFrame(), 0);
    ASSERT_EQ(Run("undo\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->Manager()->ChannelAt(1)->FirstFrame(), Channel::kLastFirstFrame);
    ASSERT_EQ(Run("undo\nundo\n"), BatchRunner::kSucceeded);
    EXPECT_EQ(window_->Manager()->ChannelAt(1)->FirstFrame(), 0);
    EXPECT_EQ(window_->Manager()->FrameCount(), 200);
}

}  // namespace
}  // namespace glimmet::test
