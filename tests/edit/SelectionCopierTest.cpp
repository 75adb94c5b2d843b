#include "edit/SelectionCopier.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "TestDocument.h"
#include "edit/CopyBuffer.h"
#include "sound/Channel.h"

namespace glimmet {
namespace {

using test::Ramp;
using test::TestDocument;

/// The buffer's channels as vectors; empty when nothing was copied.
std::vector<std::vector<int16_t>> Contents(const CopyBuffer& buffer)
{
    std::vector<const int16_t*> channels;
    int32_t count = 0;
    int64_t frames = 0;
    if (!buffer.GetCopyBuffer(channels, count, frames))
        return {};
    std::vector<std::vector<int16_t>> contents;
    for (const int16_t* samples : channels)
        contents.emplace_back(samples, samples + frames);
    return contents;
}

TEST(SelectionCopierTest, CopiesTheRangeOfEverySelectedChannelInOrder)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 20), 0, true);
    document.AddChannel(Ramp(100, 20), 0, false);
    document.AddChannel(Ramp(200, 20), 0, true);
    document.SetRange(3, 6);
    CopyBuffer buffer;
    ASSERT_TRUE(SelectionCopier::CopySelection(document.manager, buffer));
    const std::vector<std::vector<int16_t>> expected{{3, 4, 5, 6}, {203, 204, 205, 206}};
    EXPECT_EQ(Contents(buffer), expected);
}

// The read from the channel that ends where the range starts is refused
// ("what the....?"); its part of the copy is silence, not what the recycled
// array held before.
TEST(SelectionCopierTest, AChannelEndingWhereTheRangeStartsGivesSilence)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 20), 0, true);
    document.AddChannel(Ramp(100, 40), 0, true);
    for (int round = 0; round < 4; ++round) {
        SampleAllocator::Array used = Channel::Allocate(4);
        ASSERT_TRUE(used);
        std::fill_n(used.get(), 4, int16_t(0x7777));
    }
    document.SetRange(20, 23);
    CopyBuffer buffer;
    ASSERT_TRUE(SelectionCopier::CopySelection(document.manager, buffer));
    const std::vector<std::vector<int16_t>> expected{{0, 0, 0, 0}, {120, 121, 122, 123}};
    EXPECT_EQ(Contents(buffer), expected);
}

TEST(SelectionCopierTest, NoSelectedChannelKeepsTheOldCopy)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 20), 0, true);
    document.SetRange(0, 1);
    CopyBuffer buffer;
    ASSERT_TRUE(SelectionCopier::CopySelection(document.manager, buffer));
    document.manager.ChannelAt(0)->SetSelected(false);
    document.SetRange(5, 9);
    EXPECT_FALSE(SelectionCopier::CopySelection(document.manager, buffer));
    const std::vector<std::vector<int16_t>> expected{{0, 1}};
    EXPECT_EQ(Contents(buffer), expected);
}

TEST(SelectionCopierTest, ARangeNoArrayCanHoldCopiesNothing)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 20), 0, true);
    document.AddChannel(Ramp(50, 20), 0, true);
    document.SetRange(8, 8);
    CopyBuffer buffer;
    ASSERT_TRUE(SelectionCopier::CopySelection(document.manager, buffer));
    // The start has no lower bound: more frames than a channel may hold.
    document.SetRange(-(int64_t(1) << 33), 4);
    EXPECT_FALSE(SelectionCopier::CopySelection(document.manager, buffer));
    const std::vector<std::vector<int16_t>> expected{{8}, {58}};
    EXPECT_EQ(Contents(buffer), expected);
}

TEST(SelectionCopierTest, LeavesTheDocumentUnlocked)
{
    TestDocument document;
    document.AddChannel(Ramp(0, 4), 0, true);
    document.SetRange(0, 3);
    CopyBuffer buffer;
    SelectionCopier::CopySelection(document.manager, buffer);
    EXPECT_EQ(document.manager.DocumentLock().CountLocksHeldByCurrentThread(), 0);
}

}  // namespace
}  // namespace glimmet
