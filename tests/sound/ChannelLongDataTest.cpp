#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <vector>

#include "sound/Channel.h"
#include "support/Status.h"
#include "sound/ChannelSamples.h"

namespace glimmet {
namespace {

// Long enough that the arrays are mapped by the shared allocator rather than
// taken from the heap.
constexpr int64_t kLong = 3'000'000;
constexpr int64_t kSecond = 44100;

int16_t ValueAt(int64_t i)
{
    return int16_t(i * 7 + 3);
}

std::unique_ptr<Channel> LongChannel()
{
    auto channel = std::make_unique<Channel>();
    auto* samples = new int16_t[size_t(kLong)];
    for (int64_t i = 0; i < kLong; i++)
        samples[i] = ValueAt(i);
    EXPECT_TRUE(channel->SetTo(samples, kLong));
    return channel;
}

bool HoldsOriginal(Channel& channel)
{
    if (channel.FrameCount() != kLong)
        return false;
    const std::vector<int16_t> data = test::SamplesOf(channel);
    for (int64_t i = 0; i < kLong; i++) {
        if (data[i] != ValueAt(i))
            return false;
    }
    return true;
}

TEST(ChannelLongDataTest, RemovingAndInsertingASecondRepeatedlyKeepsTheData)
{
    auto channel = LongChannel();
    const int64_t middle = kLong / 2;
    for (int round = 0; round < 4; round++) {
        const std::vector<int16_t> before = test::SamplesOf(*channel);
        std::vector<int16_t> removed(before.begin() + middle, before.begin() + middle + kSecond);
        ASSERT_EQ(channel->RemoveFrames(middle, middle + kSecond - 1), B_OK);
        ASSERT_EQ(channel->FrameCount(), kLong - kSecond);
        const std::vector<int16_t> after = test::SamplesOf(*channel);
        EXPECT_EQ(after[middle - 1], ValueAt(middle - 1));
        EXPECT_EQ(after[middle], ValueAt(middle + kSecond));
        EXPECT_EQ(after[kLong - kSecond - 1], ValueAt(kLong - 1));
        ASSERT_EQ(channel->InsertFrames(removed.data(), kSecond, middle), B_OK);
        ASSERT_TRUE(HoldsOriginal(*channel)) << "round " << round;
    }
}

TEST(ChannelLongDataTest, TwoChannelsEditedInTurnKeepTheirOwnData)
{
    auto left = LongChannel();
    auto right = LongChannel();
    const std::vector<int16_t> minute(size_t(60 * kSecond), int16_t(-9));
    for (int round = 0; round < 3; round++) {
        ASSERT_EQ(left->InsertFrames(minute.data(), int64_t(minute.size()), 1000), B_OK);
        ASSERT_EQ(right->InsertFrames(minute.data(), int64_t(minute.size()), 2000), B_OK);
        EXPECT_EQ(test::SamplesOf(*left)[999], ValueAt(999));
        EXPECT_EQ(test::SamplesOf(*left)[1000], -9);
        EXPECT_EQ(test::SamplesOf(*right)[2000 + 60 * kSecond], ValueAt(2000));
        ASSERT_EQ(left->RemoveFrames(1000, 1000 + 60 * kSecond - 1), B_OK);
        ASSERT_EQ(right->RemoveFrames(2000, 2000 + 60 * kSecond - 1), B_OK);
        ASSERT_TRUE(HoldsOriginal(*left));
        ASSERT_TRUE(HoldsOriginal(*right));
    }
}

TEST(ChannelLongDataTest, AdoptedArrayReplacesAnAllocatedOne)
{
    auto channel = LongChannel();
    ASSERT_EQ(channel->RemoveFrames(0, 9), B_OK);
    // The array now comes from the allocator; adopting one from new[] frees
    // it there, and the adopted one is later freed with delete[].
    auto* samples = new int16_t[size_t(kLong)];
    for (int64_t i = 0; i < kLong; i++)
        samples[i] = ValueAt(i);
    ASSERT_TRUE(channel->SetTo(samples, kLong));
    EXPECT_TRUE(HoldsOriginal(*channel));
    ASSERT_EQ(channel->RemoveFrames(kLong - 10, kLong - 1), B_OK);
    EXPECT_EQ(channel->FrameCount(), kLong - 10);
}

TEST(ChannelLongDataTest, InsertBeyondTheLimitLeavesTheChannelUnchanged)
{
    auto channel = LongChannel();
    const int16_t* before = test::FirstStoredSample(*channel);
    const int16_t frame = 1;
    // The new array would exceed 2^32 - 1 samples; it is refused before any
    // frame is read.
    EXPECT_EQ(channel->InsertFrames(&frame, int64_t(UINT32_MAX) - kLong + 1, kLong / 2), B_NO_MEMORY);
    EXPECT_EQ(test::FirstStoredSample(*channel), before);
    EXPECT_EQ(channel->FirstFrame(), 0);
    EXPECT_TRUE(HoldsOriginal(*channel));
}

TEST(ChannelLongDataTest, ReplaceFarBeyondTheEndLeavesTheChannelUnchanged)
{
    auto channel = LongChannel();
    const int16_t* before = test::FirstStoredSample(*channel);
    const int16_t frame = 1;
    EXPECT_EQ(channel->ReplaceFrames(&frame, 1, int64_t(UINT32_MAX), int64_t(UINT32_MAX)), B_NO_MEMORY);
    EXPECT_EQ(test::FirstStoredSample(*channel), before);
    EXPECT_TRUE(HoldsOriginal(*channel));
}

}  // namespace
}  // namespace glimmet
