#include <gtest/gtest.h>

#include <memory>

#include <algorithm>
#include <array>
#include <atomic>
#include <bit>
#include <cmath>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "FakeDocumentWindow.h"
#include "MixSamples.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/SoftClip.h"
#include "support/DiagnosticsCapture.h"
#include "support/MessageCodes.h"

namespace glimmet {
namespace {

using test::Counting;
using test::Level;
using test::Samples;

Channel* MakeChannel(const Samples& samples, int64_t first = 0, int8_t pan = 0)
{
    auto* channel = new Channel();
    if (!samples.empty()) {
        EXPECT_EQ(channel->InsertFrames(samples.data(), int64_t(samples.size()), first), B_OK);
    }
    channel->SetPanPosition(pan);
    return channel;
}

struct ManagerFixture : ::testing::Test {
    FakeDocumentWindow window;
    ChannelManager manager{&window};

    std::vector<float> Mix(int64_t frames, bool* result = nullptr)
    {
        std::vector<float> out(size_t(frames) * 2, -9.0f);
        const bool filled = manager.FillBuffer(out.data(), frames);
        if (result != nullptr)
            *result = filled;
        return out;
    }

    // The left outputs of a mono channel at pan middle equal the samples.
    void ExpectMonoFrames(const std::vector<float>& out, const Samples& expected)
    {
        ASSERT_EQ(out.size(), expected.size() * 2);
        for (size_t i = 0; i < expected.size(); ++i) {
            EXPECT_EQ(out[2 * i], Level(expected[i])) << "frame " << i;
            EXPECT_EQ(out[2 * i + 1], Level(expected[i])) << "frame " << i;
        }
    }

    std::vector<uint32_t> Codes()
    {
        std::vector<uint32_t> codes;
        for (const Message& message : window.TakeMessages())
            codes.push_back(message.what);
        return codes;
    }
};

TEST_F(ManagerFixture, InitialState)
{
    EXPECT_EQ(manager.FrameRate(), 44100.0f);
    EXPECT_EQ(manager.CurrentFrame(), 0);
    EXPECT_EQ(manager.PlayMode(), 0);
    EXPECT_TRUE(manager.Loop());
    EXPECT_EQ(manager.RangeStart(), -1);
    EXPECT_EQ(manager.RangeEnd(), -1);
    EXPECT_EQ(manager.CountChannels(), 0);
    EXPECT_EQ(manager.FrameCount(), 0);
}

TEST_F(ManagerFixture, FrameCountIsTheLatestEnd)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(10), 0)));
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(5), 20)));
    EXPECT_EQ(manager.FrameCount(), 25);
}

TEST_F(ManagerFixture, ChannelListOperations)
{
    Channel* a = MakeChannel(Counting(3));
    Channel* b = MakeChannel(Counting(3));
    Channel* c = MakeChannel(Counting(3));
    manager.AddChannel(std::unique_ptr<Channel>(a));
    manager.AddChannel(std::unique_ptr<Channel>(c));
    EXPECT_EQ(manager.AddChannel(std::unique_ptr<Channel>(b), 1), nullptr);
    EXPECT_EQ(manager.ChannelAt(0), a);
    EXPECT_EQ(manager.ChannelAt(1), b);
    EXPECT_EQ(manager.ChannelAt(2), c);
    EXPECT_EQ(manager.ChannelAt(3), nullptr);
    EXPECT_EQ(manager.ChannelAt(-1), nullptr);

    // A channel refused is handed back, not freed.
    auto* stranger = new Channel();
    std::unique_ptr<Channel> refused = manager.AddChannel(std::unique_ptr<Channel>(stranger), 7);
    EXPECT_EQ(refused.get(), stranger);
    EXPECT_EQ(manager.CountChannels(), 3);
    EXPECT_EQ(manager.RemoveChannel(stranger), nullptr);
    manager.AddChannel(nullptr);
    EXPECT_EQ(manager.CountChannels(), 3);

    std::unique_ptr<Channel> removed = manager.RemoveChannel(b);
    EXPECT_EQ(removed.get(), b);
    EXPECT_EQ(manager.CountChannels(), 2);
    EXPECT_TRUE(manager.RemoveChannelAt(0));
    EXPECT_FALSE(manager.RemoveChannelAt(5));
    EXPECT_EQ(manager.ChannelAt(0), c);
    EXPECT_EQ(manager.IndexOf(c), 0);
    EXPECT_EQ(manager.IndexOf(b), -1);
}

TEST_F(ManagerFixture, FrameRateIgnoresNonPositiveValues)
{
    manager.SetFrameRate(0);
    EXPECT_EQ(manager.FrameRate(), 44100.0f);
    manager.SetFrameRate(-3);
    manager.SetFrameRate(std::nanf(""));
    EXPECT_EQ(manager.FrameRate(), 44100.0f);
    manager.SetFrameRate(48000);
    EXPECT_EQ(manager.FrameRate(), 48000.0f);
}

