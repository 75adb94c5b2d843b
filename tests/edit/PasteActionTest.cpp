#include "edit/PasteAction.h"

#include <gtest/gtest.h>

#include <thread>

#include "TestDocument.h"
#include "edit/CopyBuffer.h"
#include "edit/HistoryManager.h"
#include "edit/SelectionCopier.h"

namespace glimmet {
namespace {

using test::DocumentState;
using test::Ramp;
using test::TestDocument;

/// One copy buffer per test, the one every action of the test pastes from.
class PasteActionTest : public ::testing::Test {
protected:
    void Copy(const std::vector<std::vector<int16_t>>& channels)
    {
        std::vector<CopyBuffer::Samples> arrays;
        for (const auto& samples : channels) {
            arrays.emplace_back(new int16_t[samples.size()]);
            std::copy(samples.begin(), samples.end(), arrays.back().get());
        }
        ASSERT_TRUE(copyBuffer.SetCopyBuffer(std::move(arrays), int64_t(channels[0].size())));
    }

    /// The window's copy command: the range of every selected channel into
    /// the buffer.
    void CopyFrom(TestDocument& document)
    {
        ASSERT_TRUE(SelectionCopier::CopySelection(document.manager, copyBuffer));
    }

    std::unique_ptr<PasteAction> Bound(TestDocument& document)
    {
        auto action = std::make_unique<PasteAction>(nullptr, &copyBuffer);
        EXPECT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
        return action;
    }

    CopyBuffer copyBuffer;
};

TEST_F(PasteActionTest, NameAndMenu)
{
    PasteAction action(nullptr, &copyBuffer);
    EXPECT_STREQ(action.Name(), "Paste");
    EXPECT_STREQ(action.PreferredMenu(), "Tools");
    EXPECT_FALSE(action.SupportsConfiguration());
    EXPECT_EQ(action.Go(), B_ERROR);
    EXPECT_EQ(action.Undo(), B_ERROR);
}

TEST_F(PasteActionTest, ReplacingARangeOf100With40FramesShortensAndUndoRestores)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 300), 0, true);
    document.AddChannel(Ramp(1000, 300), 0, false);
    document.SetRange(100, 199);
    document.position.SetCursorFrame(100);
    const DocumentState before = document.State();
    Copy({Ramp(-500, 40)});
    auto action = Bound(document);
    ASSERT_EQ(action->Go(), B_OK);
    DocumentState after = document.State();
    std::vector<int16_t> expected = Ramp(0, 100);
    const std::vector<int16_t> pasted = Ramp(-500, 40);
    expected.insert(expected.end(), pasted.begin(), pasted.end());
    const std::vector<int16_t> tail = Ramp(200, 100);
    expected.insert(expected.end(), tail.begin(), tail.end());
    EXPECT_EQ(after.channels[0].samples, expected);
    EXPECT_EQ(after.channels[0].samples.size(), 240u);
    EXPECT_EQ(after.channels[1], before.channels[1]);
    EXPECT_EQ(action->PasteStart(), 100);
    EXPECT_EQ(action->PasteEnd(), 139);
    EXPECT_EQ(after.rangeStart, 100);
    EXPECT_EQ(after.rangeEnd, 139);
    EXPECT_TRUE(after.channels[0].selected);

    ASSERT_EQ(action->Undo(), B_OK);
    EXPECT_EQ(document.State(), before);
    EXPECT_EQ(document.manager.CurrentFrame(), 100);
}

TEST_F(PasteActionTest, ReplacingWithALongerBufferGrowsAndUndoRestores)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 300), 0, true);
    document.SetRange(50, 59);
    document.position.SetCursorFrame(50);
    const DocumentState before = document.State();
    Copy({Ramp(-100, 25)});
    auto action = Bound(document);
    ASSERT_EQ(action->Go(), B_OK);
    EXPECT_EQ(document.State().channels[0].samples.size(), 315u);
    EXPECT_EQ(document.State().channels[0].samples[50], -100);
    EXPECT_EQ(document.State().channels[0].samples[74], -76);
    EXPECT_EQ(document.State().channels[0].samples[75], 60);
    ASSERT_EQ(action->Undo(), B_OK);
    EXPECT_EQ(document.State(), before);
}

