#include "edit/CopyBuffer.h"

#include <gtest/gtest.h>

namespace glimmet {
namespace {

std::vector<CopyBuffer::Samples> MakeChannels(int count, int64_t frames, int16_t base)
{
    std::vector<CopyBuffer::Samples> channels;
    for (int c = 0; c < count; c++) {
        CopyBuffer::Samples samples(new int16_t[size_t(frames)]);
        for (int64_t i = 0; i < frames; i++)
            samples[size_t(i)] = int16_t(base + c * 100 + i);
        channels.push_back(std::move(samples));
    }
    return channels;
}

TEST(CopyBufferTest, GetBeforeAnyCopyReturnsFalseAndLeavesOutputsAlone)
{
    CopyBuffer buffer;
    std::vector<const int16_t*> channels;
    int32_t count = 7;
    int64_t frames = 9;
    EXPECT_FALSE(buffer.GetCopyBuffer(channels, count, frames));
    EXPECT_EQ(count, 7);
    EXPECT_EQ(frames, 9);
    EXPECT_TRUE(channels.empty());
}

TEST(CopyBufferTest, SetThenGetSharesTheArrays)
{
    CopyBuffer buffer;
    ASSERT_TRUE(buffer.SetCopyBuffer(MakeChannels(2, 5, 10), 5));
    std::vector<const int16_t*> first;
    std::vector<const int16_t*> second;
    int32_t count = 0;
    int64_t frames = 0;
    ASSERT_TRUE(buffer.GetCopyBuffer(first, count, frames));
    EXPECT_EQ(count, 2);
    EXPECT_EQ(frames, 5);
    EXPECT_EQ(first[1][4], 10 + 100 + 4);
    ASSERT_TRUE(buffer.GetCopyBuffer(second, count, frames));
    // Two gets hand out the same sample arrays, not copies.
    EXPECT_EQ(first, second);
}

TEST(CopyBufferTest, RefusedSetKeepsTheOldBuffer)
{
    CopyBuffer buffer;
    ASSERT_TRUE(buffer.SetCopyBuffer(MakeChannels(1, 3, 7), 3));
    EXPECT_FALSE(buffer.SetCopyBuffer(MakeChannels(2, 4, 0), 0));
    EXPECT_FALSE(buffer.SetCopyBuffer({}, 4));
    std::vector<const int16_t*> channels;
    int32_t count = 0;
    int64_t frames = 0;
    ASSERT_TRUE(buffer.GetCopyBuffer(channels, count, frames));
    EXPECT_EQ(count, 1);
    EXPECT_EQ(frames, 3);
    EXPECT_EQ(channels[0][2], 9);
}

TEST(CopyBufferTest, AcceptedSetReplacesTheOldBuffer)
{
    CopyBuffer buffer;
    ASSERT_TRUE(buffer.SetCopyBuffer(MakeChannels(1, 3, 7), 3));
    ASSERT_TRUE(buffer.SetCopyBuffer(MakeChannels(3, 2, 50), 2));
    std::vector<const int16_t*> channels;
    int32_t count = 0;
    int64_t frames = 0;
    ASSERT_TRUE(buffer.GetCopyBuffer(channels, count, frames));
    EXPECT_EQ(count, 3);
    EXPECT_EQ(frames, 2);
    EXPECT_EQ(channels[2][1], 251);
}

}  // namespace
}  // namespace glimmet