TEST_F(ManagerFixture, CurrentFrameIsStoredWithoutClamping)
{
    manager.SetCurrentFrame(-77);
    EXPECT_EQ(manager.CurrentFrame(), -77);
    manager.SetPlayMode(7);
    EXPECT_EQ(manager.PlayMode(), 7);
    manager.ResetCurrentFrame();
    EXPECT_EQ(manager.CurrentFrame(), -77);
    for (int32_t mode : {0, 1, 2}) {
        manager.SetCurrentFrame(55);
        manager.SetPlayMode(mode);
        manager.ResetCurrentFrame();
        EXPECT_EQ(manager.CurrentFrame(), 0);
    }
}

TEST_F(ManagerFixture, RangeValuesStoredAsAskedAreNotAnnounced)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(1000))));
    manager.SetRangeEnd(500);
    manager.SetRangeStart(100);
    EXPECT_EQ(manager.RangeStart(), 100);
    EXPECT_EQ(manager.RangeEnd(), 500);
    EXPECT_TRUE(window.TakeMessages().empty());
}

TEST_F(ManagerFixture, StartAboveTheEndPullsTheEndAlong)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(1000))));
    manager.SetRangeStart(300);
    EXPECT_EQ(manager.RangeEnd(), 300);
    std::vector<Message> messages = window.TakeMessages();
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_EQ(messages[0].what, kMsgRangeEndChanged);
    int64_t value = 0;
    EXPECT_EQ(messages[0].FindInt64("range end", &value), B_OK);
    EXPECT_EQ(value, 300);
}

TEST_F(ManagerFixture, RangeStartPastTheEndIsClampedAndEndFollowsTheArgument)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(1000))));
    manager.SetRangeEnd(-1);
    window.TakeMessages();
    manager.SetRangeStart(1010);
    EXPECT_EQ(manager.RangeStart(), 999);
    EXPECT_EQ(manager.RangeEnd(), 1010);
    std::vector<Message> messages = window.TakeMessages();
    ASSERT_EQ(messages.size(), 2u);
    int64_t value = 0;
    EXPECT_EQ(messages[0].what, kMsgRangeStartChanged);
    EXPECT_EQ(messages[0].FindInt64("range start", &value), B_OK);
    EXPECT_EQ(value, 999);
    EXPECT_EQ(messages[1].what, kMsgRangeEndChanged);
    EXPECT_EQ(messages[1].FindInt64("range end", &value), B_OK);
    EXPECT_EQ(value, 1010);
}

TEST_F(ManagerFixture, RangeEndPastTheEndIsClampedAndStartFollowsTheArgument)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(100))));
    manager.SetRangeStart(50);
    window.TakeMessages();
    manager.SetRangeEnd(20);
    EXPECT_EQ(manager.RangeStart(), 20);
    EXPECT_EQ(manager.RangeEnd(), 20);
    std::vector<Message> messages = window.TakeMessages();
    ASSERT_EQ(messages.size(), 1u);
    EXPECT_EQ(messages[0].what, kMsgRangeStartChanged);

    manager.SetRangeEnd(300);
    EXPECT_EQ(manager.RangeEnd(), 99);
    messages = window.TakeMessages();
    ASSERT_EQ(messages.size(), 1u);
    int64_t value = 0;
    EXPECT_EQ(messages[0].what, kMsgRangeEndChanged);
    EXPECT_EQ(messages[0].FindInt64("range end", &value), B_OK);
    EXPECT_EQ(value, 99);
}

TEST_F(ManagerFixture, ClearingTheRange)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(100))));
    manager.SetRangeStart(10);
    manager.SetRangeEnd(20);
    window.TakeMessages();
    manager.SetRangeStart(-1);
    manager.SetRangeEnd(-1);
    EXPECT_EQ(manager.RangeStart(), -1);
    EXPECT_EQ(manager.RangeEnd(), -1);
    EXPECT_TRUE(window.TakeMessages().empty());
}

// Mixing --------------------------------------------------------------------

TEST_F(ManagerFixture, EmptyDocument)
{
    EXPECT_EQ(manager.FrameCount(), 0);
    bool filled = true;
    std::vector<float> out = Mix(64, &filled);
    EXPECT_FALSE(filled);
    EXPECT_EQ(out, std::vector<float>(128, -9.0f));
    EXPECT_EQ(manager.CurrentFrame(), -1);

    // Saving starts from frame 0, which is already the end.
    manager.SetCurrentFrame(0);
    int16_t saved[8] = {1, 1, 1, 1, 1, 1, 1, 1};
    int64_t frames = 4;
    EXPECT_FALSE(manager.FillBuffer(saved, &frames));
    EXPECT_EQ(frames, 4);
    EXPECT_EQ(saved[0], 1);
}