TEST_F(PasteActionTest, PasteEndCountsFromTheStoredCursor)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 300), 0, true);
    document.SetRange(100, 199);
    document.position.SetCursorFrame(20);
    Copy({Ramp(-500, 40)});
    auto action = Bound(document);
    document.position.SetCursorFrame(250);  // later moves do not count
    ASSERT_EQ(action->Go(), B_OK);
    EXPECT_EQ(action->PasteStart(), 100);
    EXPECT_EQ(action->PasteEnd(), 59);
    // An end before the start pulls the manager's start along.
    EXPECT_EQ(document.manager.RangeEnd(), 59);
    EXPECT_EQ(document.manager.RangeStart(), 59);
}

TEST_F(PasteActionTest, WithoutARangeInsertsAtTheCursorIntoTheFocusedChannelAndThoseAfter)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 10), 0, true);
    document.AddChannel(Ramp(100, 10), 0, false);
    document.AddChannel(Ramp(200, 10), 0, false);
    document.SetRange(-1, -1);
    document.position.SetCursorFrame(4);
    document.position.SetFocusIndex(1);
    const DocumentState before = document.State();
    Copy({{-1, -2, -3}, {-4, -5, -6}, {-7, -8, -9}});
    auto action = Bound(document);
    ASSERT_EQ(action->Go(), B_OK);
    const DocumentState after = document.State();
    EXPECT_EQ(after.channels[0], before.channels[0]);
    EXPECT_EQ(after.channels[1].samples, (std::vector<int16_t>{100, 101, 102, 103, -1, -2, -3, 104, 105, 106, 107, 108, 109}));
    EXPECT_EQ(after.channels[2].samples, (std::vector<int16_t>{200, 201, 202, 203, -4, -5, -6, 204, 205, 206, 207, 208, 209}));
    EXPECT_TRUE(after.channels[1].selected);
    EXPECT_TRUE(after.channels[2].selected);
    EXPECT_EQ(action->FirstChannel(), 1);
    EXPECT_EQ(action->PastedChannelCount(), 2);
    EXPECT_EQ(after.rangeStart, 4);
    EXPECT_EQ(after.rangeEnd, 6);
}

TEST_F(PasteActionTest, InsertWithoutSelectionAndItsUndo)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 10), 0, false);
    document.AddChannel(Ramp(100, 10), 0, false);
    document.SetRange(2, 5);
    document.position.SetCursorFrame(3);
    document.position.SetFocusIndex(0);
    const DocumentState before = document.State();
    Copy({{-1, -2}});
    auto action = Bound(document);
    ASSERT_EQ(action->Go(), B_OK);
    EXPECT_EQ(document.State().channels[0].samples, (std::vector<int16_t>{0, 1, 2, -1, -2, 3, 4, 5, 6, 7, 8, 9}));
    ASSERT_EQ(action->Undo(), B_OK);
    DocumentState expected = before;
    expected.channels[0].selected = true;  // undo of an insert selects the channel
    EXPECT_EQ(document.State(), expected);
}

TEST_F(PasteActionTest, TwoChannelBufferWithTheLastChannelSelectedTouchesOnlyIt)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 10), 0, false);
    document.AddChannel(Ramp(100, 10), 0, true);
    document.SetRange(2, 3);
    document.position.SetCursorFrame(2);
    const DocumentState before = document.State();
    Copy({{-1, -2}, {-3, -4}});
    auto action = Bound(document);
    ASSERT_EQ(action->Go(), B_OK);
    const DocumentState after = document.State();
    EXPECT_EQ(after.channels.size(), 2u);
    EXPECT_EQ(after.channels[0], before.channels[0]);
    EXPECT_EQ(after.channels[1].samples, (std::vector<int16_t>{100, 101, -1, -2, 104, 105, 106, 107, 108, 109}));
    EXPECT_EQ(action->PastedChannelCount(), 1);
}

