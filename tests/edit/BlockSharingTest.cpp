#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <random>
#include <set>
#include <vector>

#include "TestDocument.h"
#include "edit/FadeInAction.h"
#include "edit/RemoveAction.h"
#include "sound/BlockBuilder.h"
#include "sound/Channel.h"
#include "sound/ChannelSamples.h"

namespace glimmet {
namespace {

using test::TestDocument;

constexpr int64_t kBlock = BlockBuilder::kBlockSamples;

using test::SamplesOf;

size_t Shared(const std::vector<uint64_t>& a, const std::vector<uint64_t>& b)
{
    const std::set<uint64_t> inA(a.begin(), a.end());
    return size_t(std::count_if(b.begin(), b.end(), [&inA](uint64_t id) { return inA.count(id) != 0; }));
}

// A channel of many blocks, built the way loading and edits build channels.
Channel* AddLongChannel(TestDocument& document, int64_t count, uint32_t seed)
{
    std::mt19937 random(seed);
    std::uniform_int_distribution<int> value(-32768, 32767);
    std::vector<int16_t> samples(static_cast<size_t>(count));
    for (int16_t& sample : samples)
        sample = int16_t(value(random));
    Channel* channel = document.AddChannel({}, 0, true);
    EXPECT_EQ(channel->InsertFrames(samples.data(), count, 0), B_OK);
    return channel;
}

TEST(BlockSharingTest, AFadeOverAWholeChannelKeepsTheOldBlocksForItsUndo)
{
    TestDocument document;
    const int64_t count = 64 * kBlock;
    Channel* channel = AddLongChannel(document, count, 1);
    const std::vector<uint64_t> original = test::BlockIdsOf(*channel);
    const std::vector<int16_t> samples = SamplesOf(*channel);
    document.SetRange(0, count - 1);
    FadeInAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    // The snapshot shares every block: it holds no sample memory of its own.
    EXPECT_EQ(action.SnapshotBytes(), 0);
    ASSERT_EQ(action.Go(), B_OK);
    EXPECT_EQ(Shared(original, test::BlockIdsOf(*channel)), 0u);
    EXPECT_NE(SamplesOf(*channel), samples);
    ASSERT_EQ(action.Undo(), B_OK);
    // The very blocks come back: the snapshot held them, not copies.
    EXPECT_EQ(test::BlockIdsOf(*channel), original);
    EXPECT_EQ(SamplesOf(*channel), samples);
}

TEST(BlockSharingTest, CuttingASecondMakesOnlyTheBlocksAroundTheCut)
{
    TestDocument document;
    const int64_t count = 64 * kBlock;
    Channel* channel = AddLongChannel(document, count, 2);
    const std::vector<uint64_t> original = test::BlockIdsOf(*channel);
    const std::vector<int16_t> samples = SamplesOf(*channel);
    const int64_t start = 30 * kBlock + 123;
    document.SetRange(start, start + 44099);
    RemoveAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    // Only the blocks cut at the range's two edges are copied.
    EXPECT_LE(action.SnapshotBytes(), 2 * kBlock * 2);
    ASSERT_EQ(action.Go(), B_OK);
    const std::vector<uint64_t> cut = test::BlockIdsOf(*channel);
    EXPECT_EQ(channel->FrameCount(), count - 44100);
    EXPECT_LE(cut.size() - Shared(original, cut), 2u);
    ASSERT_EQ(action.Undo(), B_OK);
    EXPECT_EQ(SamplesOf(*channel), samples);
    const std::vector<uint64_t> restored = test::BlockIdsOf(*channel);
    // Away from the cut every block is the one the channel had.
    EXPECT_GE(Shared(original, restored), original.size() - 4);
}

TEST(BlockSharingTest, RedoOfAFadeAfterUndoGivesTheFadedSamplesAgain)
{
    TestDocument document;
    const int64_t count = 8 * kBlock + 17;
    Channel* channel = AddLongChannel(document, count, 3);
    document.SetRange(5, count - 9);
    FadeInAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    const std::vector<int16_t> faded = SamplesOf(*channel);
    ASSERT_EQ(action.Undo(), B_OK);
    ASSERT_EQ(action.Redo(), B_OK);
    EXPECT_EQ(SamplesOf(*channel), faded);
}

}  // namespace
}  // namespace glimmet