TEST_F(ManagerFixture, OneFrameBufferOfTheEmptyDocumentLoopsInPlace)
{
    bool filled = false;
    std::vector<float> out = Mix(1, &filled);
    EXPECT_TRUE(filled);
    EXPECT_EQ(out, std::vector<float>({0.0f, 0.0f}));
    EXPECT_TRUE(Codes().empty());
    EXPECT_EQ(manager.CurrentFrame(), -1);
}

TEST_F(ManagerFixture, OneFrameBufferOfTheEmptyDocumentStops)
{
    manager.SetLoop(false);
    bool filled = false;
    std::vector<float> out = Mix(1, &filled);
    EXPECT_TRUE(filled);
    EXPECT_EQ(out, std::vector<float>({0.0f, 0.0f}));
    EXPECT_EQ(Codes(), std::vector<uint32_t>({kMsgStop}));
}

TEST_F(ManagerFixture, PanPositions)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel({1000, -2000}, 0, Channel::kPanLeft)));
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel({300, 400}, 0, Channel::kPanRight)));
    std::vector<float> out = Mix(2);
    EXPECT_EQ(out, std::vector<float>({Level(1000), Level(300), Level(-2000), Level(400)}));
}

TEST_F(ManagerFixture, MiddleGoesToBothSidesAndMutedToNone)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel({1000, -2000}, 0, Channel::kPanMiddle)));
    Channel* muted = MakeChannel({5000, 5000}, 0, Channel::kPanMiddle);
    muted->SetMuted(true);
    manager.AddChannel(std::unique_ptr<Channel>(muted));
    std::vector<float> out = Mix(2);
    EXPECT_EQ(out, std::vector<float>({Level(1000), Level(1000), Level(-2000), Level(-2000)}));
}

TEST_F(ManagerFixture, OneFullScaleChannelIsNotBent)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel({32767, 32767})));
    std::vector<float> out = Mix(2);
    for (float value : out)
        EXPECT_EQ(value, 32767.0f / 32768.0f);
}

TEST_F(ManagerFixture, TwoContributorsGoThroughTheCurve)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel({32767, 100})));
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel({32767, 200})));
    std::vector<float> out = Mix(2);
    const float loud = soft_clip(32767.0f / 32768.0f + 32767.0f / 32768.0f);
    EXPECT_EQ(out[0], loud);
    EXPECT_EQ(out[1], loud);
    EXPECT_NEAR(loud, soft_clip(1.99994f), 1e-6f);
    const float quiet = Level(100) + Level(200);
    EXPECT_EQ(out[2], quiet);
    EXPECT_EQ(out[3], quiet);
}

TEST_F(ManagerFixture, OneSideWithOneContributorTheOtherWithTwo)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel({20000}, 0, Channel::kPanLeft)));
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel({20000}, 0, Channel::kPanMiddle)));
    std::vector<float> out = Mix(1);
    EXPECT_EQ(out[0], soft_clip(Level(20000) + Level(20000)));
    EXPECT_EQ(out[1], Level(20000));
}

TEST_F(ManagerFixture, ChannelsStartingLateAreSilentBefore)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(4, 1), 2, Channel::kPanLeft)));
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(6, 10), 0, Channel::kPanRight)));
    std::vector<float> out = Mix(6);
    const std::vector<float> expected = {0, Level(10), 0, Level(11), Level(1), Level(12), Level(2), Level(13),
        Level(3), Level(14), Level(4), Level(15)};
    EXPECT_EQ(out, expected);
}

TEST_F(ManagerFixture, AllModeWalksTheDocumentInBuffers)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(200))));
    manager.SetLoop(false);
    Samples all = Counting(200);
    ExpectMonoFrames(Mix(64), Samples(all.begin(), all.begin() + 64));
    EXPECT_EQ(manager.CurrentFrame(), 64);
    ExpectMonoFrames(Mix(64), Samples(all.begin() + 64, all.begin() + 128));
    ExpectMonoFrames(Mix(64), Samples(all.begin() + 128, all.begin() + 192));
    EXPECT_TRUE(Codes().empty());
    Samples last(all.begin() + 192, all.end());
    last.resize(64, 0);
    ExpectMonoFrames(Mix(64), last);
    EXPECT_EQ(manager.CurrentFrame(), 200);
    EXPECT_EQ(Codes(), std::vector<uint32_t>({kMsgStop}));
    // Past the end the next buffer starts over until the window stops.
    ExpectMonoFrames(Mix(64), Samples(all.begin(), all.begin() + 64));
}

TEST_F(ManagerFixture, ABufferEndingExactlyAtTheEndStops)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(128))));
    manager.SetLoop(false);
    Mix(64);
    ExpectMonoFrames(Mix(64), Counting(64, 64));
    EXPECT_EQ(manager.CurrentFrame(), 128);
    EXPECT_EQ(Codes(), std::vector<uint32_t>({kMsgStop}));
}

