#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "sound/BlockBuilder.h"

namespace glimmet {
namespace {

size_t SilentBlocks(const BlockList& list)
{
    size_t silent = 0;
    for (size_t i = 0; i < list.BlockCount(); i++)
        silent += BlockBuilder::IsSilence(list.BlockAt(i).get()) ? 1 : 0;
    return silent;
}

TEST(BlockBuilderTest, ZerosAfterAPartBlockShareTheSilenceOnceTheSeamIsFilled)
{
    // Undoing a Truncate far before frame 0 appends billions of zeros after
    // a few samples; only the block at the seam may be a block of its own.
    const std::vector<int16_t> head = {1, 2, 3};
    BlockBuilder builder;
    builder.AppendSamples(head.data(), int64_t(head.size()));
    builder.AppendZeros(10 * BlockBuilder::kBlockSamples);
    const BlockList list = builder.Finish();
    ASSERT_TRUE(builder.Ok());
    EXPECT_EQ(list.Count(), 3 + 10 * BlockBuilder::kBlockSamples);
    EXPECT_GE(SilentBlocks(list), 9u);
    std::vector<int16_t> seam(6);
    list.CopyOut(0, 6, seam.data());
    EXPECT_EQ(seam, (std::vector<int16_t>{1, 2, 3, 0, 0, 0}));
}

TEST(BlockBuilderTest, RepeatedValuesAfterAPartBlockShareTheRepeatedBlock)
{
    const std::vector<int16_t> head = {9};
    const BlockRef sevens = BlockBuilder::RepeatedBlock(7);
    ASSERT_NE(sevens, nullptr);
    BlockBuilder builder;
    builder.AppendSamples(head.data(), 1);
    builder.AppendRepeated(7, 5 * BlockBuilder::kBlockSamples, sevens);
    const BlockList list = builder.Finish();
    size_t shared = 0;
    for (size_t i = 0; i < list.BlockCount(); i++)
        shared += list.BlockAt(i) == sevens ? 1 : 0;
    EXPECT_GE(shared, 4u);
    std::vector<int16_t> last(1);
    list.CopyOut(list.Count() - 1, 1, last.data());
    EXPECT_EQ(last[0], 7);
}

}  // namespace
}  // namespace glimmet
