#include <gtest/gtest.h>

#include <algorithm>
#include <numeric>
#include <string>
#include <vector>

#include "sound/Channel.h"
#include "support/DiagnosticsCapture.h"
#include "support/Status.h"
#include "sound/ChannelSamples.h"

namespace glimmet {
namespace {

using Samples = std::vector<int16_t>;

// Samples 1, 2, 3, ... so that every sample tells where it came from.
Samples Ramp(int64_t count, int16_t firstValue = 1)
{
    Samples samples = Samples(size_t(count));
    std::iota(samples.begin(), samples.end(), firstValue);
    return samples;
}

// A channel holding the given samples starting at first.
std::unique_ptr<Channel> MakeChannel(const Samples& samples, int64_t first)
{
    auto channel = std::make_unique<Channel>();
    if (!samples.empty()) {
        EXPECT_EQ(channel->InsertFrames(samples.data(), int64_t(samples.size()), first), B_OK);
    }
    return channel;
}

Samples Contents(Channel& channel)
{
    return test::SamplesOf(channel);
}

Samples Concat(std::initializer_list<Samples> parts)
{
    Samples all;
    for (const Samples& part : parts)
        all.insert(all.end(), part.begin(), part.end());
    return all;
}

Samples Zeros(int64_t count) { return Samples(size_t(count), 0); }

// Part [begin, end) of a ramp 1..n, by value.
Samples RampPart(int16_t from, int16_t to) { return Ramp(to - from + 1, from); }

TEST(ChannelTest, FreshChannel)
{
    Channel channel;
    EXPECT_EQ(channel.FrameCount(), 0);
    EXPECT_EQ(channel.FirstFrame(), 0);
    EXPECT_FALSE(channel.IsMuted());
    EXPECT_FALSE(channel.IsSelected());
    EXPECT_EQ(channel.PanPosition(), 0);
    EXPECT_EQ(test::FirstStoredSample(channel), nullptr);
    EXPECT_EQ(channel.FrameRate(), 0.0f);
}

TEST(ChannelTest, PanStoresOnlyTheThreePositions)
{
    Channel channel;
    channel.SetPanPosition(64);
    EXPECT_EQ(channel.PanPosition(), 0);
    channel.SetPanPosition(-128);
    EXPECT_EQ(channel.PanPosition(), -128);
    channel.SetPanPosition(127);
    EXPECT_EQ(channel.PanPosition(), 127);
    channel.SetPanPosition(-127);
    EXPECT_EQ(channel.PanPosition(), 0);
}

TEST(ChannelTest, NegativeStartOffsetIsStoredAsZero)
{
    Channel channel;
    channel.SetStartFrameOffset(-5);
    EXPECT_EQ(channel.FirstFrame(), 0);
    channel.SetStartFrameOffset(77);
    EXPECT_EQ(channel.FirstFrame(), 77);
}

TEST(ChannelTest, FlagsAreKept)
{
    Channel channel;
    channel.SetMuted(true);
    channel.SetSelected(true);
    EXPECT_TRUE(channel.IsMuted());
    EXPECT_TRUE(channel.IsSelected());
}

TEST(ChannelTest, AdoptingAnArray)
{
    Channel channel;
    EXPECT_FALSE(channel.SetTo(static_cast<int16_t*>(nullptr), 5));
    int16_t* samples = new int16_t[3]{7, 8, 9};
    EXPECT_FALSE(channel.SetTo(samples, 0));
    EXPECT_FALSE(channel.SetTo(samples, -1));
    channel.SetStartFrameOffset(12);
    EXPECT_TRUE(channel.SetTo(samples, 3));
    EXPECT_EQ(test::FirstStoredSample(channel), samples);
    EXPECT_EQ(channel.FrameCount(), 3);
    EXPECT_EQ(channel.FirstFrame(), 12);
}

struct FillCase {
    const char* name;
    int64_t start;
    int64_t count;
    bool result;
    Samples expected;  // ignored when result is false
};

class ChannelFillTest : public ::testing::TestWithParam<FillCase> {};

// A channel of samples 1..10 at frames 100..109.
TEST_P(ChannelFillTest, FillsTheTimeline)
{
    const FillCase& fill = GetParam();
    auto channel = MakeChannel(Ramp(10), 100);
    Samples buffer(size_t(fill.count), int16_t(-7));
    DiagnosticsCapture capture;
    EXPECT_EQ(channel->FillBuffer(buffer.data(), fill.start, fill.count), fill.result);
    const std::string printed = capture.Finish();
    if (fill.result) {
        EXPECT_EQ(buffer, fill.expected);
        EXPECT_EQ(printed, "");
    } else {
        EXPECT_EQ(buffer, Samples(size_t(fill.count), int16_t(-7)));
        EXPECT_EQ(printed, "what the....?\n");
    }
}

// What ReadForMix reports, laid out as a buffer, is what FillBuffer writes.
TEST_P(ChannelFillTest, ReadForMixDescribesTheSameSamples)
{
    const FillCase& fill = GetParam();
    auto channel = MakeChannel(Ramp(10), 100);
    channel->SetMuted(true);
    channel->SetPanPosition(Channel::kPanRight);
    Samples buffer = Zeros(fill.count);
    int calls = 0;
    DiagnosticsCapture capture;
    const bool result = channel->ReadForMix(fill.start, fill.count, [&](const Channel::MixSource& source) {
        ++calls;
        EXPECT_TRUE(source.muted);
        EXPECT_EQ(source.pan, Channel::kPanRight);
        ASSERT_GE(source.offset, 0);
        ASSERT_GE(source.length, 0);
        ASSERT_LE(source.offset + source.length, fill.count);
        EXPECT_EQ(source.samples == nullptr, source.length == 0);
        if (source.length == 0)
            return;
        const int16_t* data = test::FirstStoredSample(*channel);
        ASSERT_GE(source.samples, data);
        EXPECT_EQ(source.samples + source.length + source.following, data + 10);
        std::copy_n(source.samples, source.length, buffer.begin() + source.offset);
    });
    const std::string printed = capture.Finish();
    EXPECT_EQ(calls, 1);
    EXPECT_EQ(result, fill.result);
    if (fill.result) {
        EXPECT_EQ(buffer, fill.expected);
        EXPECT_EQ(printed, "");
    } else {
        EXPECT_EQ(printed, "what the....?\n");
    }
}

INSTANTIATE_TEST_SUITE_P(Branches, ChannelFillTest,
    ::testing::Values(
        FillCase{"BeforeEndingBeforeFirst", 50, 40, true, Zeros(40)},
        FillCase{"BeforeEndingOnFirstLeavesItOut", 50, 51, true, Zeros(51)},
        FillCase{"BeforeAndIntoTheData", 50, 60, true, Concat({Zeros(50), Ramp(10)})},
        FillCase{"BeforeAndPastTheEndReadsZeros", 98, 14, true, Concat({Zeros(2), Ramp(10), Zeros(2)})},
        FillCase{"AtTheEndExactly", 110, 4, false, {}},
        FillCase{"AfterTheEnd", 111, 4, true, Zeros(4)},
        FillCase{"InsideToTheEnd", 105, 5, true, RampPart(6, 10)},
        FillCase{"OnePastTheDataReadsZero", 105, 6, true, Concat({RampPart(6, 10), Zeros(1)})},
        FillCase{"InsideAndPast", 105, 10, true, Concat({RampPart(6, 10), Zeros(5)})},
        FillCase{"WholeData", 100, 10, true, Ramp(10)},
        FillCase{"Middle", 102, 3, true, RampPart(3, 5)}),
    [](const ::testing::TestParamInfo<FillCase>& info) { return std::string(info.param.name); });

TEST(ChannelTest, FillBufferWithNullBufferFails)
{
    auto channel = MakeChannel(Ramp(10), 100);
    EXPECT_FALSE(channel->FillBuffer(nullptr, 100, 4));
}

TEST(ChannelTest, EmptyChannelAtFrameZeroIsTheEndCase)
{
    Channel channel;
    Samples buffer(4, 3);
    DiagnosticsCapture capture;
    EXPECT_FALSE(channel.FillBuffer(buffer.data(), 0, 4));
    EXPECT_EQ(capture.Finish(), "what the....?\n");
    EXPECT_TRUE(channel.FillBuffer(buffer.data(), 5, 4));
    EXPECT_EQ(buffer, Zeros(4));
}

struct EditResult {
    status_t status;
    int64_t first;
    Samples samples;
};

void ExpectChannel(Channel& channel, const EditResult& expected)
{
    EXPECT_EQ(channel.FirstFrame(), expected.first);
    EXPECT_EQ(channel.FrameCount(), int64_t(expected.samples.size()));
    EXPECT_EQ(Contents(channel), expected.samples);
}

struct InsertCase {
    const char* name;
    int64_t at;
    EditResult expected;
};

class ChannelInsertTest : public ::testing::TestWithParam<InsertCase> {};

// Inserting 901, 902, 903 into a channel of samples 1..10 at frames 100..109.
TEST_P(ChannelInsertTest, Inserts)
{
    const InsertCase& insert = GetParam();
    auto channel = MakeChannel(Ramp(10), 100);
    const Samples frames = Ramp(3, 901);
    EXPECT_EQ(channel->InsertFrames(frames.data(), 3, insert.at), insert.expected.status);
    ExpectChannel(*channel, insert.expected);
}

INSTANTIATE_TEST_SUITE_P(Branches, ChannelInsertTest,
    ::testing::Values(
        InsertCase{"AtFirst", 100, {B_OK, 100, Concat({Ramp(3, 901), Ramp(10)})}},
        InsertCase{"Inside", 104, {B_OK, 100, Concat({Ramp(4), Ramp(3, 901), RampPart(5, 10)})}},
        InsertCase{"AtLast", 109, {B_OK, 100, Concat({Ramp(9), Ramp(3, 901), RampPart(10, 10)})}},
        InsertCase{"AtEnd", 110, {B_OK, 100, Concat({Ramp(10), Ramp(3, 901)})}},
        InsertCase{"AfterEnd", 114, {B_OK, 100, Concat({Ramp(10), Zeros(4), Ramp(3, 901)})}},
        InsertCase{"BeforeFirstTheGapMovesRight", 95,
            {B_OK, 95, Concat({Ramp(3, 901), Zeros(5), Ramp(10)})}},
        InsertCase{"JustBeforeFirst", 99, {B_OK, 99, Concat({Ramp(3, 901), Zeros(1), Ramp(10)})}}),
    [](const ::testing::TestParamInfo<InsertCase>& info) { return std::string(info.param.name); });

TEST(ChannelTest, InsertIntoEmptyChannelPlacesTheData)
{
    Channel channel;
    const Samples frames = Ramp(4);
    EXPECT_EQ(channel.InsertFrames(frames.data(), 4, 1000), B_OK);
    ExpectChannel(channel, {B_OK, 1000, Ramp(4)});
}

TEST(ChannelTest, InsertRejectsBadArguments)
{
    auto channel = MakeChannel(Ramp(10), 100);
    const Samples frames = Ramp(3);
    EXPECT_EQ(channel->InsertFrames(nullptr, 3, 100), B_BAD_VALUE);
    EXPECT_EQ(channel->InsertFrames(frames.data(), 0, 100), B_BAD_VALUE);
    EXPECT_EQ(channel->InsertFrames(frames.data(), -2, 100), B_BAD_VALUE);
    ExpectChannel(*channel, {B_OK, 100, Ramp(10)});
}

struct ReplaceCase {
    const char* name;
    int64_t from;
    int64_t to;
    EditResult expected;
    const char* printed;
};

class ChannelReplaceTest : public ::testing::TestWithParam<ReplaceCase> {};

// Replacing by 901, 902, 903 in a channel of samples 1..10 at frames 100..109.
TEST_P(ChannelReplaceTest, Replaces)
{
    const ReplaceCase& replace = GetParam();
    auto channel = MakeChannel(Ramp(10), 100);
    const Samples frames = Ramp(3, 901);
    DiagnosticsCapture capture;
    EXPECT_EQ(channel->ReplaceFrames(frames.data(), 3, replace.from, replace.to), replace.expected.status);
    EXPECT_EQ(capture.Finish(), replace.printed);
    ExpectChannel(*channel, replace.expected);
}

INSTANTIATE_TEST_SUITE_P(Branches, ChannelReplaceTest,
    ::testing::Values(
        ReplaceCase{"InsideSameLength", 102, 104,
            {B_OK, 100, Concat({Ramp(2), Ramp(3, 901), RampPart(6, 10)})}, ""},
        ReplaceCase{"InsideShorter", 102, 108,
            {B_OK, 100, Concat({Ramp(2), Ramp(3, 901), RampPart(10, 10)})}, ""},
        ReplaceCase{"InsideLonger", 105, 105,
            {B_OK, 100, Concat({Ramp(5), Ramp(3, 901), RampPart(7, 10)})}, ""},
        ReplaceCase{"EndingOutsideTruncates", 107, 120,
            {B_OK, 100, Concat({Ramp(7), Ramp(3, 901)})}, "  ending outside data\n"},
        ReplaceCase{"AtEnd", 110, 112, {B_OK, 100, Concat({Ramp(10), Ramp(3, 901)})}, ""},
        ReplaceCase{"AfterEnd", 113, 115, {B_OK, 100, Concat({Ramp(10), Zeros(3), Ramp(3, 901)})}, ""},
        ReplaceCase{"BeforeIntoTheData", 98, 101,
            {B_OK, 98, Concat({Ramp(3, 901), RampPart(3, 10)})}, ""},
        ReplaceCase{"BeforeOverTheWholeData", 90, 200, {B_OK, 90, Ramp(3, 901)}, ""},
        ReplaceCase{"WholeDataExactly", 100, 109,
            {B_OK, 100, Concat({Ramp(3, 901)})}, ""},
        ReplaceCase{"OnePastTheLastFrame", 108, 110,
            {B_OK, 100, Concat({Ramp(8), Ramp(3, 901)})}, "  ending outside data\n"},
        ReplaceCase{"WhollyBefore", 90, 95, {B_OK, 90, Concat({Ramp(3, 901), Zeros(4), Ramp(10)})}, ""},
        ReplaceCase{"WhollyBeforeTouching", 97, 99, {B_OK, 97, Concat({Ramp(3, 901), Ramp(10)})}, ""}),
    [](const ::testing::TestParamInfo<ReplaceCase>& info) { return std::string(info.param.name); });

TEST(ChannelTest, ReplaceRejectsBadArguments)
{
    auto channel = MakeChannel(Ramp(10), 100);
    const Samples frames = Ramp(3);
    EXPECT_EQ(channel->ReplaceFrames(nullptr, 3, 100, 101), B_BAD_VALUE);
    EXPECT_EQ(channel->ReplaceFrames(frames.data(), 0, 100, 101), B_BAD_VALUE);
    EXPECT_EQ(channel->ReplaceFrames(frames.data(), 3, 102, 101), B_BAD_VALUE);
    EXPECT_EQ(channel->ReplaceFrames(frames.data(), 3, -1, 101), B_BAD_VALUE);
    ExpectChannel(*channel, {B_OK, 100, Ramp(10)});
}

TEST(ChannelTest, ReplaceInEmptyChannelPlacesTheData)
{
    Channel channel;
    const Samples frames = Ramp(3);
    EXPECT_EQ(channel.ReplaceFrames(frames.data(), 3, 40, 90), B_OK);
    ExpectChannel(channel, {B_OK, 40, Ramp(3)});
}

struct RemoveCase {
    const char* name;
    int64_t from;
    int64_t to;
    EditResult expected;
};

class ChannelRemoveTest : public ::testing::TestWithParam<RemoveCase> {};

// Removing from a channel of samples 1..10 at frames 100..109.
TEST_P(ChannelRemoveTest, Removes)
{
    const RemoveCase& remove = GetParam();
    auto channel = MakeChannel(Ramp(10), 100);
    EXPECT_EQ(channel->RemoveFrames(remove.from, remove.to), remove.expected.status);
    ExpectChannel(*channel, remove.expected);
}

INSTANTIATE_TEST_SUITE_P(Branches, ChannelRemoveTest,
    ::testing::Values(
        RemoveCase{"Inside", 102, 104, {B_OK, 100, Concat({Ramp(2), RampPart(6, 10)})}},
        RemoveCase{"Head", 100, 101, {B_OK, 100, RampPart(3, 10)}},
        RemoveCase{"TailClampedAtTheEnd", 107, 500, {B_OK, 100, Ramp(7)}},
        RemoveCase{"AtTheEndRebuildsUnchanged", 110, 120, {B_OK, 100, Ramp(10)}},
        RemoveCase{"AfterTheEndDoesNothing", 111, 120, {B_OK, 100, Ramp(10)}},
        // The part from `to` on is kept, including the sample at `to`, and
        // the last sample does not fit the new array.
        RemoveCase{"OverTheHeadKeepsTheSampleAtTo", 95, 102, {B_OK, 95, RampPart(3, 9)}},
        RemoveCase{"OverTheHeadToFirst", 95, 100, {B_OK, 95, RampPart(1, 9)}},
        RemoveCase{"OverEverything", 95, 200, {B_OK, 95, {}}},
        RemoveCase{"WhollyBeforeOnlyMovesTheFirstFrame", 10, 19, {B_OK, 90, Ramp(10)}},
        RemoveCase{"WhollyBeforeTouching", 97, 99, {B_OK, 97, Ramp(10)}}),
    [](const ::testing::TestParamInfo<RemoveCase>& info) { return std::string(info.param.name); });

TEST(ChannelTest, RemoveRejectsBadArguments)
{
    auto channel = MakeChannel(Ramp(10), 100);
    EXPECT_EQ(channel->RemoveFrames(-1, 104), B_BAD_VALUE);
    EXPECT_EQ(channel->RemoveFrames(105, 104), B_BAD_VALUE);
    ExpectChannel(*channel, {B_OK, 100, Ramp(10)});
}

TEST(ChannelTest, RemovingEverythingLeavesAnEmptyArray)
{
    auto channel = MakeChannel(Ramp(10), 0);
    EXPECT_EQ(channel->RemoveFrames(0, 9), B_OK);
    EXPECT_EQ(channel->FrameCount(), 0);
    // An emptied channel still has its (empty) array, so a later insert
    // after its first frame pads with silence instead of moving it.
    const Samples frames = Ramp(2);
    EXPECT_EQ(channel->InsertFrames(frames.data(), 2, 3), B_OK);
    ExpectChannel(*channel, {B_OK, 0, Concat({Zeros(3), Ramp(2)})});
}

}  // namespace
}  // namespace glimmet
