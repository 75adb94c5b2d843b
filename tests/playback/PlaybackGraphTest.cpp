#include <gtest/gtest.h>

#include <chrono>
#include <random>
#include <thread>

#include "PlaybackTestSupport.h"
#include "playback/AudioProducer.h"
#include "playback/AudioSystem.h"
#include "playback/PlaybackGraph.h"
#include "sound/ChannelManager.h"
#include "support/DiagnosticsCapture.h"
#include "support/SystemTime.h"

namespace glimmet {
namespace {

using test::ChannelRecipe;
using test::DiskAudio;
using test::FakePlaybackWindow;

std::vector<ChannelRecipe> Document(int64_t length)
{
    std::mt19937 random(11);
    return {{test::RandomSamples(random, length, 100, 3000), 0, 0, false}};
}

class GraphTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        manager = std::make_unique<ChannelManager>(&window);
        test::AddChannels(manager.get(), Document(20000));
        graph = std::make_unique<PlaybackGraph>(manager.get(), &window);
    }

    void TearDown() override
    {
        graph.reset();
        EXPECT_EQ(AudioSystem::Users(), 0);
    }

    /// Runs the event loop until the producer has served count buffers more.
    bool WaitForBuffers(int64_t count)
    {
        const int64_t target = graph->Producer()->FramesSent() + count * test::kBufferFrames;
        return window.ProcessUntil([&] { return graph->Producer()->FramesSent() >= target; });
    }

    DiskAudio disk;
    FakePlaybackWindow window;
    std::unique_ptr<ChannelManager> manager;
    std::unique_ptr<PlaybackGraph> graph;
};

TEST_F(GraphTest, SetupConnectsTheProducerToTheDeviceInTheNegotiatedFormat)
{
    DiagnosticsCapture capture;
    ASSERT_EQ(graph->SetupNodes(), B_OK);
    const std::string printed = capture.Finish();
    EXPECT_EQ(printed.rfind("\tno buffer size provided, suggesting 2048\n\tbuffer-filling took ", 0), 0u) << printed;
    EXPECT_EQ(test::CountOccurrences(printed, "\n"), 2) << printed;
    EXPECT_EQ(graph->DriverName(), "disk");
    EXPECT_EQ(graph->Format().type, B_MEDIA_RAW_AUDIO);
    EXPECT_EQ(graph->Format().frameRate, 44100.0f);
    EXPECT_EQ(graph->Format().channelCount, 2u);
    EXPECT_EQ(graph->Format().sampleFormat, B_AUDIO_FLOAT);
    EXPECT_EQ(graph->Format().bufferSize, 2048u);
    AudioProducer* producer = graph->Producer();
    ASSERT_NE(producer, nullptr);
    EXPECT_EQ(producer->Output().destination, graph->Destination());
    EXPECT_EQ(producer->Output().source, graph->Source());
    EXPECT_EQ(producer->RunMode(), B_INCREASE_LATENCY);
    EXPECT_EQ(producer->BufferDuration(), 5804);
    EXPECT_EQ(producer->DownstreamLatency(), 5804);
    EXPECT_EQ(producer->TimeSource(), &graph->TimeSource());
    // The trial mix moved the play position on by one buffer.
    EXPECT_EQ(manager->CurrentFrame(), test::kBufferFrames);
    // Set up once only.
    DiagnosticsCapture secondCapture;
    EXPECT_EQ(graph->SetupNodes(), B_MEDIA_ALREADY_CONNECTED);
    EXPECT_EQ(secondCapture.Finish(), "");
    EXPECT_EQ(graph->Producer(), producer);
    graph->TearDownNodes();
    EXPECT_EQ(graph->Producer(), nullptr);
}

TEST_F(GraphTest, StartingWithoutAProducerFailsSilently)
{
    DiagnosticsCapture capture;
    EXPECT_EQ(graph->StartNodes(), B_ERROR);
    graph->StopNodes();
    graph->TearDownNodes();
    EXPECT_EQ(capture.Finish(), "");
}

