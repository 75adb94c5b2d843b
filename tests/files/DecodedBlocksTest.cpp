#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "files/DecodedBlocks.h"
#include "sound/BlockBuilder.h"
#include "sound/BlockList.h"
#include "sound/BlockPool.h"
#include "sound/SampleBlock.h"

namespace glimmet {
namespace {

constexpr int64_t kBlockFrames = BlockBuilder::kBlockSamples;

std::vector<int16_t> StereoFrames(int64_t frames, int64_t from)
{
    std::vector<int16_t> interleaved(size_t(2 * frames));
    for (int64_t i = 0; i < frames; ++i) {
        interleaved[size_t(2 * i)] = int16_t((from + i) & 0x7fff);
        interleaved[size_t(2 * i + 1)] = int16_t(-((from + i) & 0x7fff));
    }
    return interleaved;
}

// How many of a channel's blocks directly follow the one before in memory.
int64_t BlocksFollowingTheirNeighbour(const BlockList& list)
{
    int64_t following = 0;
    for (size_t i = 1; i < list.BlockCount(); ++i) {
        const char* previous = reinterpret_cast<const char*>(list.BlockAt(i - 1)->Samples());
        const char* current = reinterpret_cast<const char*>(list.BlockAt(i)->Samples());
        if (current - previous == ptrdiff_t(BlockPool::kBlockBytes))
            ++following;
    }
    return following;
}

TEST(DecodedBlocks, KeepsEveryChannelsSamplesInOrder)
{
    DecodedBlocks decoded(2);
    const int64_t total = 3 * kBlockFrames + 1234;
    for (int64_t at = 0; at < total; at += 10000) {
        const int64_t frames = std::min<int64_t>(10000, total - at);
        const std::vector<int16_t> part = StereoFrames(frames, at);
        ASSERT_TRUE(decoded.Append(part.data(), frames));
    }
    EXPECT_EQ(decoded.Frames(), total);
    const BlockList left = decoded.Take(0);
    const BlockList right = decoded.Take(1);
    ASSERT_EQ(left.Count(), total);
    ASSERT_EQ(right.Count(), total);
    int64_t frame = 0;
    for (size_t b = 0; b < left.BlockCount(); ++b) {
        for (int64_t i = 0; i < left.BlockAt(b)->Count(); ++i, ++frame) {
            ASSERT_EQ(left.BlockAt(b)->Samples()[i], int16_t(frame & 0x7fff)) << frame;
            ASSERT_EQ(right.BlockAt(b)->Samples()[i], int16_t(-(frame & 0x7fff))) << frame;
        }
    }
}

// A channel's blocks lie side by side, so the huge pages a channel fills
// come free together when it goes. Taken for both channels in turn, no block
// would directly follow its predecessor.
TEST(DecodedBlocks, AChannelsBlocksLieSideBySide)
{
    BlockPool::Shared().ReleaseFree();
    DecodedBlocks decoded(2);
    const int64_t blocks = 128;
    const std::vector<int16_t> part = StereoFrames(kBlockFrames, 0);
    for (int64_t b = 0; b < blocks; ++b)
        ASSERT_TRUE(decoded.Append(part.data(), kBlockFrames));
    const BlockList left = decoded.Take(0);
    const BlockList right = decoded.Take(1);
    ASSERT_EQ(left.BlockCount(), size_t(blocks));
    // Runs of 32 meet at most at every run's end.
    EXPECT_GE(BlocksFollowingTheirNeighbour(left), (blocks - 1) * 3 / 4);
    EXPECT_GE(BlocksFollowingTheirNeighbour(right), (blocks - 1) * 3 / 4);
}

TEST(DecodedBlocks, ManyChannelsTakeOneBlockEachAtATime)
{
    const int32_t channels = 512;
    const size_t before = BlockPool::Shared().BlocksInUse();
    DecodedBlocks decoded(channels);
    std::vector<int16_t> frame(size_t(channels), 7);
    ASSERT_TRUE(decoded.Append(frame.data(), 1));
    // One block per channel, however many channels: memory follows what was
    // decoded.
    EXPECT_LE(BlockPool::Shared().BlocksInUse() - before, size_t(channels));
}

}  // namespace
}  // namespace glimmet