TEST_F(ManagerFixture, RangeModeLooping)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(1000))));
    manager.SetRangeStart(100);
    manager.SetRangeEnd(199);
    manager.SetPlayMode(ChannelManager::kPlayRange);
    manager.SetCurrentFrame(0);
    window.TakeMessages();
    ExpectMonoFrames(Mix(64), Counting(64, 100));
    EXPECT_EQ(manager.CurrentFrame(), 164);
    Samples expected = Counting(36, 164);
    Samples wrapped = Counting(28, 100);
    expected.insert(expected.end(), wrapped.begin(), wrapped.end());
    ExpectMonoFrames(Mix(64), expected);
    EXPECT_EQ(manager.CurrentFrame(), 128);
    EXPECT_TRUE(Codes().empty());
}

TEST_F(ManagerFixture, RangeModeNotLooping)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(1000))));
    manager.SetRangeStart(100);
    manager.SetRangeEnd(199);
    manager.SetPlayMode(ChannelManager::kPlayRange);
    manager.SetLoop(false);
    window.TakeMessages();
    Mix(64);
    Samples expected = Counting(36, 164);
    expected.resize(64, 0);
    ExpectMonoFrames(Mix(64), expected);
    EXPECT_EQ(manager.CurrentFrame(), 200);
    EXPECT_EQ(Codes(), std::vector<uint32_t>({kMsgStop}));
}

TEST_F(ManagerFixture, RangeModeWithoutRangePlaysEverything)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(300))));
    manager.SetPlayMode(ChannelManager::kPlayRange);
    EXPECT_EQ(manager.RangeStart(), -1);
    manager.SetCurrentFrame(250);
    ExpectMonoFrames(Mix(40), Counting(40, 250));
}

TEST_F(ManagerFixture, RangeShorterThanTheBuffer)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(1000))));
    manager.SetRangeStart(10);
    manager.SetRangeEnd(20);
    manager.SetPlayMode(ChannelManager::kPlayRange);
    bool filled = true;
    std::vector<float> out = Mix(64, &filled);
    EXPECT_FALSE(filled);
    EXPECT_EQ(out, std::vector<float>(128, -9.0f));
    EXPECT_EQ(manager.CurrentFrame(), 10);
    // A buffer exactly as long as the range is played and ends it.
    manager.SetLoop(false);
    window.TakeMessages();
    ExpectMonoFrames(Mix(11), Counting(11, 10));
    EXPECT_EQ(Codes(), std::vector<uint32_t>({kMsgStop}));
}

TEST_F(ManagerFixture, VisibleModeAsksTheWindowWhenItsLockIsFree)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(1000))));
    manager.SetPlayMode(ChannelManager::kPlayVisible);
    window.visibleFirst = 300;
    window.visibleLast = 399;
    ExpectMonoFrames(Mix(32), Counting(32, 300));
    ASSERT_FALSE(window.LockTimeouts().empty());
    EXPECT_EQ(window.LockTimeouts().back(), 100);
    EXPECT_FALSE(window.windowLock.IsLockedByCurrentThread());
}

TEST_F(ManagerFixture, VisibleModeFallsBackToTheDocumentWhenTheWindowIsBusy)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(1000))));
    manager.SetPlayMode(ChannelManager::kPlayVisible);
    window.visibleFirst = 300;
    window.visibleLast = 399;
    std::atomic<bool> held{false};
    std::atomic<bool> release{false};
    std::thread holder([&] {
        window.windowLock.Lock();
        held = true;
        while (!release)
            std::this_thread::yield();
        window.windowLock.Unlock();
    });
    while (!held)
        std::this_thread::yield();
    manager.SetCurrentFrame(500);
    ExpectMonoFrames(Mix(32), Counting(32, 500));
    release = true;
    holder.join();
}

TEST_F(ManagerFixture, VisibleRangeIsClampedToTheDocument)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(100))));
    manager.SetPlayMode(ChannelManager::kPlayVisible);
    manager.SetLoop(true);
    window.visibleFirst = -50;
    window.visibleLast = 5000;
    manager.SetCurrentFrame(90);
    Samples expected = Counting(10, 90);
    Samples wrapped = Counting(6, 0);
    expected.insert(expected.end(), wrapped.begin(), wrapped.end());
    ExpectMonoFrames(Mix(16), expected);
    EXPECT_EQ(manager.CurrentFrame(), 6);
}

TEST_F(ManagerFixture, SaveMixConvertsAndReportsShortLastBuffer)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel({32767, -32768, 1, 0, 16384}, 0, Channel::kPanLeft)));
    int16_t out[8];
    int64_t frames = 4;
    EXPECT_TRUE(manager.FillBuffer(out, &frames));
    EXPECT_EQ(frames, 4);
    const int16_t expected[8] = {32766, 0, -32767, 0, 1, 0, 0, 0};
    for (int i = 0; i < 8; ++i)
        EXPECT_EQ(out[i], expected[i]) << i;
    frames = 4;
    EXPECT_TRUE(manager.FillBuffer(out, &frames));
    EXPECT_EQ(frames, 1);
    EXPECT_EQ(out[0], 16384);  // 0.5 * 32767 = 16383.5 rounds to even
    EXPECT_EQ(out[1], 0);
    frames = 4;
    EXPECT_FALSE(manager.FillBuffer(out, &frames));
}