TEST_F(GraphTest, StartPlaysInRecordingModeAfterTheLatency)
{
    DiagnosticsCapture capture;
    ASSERT_EQ(graph->SetupNodes(), B_OK);
    capture.Finish();
    manager->ResetCurrentFrame();
    DiagnosticsCapture secondCapture;
    ASSERT_EQ(graph->StartNodes(), B_OK);
    EXPECT_EQ(secondCapture.Finish(), "");
    AudioProducer* producer = graph->Producer();
    EXPECT_EQ(producer->RunMode(), B_RECORDING);
    int64_t latency = 0;
    producer->GetLatency(&latency);
    EXPECT_EQ(producer->ProducerDelay(), latency);
    ASSERT_TRUE(WaitForBuffers(5));
    EXPECT_TRUE(producer->IsStarted());
    graph->StopNodes();
    const int64_t sent = producer->FramesSent();
    EXPECT_FALSE(producer->IsStarted());
    // Nothing more is mixed once StopNodes has returned.
    const int64_t position = manager->CurrentFrame();
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
    EXPECT_EQ(producer->FramesSent(), sent);
    EXPECT_EQ(manager->CurrentFrame(), position);
    graph->TearDownNodes();
}

TEST_F(GraphTest, StoppingAndStartingAgainBeginsAFreshTimeLine)
{
    DiagnosticsCapture capture;
    ASSERT_EQ(graph->SetupNodes(), B_OK);
    ASSERT_EQ(graph->StartNodes(), B_OK);
    capture.Finish();
    AudioProducer* producer = graph->Producer();
    ASSERT_TRUE(WaitForBuffers(8));
    graph->StopNodes();
    EXPECT_FALSE(producer->IsStarted());
    const int64_t firstStart = producer->StartTime();
    EXPECT_GE(producer->FramesSent(), 8 * test::kBufferFrames);
    producer->Relay().Drain();
    window.ProcessPending();
    const size_t firstUpdates = window.playmarkUpdates.size();
    EXPECT_EQ(int64_t(firstUpdates) * test::kBufferFrames, producer->FramesSent());

    ASSERT_EQ(graph->StartNodes(), B_OK);
    ASSERT_TRUE(window.ProcessUntil([&] { return producer->IsStarted(); }));
    ASSERT_TRUE(window.ProcessUntil([&] { return producer->FramesSent() >= 2 * test::kBufferFrames; }));
    graph->StopNodes();
    producer->Relay().Drain();
    window.ProcessPending();
    // Frames sent counts from the new start only.
    const int64_t secondUpdates = int64_t(window.playmarkUpdates.size() - firstUpdates);
    EXPECT_GE(secondUpdates, 2);
    EXPECT_EQ(producer->FramesSent(), secondUpdates * test::kBufferFrames);
    EXPECT_GT(producer->StartTime(), firstStart);
    graph->TearDownNodes();
}

TEST_F(GraphTest, ALateDeviceRaisesTheLatencyOnlyOutsideRecordingMode)
{
    DiagnosticsCapture capture;
    ASSERT_EQ(graph->SetupNodes(), B_OK);
    ASSERT_EQ(graph->StartNodes(), B_OK);
    capture.Finish();
    AudioProducer* producer = graph->Producer();
    ASSERT_TRUE(WaitForBuffers(2));

    // Holding the document lock stalls the mix of the period being served.
    auto stallOnePeriod = [&] {
        const int64_t late = producer->LatePeriods();
        manager->Lock();
        std::this_thread::sleep_for(std::chrono::milliseconds(25));
        manager->Unlock();
        return window.ProcessUntil([&] { return producer->LatePeriods() > late; });
    };
    const int64_t internal = producer->InternalLatency();
    DiagnosticsCapture secondCapture;
    ASSERT_TRUE(stallOnePeriod());
    EXPECT_EQ(secondCapture.Finish(), "");
    EXPECT_EQ(producer->InternalLatency(), internal);

    producer->SetRunMode(B_INCREASE_LATENCY);
    DiagnosticsCapture thirdCapture;
    ASSERT_TRUE(stallOnePeriod());
    graph->StopNodes();
    const std::string printed = thirdCapture.Finish();
    EXPECT_GT(producer->InternalLatency(), internal + 10000);
    EXPECT_EQ(printed.rfind("\tincreasing latency to ", 0), 0u) << printed;
    graph->TearDownNodes();
}

