#include <gtest/gtest.h>

#include <memory>

#include <atomic>
#include <cmath>
#include <set>
#include <thread>
#include <vector>

#include "FakeDocumentWindow.h"
#include "MixSamples.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/Mixer.h"
#include "sound/SoftClip.h"

namespace glimmet {
namespace {

using test::Counting;
using test::Level;
using test::Samples;

Channel* MakeChannel(const Samples& samples, int8_t pan = Channel::kPanMiddle)
{
    auto* channel = new Channel();
    EXPECT_EQ(channel->InsertFrames(samples.data(), int64_t(samples.size()), 0), B_OK);
    channel->SetPanPosition(pan);
    return channel;
}

struct MixerFixture : ::testing::Test {
    FakeDocumentWindow window;
    ChannelManager manager{&window};
    Mixer mixer{&manager};

    std::vector<float> Mix(int64_t frames, bool* filled, bool* reachedEnd)
    {
        std::vector<float> out(size_t(frames) * 2, -9.0f);
        *filled = mixer.FillBuffer(out.data(), frames, reachedEnd);
        return out;
    }

    // Both sides of a mono channel at pan middle equal its samples.
    static void ExpectMonoFrames(const std::vector<float>& out, const Samples& expected)
    {
        ASSERT_EQ(out.size(), expected.size() * 2);
        for (size_t i = 0; i < expected.size(); ++i) {
            EXPECT_EQ(out[2 * i], Level(expected[i])) << "frame " << i;
            EXPECT_EQ(out[2 * i + 1], Level(expected[i])) << "frame " << i;
        }
    }
};

TEST_F(MixerFixture, AnUnpreparedMixerRefusesEveryBufferAndChangesNothing)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(500))));
    manager.SetCurrentFrame(7);
    bool filled = true;
    bool reachedEnd = true;
    EXPECT_EQ(Mix(16, &filled, &reachedEnd), std::vector<float>(32, -9.0f));
    EXPECT_FALSE(filled);
    EXPECT_FALSE(reachedEnd);
    EXPECT_EQ(manager.CurrentFrame(), 7);
}

TEST_F(MixerFixture, APreparedMixerPlaysUpToThePreparedLengthAndRefusesLonger)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(500))));
    mixer.Prepare(64);
    EXPECT_EQ(mixer.PreparedFrames(), 64);
    bool filled = false;
    bool reachedEnd = true;
    ExpectMonoFrames(Mix(64, &filled, &reachedEnd), Counting(64));
    EXPECT_TRUE(filled);
    EXPECT_FALSE(reachedEnd);
    EXPECT_EQ(manager.CurrentFrame(), 64);

    EXPECT_EQ(Mix(65, &filled, &reachedEnd), std::vector<float>(130, -9.0f));
    EXPECT_FALSE(filled);
    EXPECT_EQ(manager.CurrentFrame(), 64);
    // Shorter buffers fit as well.
    ExpectMonoFrames(Mix(10, &filled, &reachedEnd), Counting(10, 64));
    EXPECT_EQ(mixer.PreparedFrames(), 64);
}

TEST_F(MixerFixture, TheEndOfARangeIsReportedToTheCallerNotPostedToTheWindow)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(1000))));
    manager.SetRangeStart(100);
    manager.SetRangeEnd(199);
    manager.SetPlayMode(ChannelManager::kPlayRange);
    manager.SetLoop(false);
    window.TakeMessages();
    mixer.Prepare(64);
    bool filled = false;
    bool reachedEnd = true;
    Mix(64, &filled, &reachedEnd);
    EXPECT_FALSE(reachedEnd);
    Samples expected = Counting(36, 164);
    expected.resize(64, 0);
    ExpectMonoFrames(Mix(64, &filled, &reachedEnd), expected);
    EXPECT_TRUE(reachedEnd);
    EXPECT_EQ(manager.CurrentFrame(), 200);
    EXPECT_TRUE(window.TakeMessages().empty());
    // The next buffer starts the range again and has not reached its end.
    ExpectMonoFrames(Mix(64, &filled, &reachedEnd), Counting(64, 100));
    EXPECT_FALSE(reachedEnd);
}