TEST_F(ManagerFixture, SaveMixIgnoresModeRangeAndLoop)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(50))));
    manager.SetRangeStart(10);
    manager.SetRangeEnd(20);
    manager.SetPlayMode(ChannelManager::kPlayRange);
    manager.SetCurrentFrame(30);
    std::vector<int16_t> out(200);
    int64_t frames = 100;
    EXPECT_TRUE(manager.FillBuffer(out.data(), &frames));
    EXPECT_EQ(frames, 20);
    for (int64_t i = 0; i < frames; ++i)
        EXPECT_EQ(out[size_t(2 * i)], int16_t(std::lrintf(Level(int16_t(30 + i)) * 32767.0f)));
    EXPECT_EQ(manager.CurrentFrame(), 50);
}

TEST_F(ManagerFixture, SaveMixOfManyLoudChannels)
{
    for (int i = 0; i < 4; ++i)
        manager.AddChannel(std::unique_ptr<Channel>(MakeChannel({32767, 8000})));
    int16_t out[4];
    int64_t frames = 2;
    EXPECT_TRUE(manager.FillBuffer(out, &frames));
    // Four full-scale channels fold the curve below -1: out of the 16-bit
    // range the conversion stores -32768.
    EXPECT_LT(soft_clip(4 * Level(32767)) * 32767.0f, -32768.5f);
    EXPECT_EQ(out[0], -32768);
    EXPECT_EQ(out[2], int16_t(std::lrintf(soft_clip(4 * Level(8000)) * 32767.0f)));
}

TEST_F(ManagerFixture, RemovedChannelsAreNotMixedAndDeletedOnesFreed)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel({100})));
    Channel* second = MakeChannel({200});
    manager.AddChannel(std::unique_ptr<Channel>(second));
    std::unique_ptr<Channel> kept = manager.RemoveChannel(second);
    ExpectMonoFrames(Mix(1), {100});
}

// One edit of the stress document: the numbers that next gives choose it,
// so the same numbers make the same edit on another document.
template <typename Next>
void EditStressDocument(ChannelManager& manager, Next& next, const Samples& block)
{
    const int32_t count = manager.CountChannels();
    Channel* channel = count > 0 ? manager.ChannelAt(int32_t(next() % uint32_t(count))) : nullptr;
    switch (next() % 6) {
        case 0:
            if (channel != nullptr) {
                const int64_t length = 1 + next() % 700;
                channel->InsertFrames(block.data(), length, next() % 20000);
            }
            break;
        case 1:
            if (channel != nullptr) {
                const int64_t from = next() % 20000;
                const int64_t length = 1 + next() % 700;
                channel->ReplaceFrames(block.data(), length, from, from + next() % 900);
            }
            break;
        case 2:
            if (channel != nullptr) {
                const int64_t from = next() % 20000;
                channel->RemoveFrames(from, from + next() % 900);
            }
            break;
        case 3:
            if (count < 8) {
                const int64_t length = 1 + next() % 5000;
                manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(length), next() % 3000)));
            }
            break;
        case 4:
            if (count > 1)
                manager.RemoveChannelAt(int32_t(next() % uint32_t(count)));
            break;
        default:
            if (channel != nullptr) {
                channel->SetMuted(next() % 2 == 0);
                channel->SetPanPosition(int8_t(next() % 3 == 0 ? -128 : 0));
            }
            manager.SetPlayMode(int32_t(next() % 3));
            manager.SetRangeStart(next() % 10000);
            manager.SetRangeEnd(10000 + next() % 10000);
            manager.SetLoop(next() % 4 != 0);
            break;
    }
}

void SetUpStressDocument(ChannelManager& manager, FakeDocumentWindow& window)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(20000))));
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(15000), 300, Channel::kPanLeft)));
    manager.SetPlayMode(ChannelManager::kPlayVisible);
    window.visibleFirst = 0;
    window.visibleLast = 30000;
}

uint64_t HashOf(const std::vector<float>& values)
{
    uint64_t hash = 14695981039346656037ull;
    for (float value : values) {
        hash ^= std::bit_cast<uint32_t>(value);
        hash *= 1099511628211ull;
    }
    return hash;
}

// One buffer mixed during the edits: the edits done before it began and
// after it ended (it saw the document as it was after some count of edits
// in between), the play position before and after, and what it gave.
struct MixedBuffer {
    int64_t editsBefore;
    int64_t editsAfter;
    int64_t from;
    int64_t to;
    bool filled;
    uint64_t hash;
};

constexpr int64_t kStressFrames = 256;