TEST_F(PasteActionTest, MissingCopyBufferIsAnEmptyPasteThatIsRecorded)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 10), 0, false);
    document.SetRange(2, 3);
    const DocumentState before = document.State();
    HistoryManager history;
    auto* action = new PasteAction(nullptr, &copyBuffer);
    std::unique_ptr<Action> owned(action);
    ASSERT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(history.AddAction(owned), B_OK);
    action->SetCopyBuffer(nullptr);
    EXPECT_EQ(action->Go(), B_OK);
    EXPECT_EQ(document.State(), before);
    EXPECT_STREQ(history.UndoName(), "Paste");
    EXPECT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(document.State(), before);
    // Nothing copied yet is the same as no buffer.
    CopyBuffer empty;
    action->SetCopyBuffer(&empty);
    EXPECT_EQ(history.Redo(), B_OK);
    EXPECT_EQ(document.State(), before);
}

TEST_F(PasteActionTest, TheUnbalancedUnlockLeavesTheDocumentLockUsable)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 10), 0, true);
    document.SetRange(2, 3);
    Copy({{1, 2}});
    auto action = Bound(document);
    ASSERT_EQ(action->Go(), B_OK);
    EXPECT_EQ(document.manager.DocumentLock().CountLocksHeldByCurrentThread(), 0);
    bool locked = false;
    std::thread other([&] {
        locked = document.manager.DocumentLock().LockWithTimeout(1000000);
        if (locked)
            document.manager.Unlock();
    });
    other.join();
    EXPECT_TRUE(locked);
}

TEST_F(PasteActionTest, CopyInOneWindowPasteInAnother)
{
    TestDocument source;
    source.AddChannel(Ramp(0, 50), 0, true);
    source.AddChannel(Ramp(500, 50), 0, true);
    source.SetRange(10, 14);
    CopyFrom(source);

    TestDocument target;
    target.AddChannel(Ramp(-100, 8), 0, false);
    target.AddChannel(Ramp(-200, 8), 0, false);
    target.SetRange(-1, -1);
    target.position.SetCursorFrame(8);
    auto action = Bound(target);
    ASSERT_EQ(action->Go(), B_OK);
    const DocumentState after = target.State();
    std::vector<int16_t> first = Ramp(-100, 8);
    const std::vector<int16_t> copied = Ramp(10, 5);
    first.insert(first.end(), copied.begin(), copied.end());
    EXPECT_EQ(after.channels[0].samples, first);
    EXPECT_EQ(after.channels[1].samples.size(), 13u);
    EXPECT_EQ(after.channels[1].samples[8], 510);
}

TEST_F(PasteActionTest, BufferWithMoreChannelsThanRemainIsPastedAsFarAsChannelsGo)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 10), 0, false);
    document.AddChannel(Ramp(100, 10), 0, false);
    document.AddChannel(Ramp(200, 10), 0, true);
    document.SetRange(0, 9);
    document.position.SetCursorFrame(0);
    Copy({{1}, {2}, {3}});
    auto action = Bound(document);
    ASSERT_EQ(action->Go(), B_OK);
    const DocumentState after = document.State();
    EXPECT_EQ(after.channels.size(), 3u);
    EXPECT_EQ(after.channels[2].samples, (std::vector<int16_t>{1}));
    EXPECT_EQ(after.channels[0].samples.size(), 10u);
    EXPECT_EQ(action->PastedChannelCount(), 1);
}

TEST_F(PasteActionTest, PastesFromTheBufferItWasHandedOnly)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 4), 0, false);
    document.SetRange(-1, -1);
    document.position.SetCursorFrame(0);
    Copy({{7, 8}});
    CopyBuffer other;
    std::vector<CopyBuffer::Samples> arrays;
    arrays.emplace_back(new int16_t[3]{-1, -2, -3});
    ASSERT_TRUE(other.SetCopyBuffer(std::move(arrays), 3));
    PasteAction action(nullptr, &other);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    EXPECT_EQ(document.State().channels[0].samples, (std::vector<int16_t>{-1, -2, -3, 0, 1, 2, 3}));
}

}  // namespace
}  // namespace glimmet
