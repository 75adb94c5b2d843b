#include <gtest/gtest.h>

#include <chrono>
#include <random>
#include <thread>

#include "PlaybackTestSupport.h"
#include "playback/AudioProducer.h"
#include "playback/AudioSystem.h"
#include "playback/PlaybackController.h"
#include "playback/PlaybackGraph.h"
#include "playback/SharedOutput.h"
#include "sound/ChannelManager.h"
#include "support/DiagnosticsCapture.h"
#include "support/MessageCodes.h"

namespace glimmet {
namespace {

using test::ChannelRecipe;
using test::DiskAudio;
using test::FakePlaybackWindow;

constexpr int64_t kLength = 20000;
constexpr size_t kPeriodFloats = 2 * test::kBufferFrames;

std::vector<ChannelRecipe> RandomDocument(unsigned seed)
{
    std::mt19937 random(seed);
    return {{test::RandomSamples(random, kLength, 100, 2400), 0, 0, false}};
}

std::vector<ChannelRecipe> ConstantDocument(int16_t sample)
{
    return {{std::vector<int16_t>(kLength, sample), 0, 0, false}};
}

float Level(int16_t sample)
{
    return float(sample) * (1.0f / 32768.0f);
}

/// One document window's playback: its document, its window and its graph,
/// looping over the whole document.
struct Player {
    explicit Player(std::vector<ChannelRecipe> recipe) : channels(std::move(recipe))
    {
        manager = std::make_unique<ChannelManager>(&window);
        test::AddChannels(manager.get(), channels);
        manager->SetLoop(true);
        graph = std::make_unique<PlaybackGraph>(manager.get(), &window);
    }

    status_t SetUp(std::string* printed = nullptr)
    {
        DiagnosticsCapture capture;
        const status_t status = graph->SetupNodes();
        const std::string text = capture.Finish();
        if (printed != nullptr)
            *printed += text;
        return status;
    }

    status_t Start()
    {
        manager->ResetCurrentFrame();
        return graph->StartNodes();
    }

    /// Stops and tears down, as a closing window does.
    void Close()
    {
        graph->StopNodes();
        graph->TearDownNodes();
    }

    int64_t BuffersSent() const { return graph->Producer()->FramesSent() / test::kBufferFrames; }

    /// Runs the event loop until the producer has sent count buffers more.
    bool WaitForBuffers(int64_t count)
    {
        const int64_t target = BuffersSent() + count;
        return window.ProcessUntil([&] { return BuffersSent() >= target; });
    }

    std::vector<ChannelRecipe> channels;
    FakePlaybackWindow window;
    std::unique_ptr<ChannelManager> manager;
    std::unique_ptr<PlaybackGraph> graph;
};

/// Sets up both windows, collecting what they print; true when both
/// succeed.
bool SetUpBoth(Player& first, Player& second, std::string* printed = nullptr)
{
    const status_t firstStatus = first.SetUp(printed);
    const status_t secondStatus = second.SetUp(printed);
    return firstStatus == B_OK && secondStatus == B_OK;
}

/// Starts both windows, lets each send the given buffers, then closes
/// both; true when both started and were heard.
bool PlayBothAndClose(Player& first, Player& second, int64_t buffers)
{
    const bool started = first.Start() == B_OK && second.Start() == B_OK;
    const bool heard = started && first.WaitForBuffers(buffers) && second.WaitForBuffers(buffers);
    first.Close();
    second.Close();
    return heard;
}

/// How each period of one window's playback was heard in the device output.
struct Heard {
    int64_t alone = 0;         // exactly its own buffer
    int64_t withOther = 0;     // its own buffer plus the other window's level
    int64_t wrong = 0;         // anything else
    int64_t firstWithOther = -1;
    int64_t lastWithOther = -1;
};

/// Compares the output, from its first sound on, with the given buffers of
/// the player's reference playback from frame 0; each period must be the
/// player's buffer alone or that buffer plus `other` in every sample.
Heard Classify(const std::vector<float>& output, const Player& player, int64_t buffers, float other)
{
    Heard heard;
    const int64_t first = test::FirstSound(output);
    EXPECT_GE(first, 0);
    EXPECT_EQ(first % int64_t(kPeriodFloats), 0);
    const test::ReferencePlayback reference(player.channels, 0, true, -1, -1, 0, 0);
    const std::vector<float> expected = reference.Play(0, buffers);
    if (first < 0 || output.size() < size_t(first) + expected.size()) {
        ADD_FAILURE() << "the output is too short";
        return heard;
    }
    for (int64_t period = 0; period < buffers; period++) {
        bool alone = true;
        bool withOther = true;
        for (size_t i = size_t(period) * kPeriodFloats; i < size_t(period + 1) * kPeriodFloats; i++) {
            const float got = output[size_t(first) + i];
            alone = alone && got == expected[i];
            withOther = withOther && got == expected[i] + other;
        }
        if (withOther) {
            heard.withOther++;
            heard.lastWithOther = period;
            if (heard.firstWithOther < 0)
                heard.firstWithOther = period;
        } else if (alone) {
            heard.alone++;
        } else {
            heard.wrong++;
        }
    }
    return heard;
}

class SharedOutputTest : public ::testing::Test {
protected:
    void TearDown() override
    {
        EXPECT_FALSE(SharedOutput::Instance().IsOpen());
        EXPECT_EQ(AudioSystem::Users(), 0);
    }