// Whether the model, as it is now, mixes the buffer exactly as recorded.
bool MixesAlike(ChannelManager& model, const MixedBuffer& buffer, std::vector<float>& out)
{
    model.SetCurrentFrame(buffer.from);
    const bool filled = model.FillBuffer(out.data(), kStressFrames);
    return filled == buffer.filled && model.CurrentFrame() == buffer.to && (!filled || HashOf(out) == buffer.hash);
}

void ExpectSameDocument(ChannelManager& document, ChannelManager& model)
{
    ASSERT_EQ(document.CountChannels(), model.CountChannels());
    for (int32_t c = 0; c < document.CountChannels(); ++c) {
        Channel* mine = document.ChannelAt(c);
        Channel* theirs = model.ChannelAt(c);
        ASSERT_EQ(mine->FirstFrame(), theirs->FirstFrame()) << c;
        ASSERT_EQ(mine->FrameCount(), theirs->FrameCount()) << c;
        EXPECT_EQ(mine->IsMuted(), theirs->IsMuted()) << c;
        EXPECT_EQ(mine->PanPosition(), theirs->PanPosition()) << c;
        Samples a(size_t(mine->FrameCount()));
        Samples b(a.size());
        mine->FillBuffer(a.data(), mine->FirstFrame(), mine->FrameCount());
        theirs->FillBuffer(b.data(), theirs->FirstFrame(), theirs->FrameCount());
        EXPECT_EQ(a, b) << c;
    }
    EXPECT_EQ(document.PlayMode(), model.PlayMode());
    EXPECT_EQ(document.Loop(), model.Loop());
    EXPECT_EQ(document.RangeStart(), model.RangeStart());
    EXPECT_EQ(document.RangeEnd(), model.RangeEnd());
}

// Edits on one thread while another mixes, as the window and the audio
// thread do; run under ThreadSanitizer in CI. The same edits are then made
// again on a model without any mixing: the document must end up equal to
// it, and every buffer mixed during the edits must be exactly the buffer
// the model mixes, from the same play position, in one of the states the
// document went through while that buffer was mixed. A mix that saw an
// edit half done, or an edit disturbed by a mix, fails.
TEST(ChannelManagerStress, MixingWhileEditing)
{
    constexpr uint32_t kSeed = 12345;
    FakeDocumentWindow window;
    ChannelManager manager(&window);
    SetUpStressDocument(manager, window);
    // Edits and mixes print the refused requests they meet; not of interest.
    DiagnosticsCapture capture;

    std::atomic<int64_t> editsDone{0};
    std::atomic<bool> editing{true};
    std::atomic<int64_t> buffers{0};
    std::vector<MixedBuffer> mixed;
    std::thread mixer([&] {
        std::vector<float> out(size_t(kStressFrames) * 2);
        for (bool last = false; !last;) {
            // One more buffer after the edits end, so the last state is mixed.
            last = !editing;
            MixedBuffer buffer{};
            buffer.editsBefore = editsDone;
            buffer.from = manager.CurrentFrame();
            buffer.filled = manager.FillBuffer(out.data(), kStressFrames);
            buffer.to = manager.CurrentFrame();
            buffer.editsAfter = editsDone;
            buffer.hash = buffer.filled ? HashOf(out) : 0;
            mixed.push_back(buffer);
            ++buffers;
        }
    });
    // The first buffer sees the document before any edit.
    while (buffers == 0)
        std::this_thread::yield();

    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(2);
    uint32_t seed = kSeed;
    auto next = [&seed] {
        seed = seed * 1664525u + 1013904223u;
        return seed >> 8;
    };
    const Samples block = Counting(700);
    int64_t edits = 0;
    while (std::chrono::steady_clock::now() < deadline) {
        manager.Lock();
        EditStressDocument(manager, next, block);
        // Counted before the lock goes, so a mix that takes it next knows.
        ++editsDone;
        manager.Unlock();
        ++edits;
    }
    editing = false;
    mixer.join();
    EXPECT_GT(buffers.load(), 0);
    EXPECT_GT(edits, 0);

    FakeDocumentWindow modelWindow;
    ChannelManager model(&modelWindow);
    SetUpStressDocument(model, modelWindow);
    seed = kSeed;
    std::vector<bool> matched(mixed.size(), false);
    std::vector<float> out(size_t(kStressFrames) * 2);
    size_t first = 0;
    for (int64_t state = 0; state <= edits; ++state) {
        if (state > 0)
            EditStressDocument(model, next, block);
        while (first < mixed.size() && mixed[first].editsAfter < state)
            ++first;
        for (size_t i = first; i < mixed.size() && mixed[i].editsBefore <= state; ++i) {
            if (!matched[i])
                matched[i] = MixesAlike(model, mixed[i], out);
        }
    }
    capture.Finish();

    ExpectSameDocument(manager, model);
    const auto unmatched = std::find(matched.begin(), matched.end(), false);
    EXPECT_EQ(unmatched, matched.end()) << "buffer " << (unmatched - matched.begin()) << " of " << mixed.size()
                                        << " matches no state the document was in while it was mixed";
    // Buffers were mixed before the first edit and after the last, and the
    // mixes were not all silence or refusals.
    EXPECT_EQ(mixed.front().editsBefore, 0);
    EXPECT_EQ(mixed.back().editsBefore, edits);
    const uint64_t silence = HashOf(std::vector<float>(size_t(kStressFrames) * 2, 0.0f));
    EXPECT_GT(std::count_if(mixed.begin(), mixed.end(),
                  [silence](const MixedBuffer& buffer) { return buffer.filled && buffer.hash != silence; }),
        0);
}

}  // namespace
}  // namespace glimmet