TEST_F(MixerFixture, APreparedSaveMixProducesWhatFitsAndSaysHowMuch)
{
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Counting(250, 1000))));
    mixer.Prepare(100);
    std::vector<int16_t> out(500, 7);
    int64_t frames = 250;
    ASSERT_TRUE(mixer.FillBuffer(out.data(), &frames));
    EXPECT_EQ(frames, 100);
    EXPECT_EQ(manager.CurrentFrame(), 100);
    // One channel passes unchanged: s / 32768 * 32767, rounded.
    EXPECT_EQ(out[0], int16_t(std::lrintf(Level(1000) * 32767.0f)));
    EXPECT_EQ(out[199], int16_t(std::lrintf(Level(1099) * 32767.0f)));
    EXPECT_EQ(out[200], 7);
    frames = 250;
    ASSERT_TRUE(mixer.FillBuffer(out.data(), &frames));
    ASSERT_TRUE(mixer.FillBuffer(out.data(), &frames));
    EXPECT_EQ(frames, 50);
    EXPECT_FALSE(mixer.FillBuffer(out.data(), &frames));
}

// More channels than an integer sum keeps exact take the float path, still
// within the scratch prepared before they were added.
TEST_F(MixerFixture, ChannelsAddedAfterPreparingNeedNoMoreScratch)
{
    mixer.Prepare(32);
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Samples(100, 1000))));
    bool filled = false;
    bool reachedEnd = false;
    std::vector<float> out = Mix(32, &filled, &reachedEnd);
    ASSERT_TRUE(filled);
    EXPECT_EQ(out[62], Level(1000));

    for (int c = 1; c < 600; c++)
        manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Samples(100, 1), Channel::kPanLeft)));
    out = Mix(32, &filled, &reachedEnd);
    ASSERT_TRUE(filled);
    EXPECT_EQ(mixer.PreparedFrames(), 32);
    // 599 channels of 1 on the left beside the middle channel's 1000; only
    // the middle channel on the right.
    const float left = soft_clip(Level(1000) + 599 * Level(1));
    for (size_t i = 0; i < 32; i++) {
        ASSERT_EQ(out[2 * i], left) << i;
        ASSERT_EQ(out[2 * i + 1], Level(1000)) << i;
    }
}

// The audio thread plays while the window thread prepares again and adds
// channels. Every channel holds the same value at pan middle, so a buffer
// is right exactly when all its frames show the mix of one channel count
// the document had.
TEST(MixerStress, PreparingAndAddingChannelsWhilePlaying)
{
    constexpr int16_t kValue = 1000;
    constexpr int kMostChannels = 24;
    FakeDocumentWindow window;
    ChannelManager manager(&window);
    manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Samples(50000, kValue))));
    Mixer mixer(&manager);
    mixer.Prepare(256);

    std::set<float> allowed{Level(kValue)};
    for (int count = 2; count <= kMostChannels; count++)
        allowed.insert(soft_clip(float(count) * Level(kValue)));

    std::atomic<bool> done{false};
    std::atomic<int64_t> wrong{0};
    std::atomic<int64_t> buffers{0};
    std::thread player([&] {
        std::vector<float> out(512);
        bool reachedEnd = false;
        while (!done) {
            if (!mixer.FillBuffer(out.data(), 256, &reachedEnd)) {
                ++wrong;
                continue;
            }
            ++buffers;
            for (float value : out) {
                if (value != out[0] || allowed.count(value) == 0) {
                    ++wrong;
                    break;
                }
            }
        }
    });
    for (int count = 2; count <= kMostChannels; count++) {
        mixer.Prepare(count % 2 == 0 ? 512 : 256);
        manager.AddChannel(std::unique_ptr<Channel>(MakeChannel(Samples(50000, kValue))));
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    // Let the player see the last document too.
    const int64_t seen = buffers;
    while (buffers < seen + 3)
        std::this_thread::yield();
    done = true;
    player.join();
    EXPECT_EQ(wrong.load(), 0);
    EXPECT_GT(buffers.load(), 0);
    EXPECT_EQ(manager.CountChannels(), kMostChannels);
}

}  // namespace
}  // namespace glimmet