    DiskAudio disk;
};

TEST_F(SharedOutputTest, TwoWindowsSetUpAtOnceAndTheirSumIsHeard)
{
    Player first(RandomDocument(5));
    Player second(ConstantDocument(1000));
    ASSERT_TRUE(SetUpBoth(first, second));
    EXPECT_NE(first.graph->Device(), 0u);
    EXPECT_EQ(second.graph->Device(), first.graph->Device());
    EXPECT_EQ(second.graph->DriverName(), "disk");

    ASSERT_EQ(first.Start(), B_OK);
    ASSERT_TRUE(first.WaitForBuffers(4));
    ASSERT_EQ(second.Start(), B_OK);
    ASSERT_TRUE(second.WaitForBuffers(6));
    ASSERT_TRUE(first.WaitForBuffers(2));
    first.graph->StopNodes();
    second.graph->StopNodes();
    const int64_t firstBuffers = first.BuffersSent();
    const int64_t secondBuffers = second.BuffersSent();
    first.graph->TearDownNodes();
    second.graph->TearDownNodes();

    const std::vector<float> output = disk.ReadOutput();
    const Heard heard = Classify(output, first, firstBuffers, Level(1000));
    EXPECT_EQ(heard.wrong, 0);
    EXPECT_GE(heard.alone, 4);
    // The second window was heard in every buffer it sent, one after the
    // other, and it stopped after the first one did.
    EXPECT_GE(heard.withOther, 6);
    EXPECT_EQ(heard.lastWithOther - heard.firstWithOther + 1, heard.withOther);
    EXPECT_LE(heard.withOther, secondBuffers);
}

TEST_F(SharedOutputTest, ASumBeyondFullScaleIsClipped)
{
    Player first(ConstantDocument(30000));
    Player second(ConstantDocument(20000));
    ASSERT_TRUE(SetUpBoth(first, second));
    ASSERT_TRUE(PlayBothAndClose(first, second, 6));

    int64_t clipped = 0;
    int64_t other = 0;
    for (float sample : disk.ReadOutput()) {
        if (sample == 1.0f)
            clipped++;
        else if (sample != 0.0f && sample != Level(30000) && sample != Level(20000))
            other++;
    }
    EXPECT_GE(clipped, int64_t(kPeriodFloats));
    EXPECT_EQ(other, 0);
}

TEST_F(SharedOutputTest, AWindowThatStopsFallsSilentWhileTheOtherPlaysOn)
{
    Player first(RandomDocument(9));
    Player second(ConstantDocument(1500));
    ASSERT_TRUE(SetUpBoth(first, second));
    // The first window is heard first, so that its buffers mark the start.
    ASSERT_EQ(first.Start(), B_OK);
    ASSERT_TRUE(first.WaitForBuffers(1));
    ASSERT_EQ(second.Start(), B_OK);
    ASSERT_TRUE(second.WaitForBuffers(4));

    second.graph->StopNodes();
    // Nothing more is mixed for the stopped window once StopNodes returned.
    const int64_t secondBuffers = second.BuffersSent();
    const int64_t secondPosition = second.manager->CurrentFrame();
    EXPECT_FALSE(second.graph->Producer()->IsStarted());
    ASSERT_TRUE(first.WaitForBuffers(8));
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
    EXPECT_EQ(second.BuffersSent(), secondBuffers);
    EXPECT_EQ(second.manager->CurrentFrame(), secondPosition);
    EXPECT_TRUE(first.graph->Producer()->IsStarted());
    first.graph->StopNodes();
    const int64_t firstBuffers = first.BuffersSent();
    first.graph->TearDownNodes();
    second.graph->TearDownNodes();

    const Heard heard = Classify(disk.ReadOutput(), first, firstBuffers, Level(1500));
    EXPECT_EQ(heard.wrong, 0);
    // Every buffer the stopped window sent was heard, and none after.
    EXPECT_EQ(heard.withOther, secondBuffers);
    EXPECT_EQ(heard.lastWithOther - heard.firstWithOther + 1, heard.withOther);
    EXPECT_LE(heard.lastWithOther, firstBuffers - 8);
}

TEST_F(SharedOutputTest, TheDeviceLivesFromTheFirstSetupToTheLastTearDown)
{
    SharedOutput& output = SharedOutput::Instance();
    EXPECT_FALSE(output.IsOpen());
    Player first(RandomDocument(1));
    Player second(RandomDocument(2));
    ASSERT_EQ(first.SetUp(), B_OK);
    const SDL_AudioDeviceID device = output.Device();
    EXPECT_NE(device, 0u);
    EXPECT_EQ(first.graph->Device(), device);
    EXPECT_EQ(output.Places(), 1);
    EXPECT_EQ(output.AttachedProducers(), 1);

    ASSERT_EQ(second.SetUp(), B_OK);
    EXPECT_EQ(output.Device(), device);
    EXPECT_EQ(output.Places(), 2);
    EXPECT_EQ(output.AttachedProducers(), 2);

    first.graph->TearDownNodes();
    EXPECT_EQ(first.graph->Device(), 0u);
    EXPECT_EQ(output.Device(), device);
    EXPECT_EQ(output.Places(), 1);
    EXPECT_EQ(output.AttachedProducers(), 1);
    // The window left behind still plays.
    ASSERT_EQ(second.Start(), B_OK);
    ASSERT_TRUE(second.WaitForBuffers(3));
    second.graph->StopNodes();

    second.graph->TearDownNodes();
    EXPECT_FALSE(output.IsOpen());
    EXPECT_EQ(output.Places(), 0);
    EXPECT_EQ(AudioSystem::Users(), 0);

    // A window opened afterwards opens the device again.
    Player third(RandomDocument(3));
    ASSERT_EQ(third.SetUp(), B_OK);
    EXPECT_TRUE(output.IsOpen());
    EXPECT_EQ(third.graph->DriverName(), "disk");
    ASSERT_EQ(third.Start(), B_OK);
    ASSERT_TRUE(third.WaitForBuffers(3));
    third.Close();
}

TEST_F(SharedOutputTest, TwoControllersSetUpWithoutAnError)
{
    Player first(RandomDocument(1));
    Player second(RandomDocument(2));
    PlaybackController firstController(first.manager.get(), &first.window, &first.window);
    PlaybackController secondController(second.manager.get(), &second.window, &second.window);
    first.window.Attach(first.manager.get(), &firstController);
    second.window.Attach(second.manager.get(), &secondController);
    DiagnosticsCapture capture;
    EXPECT_EQ(firstController.SetUp(), B_OK);
    EXPECT_EQ(secondController.SetUp(), B_OK);
    const std::string printed = capture.Finish();
    EXPECT_EQ(printed.find("Error setting up nodes!"), std::string::npos) << printed;

    first.window.PostMessage(kMsgPlay);
    second.window.PostMessage(kMsgPlay);
    ASSERT_TRUE(first.window.ProcessUntil([&] { return first.window.playmarkUpdates.size() >= 3; }));
    ASSERT_TRUE(second.window.ProcessUntil([&] { return second.window.playmarkUpdates.size() >= 3; }));
    firstController.TearDown();
    secondController.TearDown();
    first.window.ProcessPending();
}

/// Two windows set up after the configured driver failed them: the first
/// falls back to the dummy driver, saying so once, and the second plays
/// through the same device.
void ExpectOneFallbackForTwoWindows()
{
    Player first(RandomDocument(1));
    Player second(RandomDocument(2));
    std::string printed;
    ASSERT_TRUE(SetUpBoth(first, second, &printed));
    EXPECT_EQ(first.graph->DriverName(), "dummy");
    EXPECT_EQ(second.graph->DriverName(), "dummy");
    EXPECT_EQ(second.graph->Device(), first.graph->Device());
    EXPECT_EQ(test::CountOccurrences(printed, "No sound device could be opened ("), 1) << printed;
    EXPECT_EQ(test::CountOccurrences(printed, "); playing through SDL's dummy driver\n"), 1) << printed;
    EXPECT_TRUE(PlayBothAndClose(first, second, 2));
}

TEST_F(SharedOutputTest, TwoWindowsWithoutTheConfiguredDriverFallBackOnce)
{
    setenv("SDL_AUDIODRIVER", "no-such-driver", 1);
    ExpectOneFallbackForTwoWindows();
}

TEST_F(SharedOutputTest, TwoWindowsWhoseDeviceCannotBeOpenedFallBackOnce)
{
    setenv("SDL_DISKAUDIOFILE", "/nonexistent-folder/output.raw", 1);
    ExpectOneFallbackForTwoWindows();
}

TEST_F(SharedOutputTest, AnotherFormatIsRefusedWhileTheDeviceIsOpen)
{
    Player first(RandomDocument(1));
    ASSERT_EQ(first.SetUp(), B_OK);
    SharedOutput& output = SharedOutput::Instance();
    MediaFormat other = first.graph->Format();
    other.frameRate = 48000;
    DiagnosticsCapture capture;
    EXPECT_EQ(output.Join(other), B_MEDIA_ALREADY_CONNECTED);
    EXPECT_EQ(capture.Finish(), "The sound output plays 44100 Hz, 2 channels in 2048-byte buffers; "
                                "48000 Hz, 2 channels in 2048-byte buffers cannot join it\n");
    EXPECT_EQ(output.Places(), 1);
    // The same format takes a place.
    ASSERT_EQ(output.Join(first.graph->Format()), B_OK);
    EXPECT_EQ(output.Places(), 2);
    output.Leave();
    first.graph->TearDownNodes();
}

TEST(SharedOutputFormatTest, APeriodMustFitSdlsLimits)
{
    MediaFormat format;
    format.frameRate = 44100;
    format.channelCount = 2;
    format.bufferSize = 2048;
    EXPECT_EQ(SharedOutput::PeriodFrames(format), 256);
    format.bufferSize = 65535 * 8;
    EXPECT_EQ(SharedOutput::PeriodFrames(format), 65535);
    format.bufferSize = 65536 * 8;
    EXPECT_EQ(SharedOutput::PeriodFrames(format), 0);
    format.bufferSize = 4;
    EXPECT_EQ(SharedOutput::PeriodFrames(format), 0);
    format.bufferSize = 2048;
    format.channelCount = 9;
    EXPECT_EQ(SharedOutput::PeriodFrames(format), 0);
    format.channelCount = 0;
    EXPECT_EQ(SharedOutput::PeriodFrames(format), 0);
    format.channelCount = 2;
    format.frameRate = 0.2f;
    EXPECT_EQ(SharedOutput::PeriodFrames(format), 0);
}

}  // namespace
}  // namespace glimmet