namespace glimmet {
namespace {

// The mix written out frame by frame as the document defines it: every heard
// channel adds s / 32768 to its side in list order, in single precision.
std::vector<float> ReferenceMix(const std::vector<Samples>& channels, const std::vector<int8_t>& pans,
    const std::vector<bool>& muted, int64_t frames)
{
    std::vector<float> out;
    for (int64_t i = 0; i < frames; ++i) {
        float left = 0;
        float right = 0;
        int32_t leftCount = 0;
        int32_t rightCount = 0;
        for (size_t c = 0; c < channels.size(); ++c) {
            if (muted[c])
                continue;
            const float value = float(channels[c][size_t(i)]) * 3.0517578125e-05f;
            if (pans[c] == 0 || pans[c] == -128) {
                left += value;
                ++leftCount;
            }
            if (pans[c] == 0 || pans[c] == 127) {
                right += value;
                ++rightCount;
            }
        }
        out.push_back(leftCount == 0 ? 0.0f : leftCount == 1 ? left : soft_clip(left));
        out.push_back(rightCount == 0 ? 0.0f : rightCount == 1 ? right : soft_clip(right));
    }
    return out;
}

class MixAgainstReference : public ::testing::TestWithParam<int32_t> {};

TEST_P(MixAgainstReference, RandomDocumentsMixBitForBit)
{
    const int32_t channelCount = GetParam();
    const int64_t frames = 96;
    uint32_t seed = 99u + uint32_t(channelCount);
    auto next = [&seed] {
        seed = seed * 1664525u + 1013904223u;
        return seed >> 8;
    };
    std::vector<Samples> channels;
    std::vector<int8_t> pans;
    std::vector<bool> muted;
    ChannelManager manager(nullptr);
    for (int32_t c = 0; c < channelCount; ++c) {
        Samples samples = Samples(size_t(frames));
        for (int16_t& sample : samples) {
            const uint32_t pick = next() % 8;
            sample = pick == 0 ? int16_t(32767) : pick == 1 ? int16_t(-32768) : int16_t(next() & 0xffff);
        }
        const int8_t pan = std::array<int8_t, 3>{-128, 0, 127}[next() % 3];
        Channel* channel = MakeChannel(samples, 0, pan);
        channel->SetMuted(next() % 5 == 0);
        channels.push_back(samples);
        pans.push_back(pan);
        muted.push_back(channel->IsMuted());
        manager.AddChannel(std::unique_ptr<Channel>(channel));
    }
    std::vector<float> out(size_t(frames) * 2);
    ASSERT_TRUE(manager.FillBuffer(out.data(), frames));
    const std::vector<float> expected = ReferenceMix(channels, pans, muted, frames);
    for (size_t i = 0; i < out.size(); ++i)
        ASSERT_EQ(std::bit_cast<uint32_t>(out[i]), std::bit_cast<uint32_t>(expected[i])) << "value " << i;

    manager.SetCurrentFrame(0);
    std::vector<int16_t> saved(size_t(frames) * 2);
    int64_t count = frames;
    ASSERT_TRUE(manager.FillBuffer(saved.data(), &count));
    for (size_t i = 0; i < saved.size(); ++i) {
        const float scaled = expected[i] * 32767.0f;
        const int16_t want = (scaled >= -32768.5f && scaled < 32767.5f) ? int16_t(std::lrintf(scaled)) : int16_t(-32768);
        ASSERT_EQ(saved[i], want) << "value " << i;
    }
}

INSTANTIATE_TEST_SUITE_P(ChannelCounts, MixAgainstReference, ::testing::Values(1, 2, 3, 5, 16, 64, 300, 1100));

}  // namespace
}  // namespace glimmet

