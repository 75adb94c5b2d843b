#include <gtest/gtest.h>

#include <cstdint>
#include <random>
#include <vector>

#include "TestDocument.h"
#include "edit/FadeInAction.h"
#include "edit/MaximizeAction.h"
#include "edit/MoveSampleAction.h"
#include "sound/BlockBuilder.h"
#include "sound/Channel.h"
#include "sound/ChannelSamples.h"

namespace glimmet {
namespace {

using test::TestDocument;

constexpr int64_t kBlock = BlockBuilder::kBlockSamples;

using test::SamplesOf;

Channel* AddLongChannel(TestDocument& document, int64_t count, int peak = 32767, unsigned seed = 7)
{
    std::mt19937 random(seed);
    std::uniform_int_distribution<int> value(-peak, peak);
    std::vector<int16_t> samples(static_cast<size_t>(count));
    for (int16_t& sample : samples)
        sample = int16_t(value(random));
    Channel* channel = document.AddChannel({}, 0, true);
    EXPECT_EQ(channel->InsertFrames(samples.data(), count, 0), B_OK);
    return channel;
}

TEST(RedoPutBackTest, ARedoOfAFadeGivesBackTheBlocksItsGoMade)
{
    TestDocument document;
    const int64_t count = 8 * kBlock;
    Channel* channel = AddLongChannel(document, count);
    document.SetRange(0, count - 1);
    FadeInAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    const std::vector<uint64_t> faded = test::BlockIdsOf(*channel);
    const std::vector<int16_t> fadedSamples = SamplesOf(*channel);
    for (int round = 0; round < 2; round++) {
        ASSERT_EQ(action.Undo(), B_OK);
        ASSERT_EQ(action.Redo(), B_OK);
        // Not computed again: the very blocks come back.
        EXPECT_EQ(test::BlockIdsOf(*channel), faded);
        EXPECT_EQ(SamplesOf(*channel), fadedSamples);
    }
}

TEST(RedoPutBackTest, ARedoAfterTheRangeChangedUnderneathComputesAgain)
{
    TestDocument document;
    const int64_t count = 4 * kBlock;
    Channel* channel = AddLongChannel(document, count);
    document.SetRange(10, count - 11);
    FadeInAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    ASSERT_EQ(action.Undo(), B_OK);
    // Something outside the history rewrites the range before the redo.
    std::vector<int16_t> other(size_t(count - 20), 1000);
    ASSERT_EQ(channel->ReplaceFrames(other.data(), int64_t(other.size()), 10, count - 11), B_OK);
    ASSERT_EQ(action.Redo(), B_OK);
    std::vector<int16_t> expected(size_t(count - 20), 1000);
    FadeInAction reference(nullptr);
    TestDocument plain;
    Channel* copy = plain.AddChannel(expected, 0, true);
    plain.SetRange(0, int64_t(expected.size()) - 1);
    ASSERT_EQ(reference.SetTo(&plain.manager, &plain.position), B_OK);
    ASSERT_EQ(reference.Go(), B_OK);
    const std::vector<int16_t> all = SamplesOf(*channel);
    const std::vector<int16_t> middle(all.begin() + 10, all.end() - 10);
    EXPECT_EQ(middle, SamplesOf(*copy));
}

TEST(RedoPutBackTest, ARedoOfMaximizeGivesBackTheBlocksItsGoMadeInEveryChannel)
{
    TestDocument document;
    const int64_t count = 6 * kBlock + 123;
    // Quiet enough to be scaled, and at different levels: the factor is
    // shared, so neither channel reaches full scale alone.
    Channel* left = AddLongChannel(document, count, 9000, 7);
    Channel* right = AddLongChannel(document, count, 4000, 11);
    document.SetRange(50, count - 51);
    MaximizeAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    const std::vector<int16_t> before = SamplesOf(*left);
    ASSERT_EQ(action.Go(), B_OK);
    ASSERT_NE(SamplesOf(*left), before);
    const std::vector<uint64_t> leftBlocks = test::BlockIdsOf(*left);
    const std::vector<uint64_t> rightBlocks = test::BlockIdsOf(*right);
    const std::vector<int16_t> leftSamples = SamplesOf(*left);
    const std::vector<int16_t> rightSamples = SamplesOf(*right);
    for (int round = 0; round < 2; round++) {
        ASSERT_EQ(action.Undo(), B_OK);
        EXPECT_EQ(SamplesOf(*left), before);
        ASSERT_EQ(action.Redo(), B_OK);
        EXPECT_EQ(test::BlockIdsOf(*left), leftBlocks);
        EXPECT_EQ(test::BlockIdsOf(*right), rightBlocks);
        EXPECT_EQ(SamplesOf(*left), leftSamples);
        EXPECT_EQ(SamplesOf(*right), rightSamples);
    }
}

TEST(RedoPutBackTest, ARedoOfMaximizeAfterTheRangeChangedScalesTheNewSamples)
{
    TestDocument document;
    const int64_t count = 3 * kBlock;
    Channel* channel = AddLongChannel(document, count, 9000, 5);
    document.SetRange(0, count - 1);
    MaximizeAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    ASSERT_EQ(action.Undo(), B_OK);
    // A quieter range now: putting back the old result would be wrong.
    std::vector<int16_t> other(static_cast<size_t>(count));
    for (size_t i = 0; i < other.size(); i++)
        other[i] = int16_t(int(i % 201) - 100);
    ASSERT_EQ(channel->ReplaceFrames(other.data(), count, 0, count - 1), B_OK);
    ASSERT_EQ(action.Redo(), B_OK);
    TestDocument plain;
    Channel* copy = plain.AddChannel(other, 0, true);
    plain.SetRange(0, count - 1);
    MaximizeAction reference(nullptr);
    ASSERT_EQ(reference.SetTo(&plain.manager, &plain.position), B_OK);
    ASSERT_EQ(reference.Go(), B_OK);
    EXPECT_EQ(SamplesOf(*channel), SamplesOf(*copy));
}

}  // namespace
}  // namespace glimmet