TEST_F(GraphTest, ADeviceThatCannotBeOpenedFallsBackToTheDummyDriverWithOneLine)
{
    setenv("SDL_AUDIODRIVER", "no-such-driver", 1);
    DiagnosticsCapture capture;
    ASSERT_EQ(graph->SetupNodes(), B_OK);
    const std::string printed = capture.Finish();
    EXPECT_EQ(graph->DriverName(), "dummy");
    EXPECT_EQ(test::CountOccurrences(printed, "No sound device could be opened ("), 1) << printed;
    EXPECT_EQ(test::CountOccurrences(printed, "); playing through SDL's dummy driver\n"), 1) << printed;
    EXPECT_EQ(printed.find("\tno buffer size provided"), printed.find('\n') + 1) << printed;
    // The editor plays on, silently.
    ASSERT_EQ(graph->StartNodes(), B_OK);
    ASSERT_TRUE(WaitForBuffers(2));
    graph->StopNodes();
    graph->TearDownNodes();
}

TEST_F(GraphTest, WithoutAnyDriverThereIsNoRoster)
{
    setenv("SDL_AUDIODRIVER", "no-such-driver", 1);
    graph->SetFallbackDriver("no-such-fallback");
    DiagnosticsCapture capture;
    EXPECT_EQ(graph->SetupNodes(), B_MEDIA_SYSTEM_FAILURE);
    const std::string printed = capture.Finish();
    EXPECT_NE(printed.find("); playing through SDL's no-such-fallback driver\n"), std::string::npos) << printed;
    EXPECT_NE(printed.find("Can't find the media roster, error: 80004100\n"), std::string::npos) << printed;
    EXPECT_EQ(graph->Producer(), nullptr);
    DiagnosticsCapture secondCapture;
    EXPECT_EQ(graph->StartNodes(), B_ERROR);
    graph->TearDownNodes();
    EXPECT_EQ(secondCapture.Finish(), "");
}

TEST_F(GraphTest, AFailedConnectionLeavesTheProducerAndAFailedInitialLatencyStillStarts)
{
    setenv("SDL_DISKAUDIOFILE", "/nonexistent-folder/output.raw", 1);
    graph->SetFallbackDriver("no-such-fallback");
    DiagnosticsCapture capture;
    EXPECT_EQ(graph->SetupNodes(), B_MEDIA_SYSTEM_FAILURE);
    std::string printed = capture.Finish();
    EXPECT_NE(printed.find("unable to connect nodes, error: 80004100\n"), std::string::npos) << printed;
    AudioProducer* producer = graph->Producer();
    ASSERT_NE(producer, nullptr);
    EXPECT_EQ(producer->Output().destination, MediaDestination::Null());

    DiagnosticsCapture secondCapture;
    EXPECT_EQ(graph->StartNodes(), B_OK);
    EXPECT_EQ(secondCapture.Finish(),
        "Can't get initial latency for audio producer node - Error: Media nodes not connected\n");
    // The start is queued: the producer takes it at its next period. That
    // period lies a second ahead of the start's time (the clock counts from
    // the machine's start, so no fixed frame number is late enough).
    std::vector<float> period(512);
    const double rate = producer->Output().format.frameRate;
    const auto ahead = int64_t(double(system_time() + 1000000) * rate / 1e6);
    producer->ServeDevice(period.data(), 256, ahead);
    EXPECT_TRUE(producer->IsStarted());

    DiagnosticsCapture thirdCapture;
    graph->StopNodes();
    graph->TearDownNodes();
    printed = thirdCapture.Finish();
    EXPECT_EQ(printed, "Error disconnecting audio nodes:  " + std::to_string(long(B_MEDIA_NOT_CONNECTED))
        + " (Media nodes not connected)\n");
    EXPECT_EQ(graph->Producer(), nullptr);
}

TEST_F(GraphTest, TearDownClosesTheDeviceAndReleasesTheSoundSystem)
{
    DiagnosticsCapture capture;
    ASSERT_EQ(graph->SetupNodes(), B_OK);
    capture.Finish();
    EXPECT_EQ(AudioSystem::Users(), 1);
    const auto before = std::chrono::steady_clock::now();
    DiagnosticsCapture secondCapture;
    graph->TearDownNodes();
    EXPECT_EQ(secondCapture.Finish(), "");
    EXPECT_GE(std::chrono::steady_clock::now() - before, std::chrono::milliseconds(20));
    EXPECT_EQ(graph->Device(), 0u);
    EXPECT_EQ(AudioSystem::Users(), 0);
    EXPECT_EQ(AudioSystem::CurrentDriver(), nullptr);
}

}  // namespace
}  // namespace glimmet