namespace glimmet {
namespace {

// Channels that start late, end early, are empty, muted or panned, mixed
// buffer after buffer around the loop (and, without it, up to the stop) and
// saved, each value compared bit for bit with a mix made from each
// channel's own FillBuffer, request by request, summed in float in channel
// order.
class ScatteredMix : public ::testing::TestWithParam<int32_t> {};

struct ScatteredChannel {
    Channel* channel;
    bool muted;
    int8_t pan;
};

std::vector<float> ScatteredReference(const std::vector<ScatteredChannel>& channels, int64_t frames,
    const std::vector<std::array<int64_t, 3>>& parts)
{
    std::vector<float> left(size_t(frames), 0.0f);
    std::vector<float> right(size_t(frames), 0.0f);
    int32_t leftCount = 0;
    int32_t rightCount = 0;
    for (const ScatteredChannel& item : channels) {
        // Muted channels are asked for their samples too.
        Samples samples(size_t(frames), 0);
        for (const auto& [from, offset, count] : parts) {
            if (!item.channel->FillBuffer(samples.data() + offset, from, count))
                std::fill_n(samples.begin() + offset, count, int16_t(0));
        }
        if (item.muted)
            continue;
        const bool toLeft = item.pan == 0 || item.pan == -128;
        const bool toRight = item.pan == 0 || item.pan == 127;
        leftCount += toLeft;
        rightCount += toRight;
        for (int64_t i = 0; i < frames; ++i) {
            const float value = float(samples[size_t(i)]) * 3.0517578125e-05f;
            if (toLeft)
                left[size_t(i)] += value;
            if (toRight)
                right[size_t(i)] += value;
        }
    }
    std::vector<float> out;
    for (int64_t i = 0; i < frames; ++i) {
        for (auto [sum, count] : {std::pair(left[size_t(i)], leftCount), std::pair(right[size_t(i)], rightCount)})
            out.push_back(count == 0 ? 0.0f : count == 1 ? sum : soft_clip(sum));
    }
    return out;
}

TEST_P(ScatteredMix, MixesBitForBit)
{
    const int32_t channelCount = GetParam();
    uint32_t seed = 7u + uint32_t(channelCount);
    auto next = [&seed] {
        seed = seed * 1664525u + 1013904223u;
        return seed >> 8;
    };
    ChannelManager manager(nullptr);
    std::vector<ScatteredChannel> channels;
    for (int32_t c = 0; c < channelCount; ++c) {
        // Every fifth channel is empty; the others hold up to 400 loud
        // samples somewhere in the first 300 frames.
        Samples samples(c % 5 == 4 ? 0 : 1 + next() % 400);
        for (int16_t& sample : samples)
            sample = next() % 4 == 0 ? int16_t(32767) : int16_t(next() & 0xffff);
        const int8_t pan = std::array<int8_t, 3>{-128, 0, 127}[next() % 3];
        Channel* channel = MakeChannel(samples, samples.empty() ? 0 : next() % 300, pan);
        channel->SetMuted(next() % 6 == 0);
        channels.push_back({channel, channel->IsMuted(), pan});
        manager.AddChannel(std::unique_ptr<Channel>(channel));
    }
    const int64_t total = manager.FrameCount();
    ASSERT_GT(total, 200);
    const int64_t frames = 64;
    for (bool loop : {true, false}) {
        manager.SetLoop(loop);
        manager.SetCurrentFrame(0);
        for (int buffer = 0; buffer < 20; ++buffer) {
            // The parts of the timeline the buffer plays, as the mixer cuts it.
            const int64_t current = manager.CurrentFrame() > total - 1 ? 0 : manager.CurrentFrame();
            std::vector<std::array<int64_t, 3>> parts;
            if (current + frames <= total - 1) {
                parts.push_back({current, 0, frames});
            } else {
                const int64_t head = total - current;
                parts.push_back({current, 0, head});
                if (loop)
                    parts.push_back({0, head, frames - head});
            }
            DiagnosticsCapture capture;
            const std::vector<float> expected = ScatteredReference(channels, frames, parts);
            const std::string printedByReference = capture.Finish();
            std::vector<float> out(size_t(frames) * 2, -9.0f);
            DiagnosticsCapture secondCapture;
            ASSERT_TRUE(manager.FillBuffer(out.data(), frames));
            const std::string printedByMix = secondCapture.Finish();
            for (size_t i = 0; i < out.size(); ++i) {
                ASSERT_EQ(std::bit_cast<uint32_t>(out[i]), std::bit_cast<uint32_t>(expected[i]))
                    << "loop " << loop << " buffer " << buffer << " value " << i;
            }
            // Each refused request says so once, in the mix as on its own.
            EXPECT_EQ(printedByMix, printedByReference);
        }
    }

    manager.SetCurrentFrame(0);
    std::vector<int16_t> saved(size_t(total) * 2);
    int64_t count = total;
    ASSERT_TRUE(manager.FillBuffer(saved.data(), &count));
    ASSERT_EQ(count, total);
    const std::vector<float> expected = ScatteredReference(channels, total, {{0, 0, total}});
    for (size_t i = 0; i < saved.size(); ++i) {
        const float scaled = expected[i] * 32767.0f;
        const int16_t want = (scaled >= -32768.5f && scaled < 32767.5f) ? int16_t(std::lrintf(scaled)) : int16_t(-32768);
        ASSERT_EQ(saved[i], want) << "value " << i;
    }
}

INSTANTIATE_TEST_SUITE_P(ChannelCounts, ScatteredMix, ::testing::Values(1, 2, 3, 6, 17, 64, 700));

}  // namespace
}  // namespace glimmet
