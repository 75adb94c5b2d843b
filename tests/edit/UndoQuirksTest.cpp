#include <gtest/gtest.h>

#include <memory>
#include <vector>

#include "TestDocument.h"
#include "edit/CopyBuffer.h"
#include "edit/FadeInAction.h"
#include "edit/HistoryManager.h"
#include "edit/PasteAction.h"
#include "edit/RemoveAction.h"
#include "edit/TruncateAction.h"
#include "sound/Channel.h"

// Sequences after which undoing everything does not give the original
// document back, because the edits' own rules say so, and the one where it
// now does. Each test is named for what the document does.

namespace glimmet {
namespace {

using test::DocumentState;
using test::Ramp;
using test::TestDocument;

template <typename ActionType>
std::unique_ptr<Action> Perform(TestDocument& document, HistoryManager& history)
{
    std::unique_ptr<Action> action = std::make_unique<ActionType>(nullptr);
    EXPECT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
    Action* raw = action.get();
    EXPECT_EQ(history.AddAction(action), B_OK);
    raw->Go();
    return action;
}

TEST(UndoQuirksTest, AnEmptyPasteOverARangeUndoesToTheSameDocument)
{
    TestDocument document;
    document.AddChannel(Ramp(1, 10), 0, true);
    document.AddChannel(Ramp(50, 10), 0, true);
    document.SetRange(2, 5);
    document.position.SetCursorFrame(7);
    const DocumentState before = document.State();
    CopyBuffer empty;
    HistoryManager history;
    std::unique_ptr<Action> paste = std::make_unique<PasteAction>(nullptr, &empty);
    ASSERT_EQ(paste->SetTo(&document.manager, &document.position), B_OK);
    Action* raw = paste.get();
    ASSERT_EQ(history.AddAction(paste), B_OK);
    ASSERT_EQ(raw->Go(), B_OK);
    EXPECT_EQ(document.State(), before) << "nothing to paste";
    ASSERT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(document.State(), before) << "and nothing to take back";
    ASSERT_EQ(history.Redo(), B_OK);
    ASSERT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(document.State(), before);
}

TEST(UndoQuirksTest, RemoveWithNoRangeThenUndoPutsASilentFrameBeforeFrameZero)
{
    TestDocument document;
    document.AddChannel(Ramp(1, 4), 0, true);
    document.AddChannel(Ramp(9, 4), 0, true);
    HistoryManager history;
    Perform<RemoveAction>(document, history);
    ASSERT_EQ(history.Undo(), B_OK);
    // The snapshot of the range -1..-1 is one frame of silence, which undo
    // inserts at frame -1: in front of the data, so the channel starts
    // there, and the one-frame gap between -1 and the old start moves right
    // with the data.
    for (int32_t i = 0; i < 2; i++) {
        Channel* channel = document.manager.ChannelAt(i);
        EXPECT_EQ(channel->FirstFrame(), -1);
        EXPECT_EQ(channel->FrameCount(), 6);
    }
    EXPECT_EQ(document.State().channels[0].samples, (std::vector<int16_t>{0, 0, 1, 2, 3, 4}));
    EXPECT_EQ(document.State().channels[1].samples, (std::vector<int16_t>{0, 0, 9, 10, 11, 12}));
}

TEST(UndoQuirksTest, FadeInFromBeforeAMovedChannelLengthensItAndUndoKeepsTheLength)
{
    TestDocument document;
    document.AddChannel(std::vector<int16_t>(10, 1000), 20, true);
    document.SetRange(10, 24);
    HistoryManager history;
    Perform<FadeInAction>(document, history);
    Channel* channel = document.manager.ChannelAt(0);
    EXPECT_EQ(channel->FirstFrame(), 10) << "the faded range starts the channel now";
    EXPECT_EQ(channel->FrameCount(), 20);
    ASSERT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(channel->FirstFrame(), 10);
    EXPECT_EQ(channel->FrameCount(), 20);
    std::vector<int16_t> expected(10, 0);
    expected.insert(expected.end(), 10, 1000);
    EXPECT_EQ(document.State().channels[0].samples, expected) << "the silence before the data stays";
}

TEST(UndoQuirksTest, FadeInAfterTruncateThenBothUndoneLeavesTheChannelLonger)
{
    TestDocument document;
    document.AddChannel(Ramp(1, 100), 0, true);
    document.SetRange(25, 74);
    HistoryManager history;
    Perform<TruncateAction>(document, history);
    // Truncate cut from frame 0, so the kept frames now start at 0 while the
    // range still stands at 25..74.
    ASSERT_EQ(document.manager.ChannelAt(0)->FrameCount(), 50);
    document.manager.ChannelAt(0)->SetSelected(true);
    Perform<FadeInAction>(document, history);
    EXPECT_EQ(document.manager.ChannelAt(0)->FrameCount(), 75) << "the fade reached past the data";
    ASSERT_EQ(history.Undo(), B_OK);
    ASSERT_EQ(history.Undo(), B_OK);
    Channel* channel = document.manager.ChannelAt(0);
    EXPECT_EQ(channel->FirstFrame(), 0);
    EXPECT_EQ(channel->FrameCount(), 125);
    const std::vector<int16_t> samples = document.State().channels[0].samples;
    // Head and kept frames come back in order; the silence the fade left
    // sits before the tail that undo puts back after the range.
    EXPECT_EQ(std::vector<int16_t>(samples.begin(), samples.begin() + 75), Ramp(1, 75));
    EXPECT_EQ(std::vector<int16_t>(samples.begin() + 75, samples.begin() + 100), Ramp(76, 25));
    EXPECT_EQ(std::vector<int16_t>(samples.begin() + 100, samples.end()), std::vector<int16_t>(25, 0));
}

TEST(UndoQuirksTest, PasteOverARangeWithTheCursorElsewhereUndoesUpToTheCursorsEnd)
{
    TestDocument document;
    document.AddChannel(Ramp(1, 20), 0, true);
    document.SetRange(2, 5);
    document.position.SetCursorFrame(10);
    std::vector<CopyBuffer::Samples> arrays;
    arrays.emplace_back(new int16_t[3]{-1, -2, -3});
    CopyBuffer buffer;
    ASSERT_TRUE(buffer.SetCopyBuffer(std::move(arrays), 3));
    HistoryManager history;
    std::unique_ptr<Action> paste = std::make_unique<PasteAction>(nullptr, &buffer);
    ASSERT_EQ(paste->SetTo(&document.manager, &document.position), B_OK);
    Action* raw = paste.get();
    ASSERT_EQ(history.AddAction(paste), B_OK);
    ASSERT_EQ(raw->Go(), B_OK);
    // Frames 2..5 became the three pasted ones: 19 frames.
    ASSERT_EQ(document.manager.ChannelAt(0)->FrameCount(), 19);
    ASSERT_EQ(history.Undo(), B_OK);
    // Undo replaces 2..12 (from the range start to the cursor plus the
    // pasted length) with the four saved frames: the eight frames after the
    // pasted ones (7 to 14) are gone.
    EXPECT_EQ(document.manager.ChannelAt(0)->FrameCount(), 12);
    std::vector<int16_t> expected = Ramp(1, 6);
    const std::vector<int16_t> after = Ramp(15, 6);
    expected.insert(expected.end(), after.begin(), after.end());
    EXPECT_EQ(document.State().channels[0].samples, expected);
}

}  // namespace
}  // namespace glimmet
