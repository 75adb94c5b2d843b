#include <gtest/gtest.h>

#include <QEventLoop>

#include <SDL.h>

#include <atomic>
#include <chrono>
#include <cstdlib>
#include <memory>
#include <random>
#include <thread>
#include <vector>

#include "PlaybackTestSupport.h"
#include "playback/AudioProducer.h"
#include "playback/AudioSystem.h"
#include "playback/PlaybackGraph.h"
#include "playback/PlaymarkRelay.h"
#include "playback/SharedOutput.h"
#include "sound/ChannelManager.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet {
namespace {

constexpr int kWindows = 3;
constexpr int kRounds = 6;

/// What went wrong on the window threads, counted there and checked on the
/// test's thread.
struct Faults {
    std::atomic<int> setups{0};
    std::atomic<int> starts{0};
    std::atomic<int> silentWindows{0};
    std::atomic<int> mixedAfterStop{0};
    std::atomic<int> devicesKept{0};
};

/// One window thread: a document of its own, played through a new graph
/// each round: set up, started, heard for a few buffers, stopped and torn
/// down, with pauses of random length between the steps.
void PlayRounds(unsigned seed, Faults* faults)
{
    // A window thread has an event loop; the producer's relay needs one.
    QEventLoop loop;
    std::mt19937 random(seed);
    test::FakePlaybackWindow window;
    ChannelManager manager(&window);
    test::AddChannels(&manager, {{test::RandomSamples(random, 8000, -3000, 3000), 0, 0, false}});
    manager.SetLoop(true);
    auto pause = [&random] {
        std::this_thread::sleep_for(std::chrono::microseconds(std::uniform_int_distribution(0, 3000)(random)));
    };
    for (int round = 0; round < kRounds; round++) {
        PlaybackGraph graph(&manager, &window);
        if (graph.SetupNodes() != B_OK) {
            faults->setups++;
            continue;
        }
        pause();
        manager.ResetCurrentFrame();
        if (graph.StartNodes() != B_OK)
            faults->starts++;
        AudioProducer* producer = graph.Producer();
        if (!window.ProcessUntil([&] { return producer->FramesSent() >= 3 * test::kBufferFrames; }, 10000000))
            faults->silentWindows++;
        graph.StopNodes();
        const int64_t sent = producer->FramesSent();
        pause();
        if (producer->FramesSent() != sent)
            faults->mixedAfterStop++;
        graph.TearDownNodes();
        if (graph.Device() != 0)
            faults->devicesKept++;
        window.ProcessPending();
        pause();
    }
    // SDL keeps state of its own (its error text) for every thread that
    // calls it; a thread SDL did not start must hand it back itself.
    SDL_TLSCleanup();
}

void ExpectNoFaults(const Faults& faults)
{
    EXPECT_EQ(faults.setups, 0);
    EXPECT_EQ(faults.starts, 0);
    EXPECT_EQ(faults.silentWindows, 0);
    EXPECT_EQ(faults.mixedAfterStop, 0);
    EXPECT_EQ(faults.devicesKept, 0);
}

void RunWindows(unsigned seed, Faults* faults)
{
    std::vector<std::thread> threads;
    for (int i = 0; i < kWindows; i++)
        threads.emplace_back(PlayRounds, seed + unsigned(i), faults);
    for (std::thread& thread : threads)
        thread.join();
}

class SharedOutputStressTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        // Paced at a millisecond a period, so that the device thread leaves
        // the processor to the windows.
        setenv("SDL_DISKAUDIODELAY", "1", 1);
        // Qt registers the types of the relay's notifier signal on first
        // connection, under a lock whose private part comes from a lock-free
        // list that ThreadSanitizer cannot see into (Qt is not built with
        // it). A relay made here, before the window threads exist, keeps that
        // first registration off the threads under test.
        PlaymarkRelay registersQtTypes(nullptr);
    }

    test::DiskAudio disk;
};

// Window threads join and leave the output while another window keeps the
// device running: the producer list changes under the audio thread's feet,
// and ThreadSanitizer watches every access.
TEST_F(SharedOutputStressTest, WindowsComeAndGoWhileAnotherPlays)
{
    test::FakePlaybackWindow window;
    ChannelManager manager(&window);
    std::mt19937 random(77);
    test::AddChannels(&manager, {{test::RandomSamples(random, 8000, -3000, 3000), 0, 0, false}});
    manager.SetLoop(true);
    PlaybackGraph graph(&manager, &window);
    DiagnosticsCapture capture;
    ASSERT_EQ(graph.SetupNodes(), B_OK);
    const SDL_AudioDeviceID device = graph.Device();
    ASSERT_EQ(graph.StartNodes(), B_OK);

    Faults faults;
    RunWindows(100, &faults);
    ExpectNoFaults(faults);
    // The device stayed open throughout, and this window still plays.
    EXPECT_EQ(SharedOutput::Instance().Device(), device);
    EXPECT_EQ(SharedOutput::Instance().Places(), 1);
    const int64_t sent = graph.Producer()->FramesSent();
    EXPECT_TRUE(window.ProcessUntil([&] { return graph.Producer()->FramesSent() >= sent + 3 * test::kBufferFrames; }));
    graph.StopNodes();
    graph.TearDownNodes();
    const std::string printed = capture.Finish();
    EXPECT_EQ(printed.find("cannot join"), std::string::npos) << printed;
    EXPECT_FALSE(SharedOutput::Instance().IsOpen());
}

// Without a window holding it, the device is opened and closed again and
// again by whichever thread comes first and leaves last.
TEST_F(SharedOutputStressTest, WindowsOpenAndCloseTheDeviceBetweenThem)
{
    DiagnosticsCapture capture;
    Faults faults;
    RunWindows(200, &faults);
    ExpectNoFaults(faults);
    const std::string printed = capture.Finish();
    EXPECT_EQ(printed.find("No sound device could be opened"), std::string::npos) << printed;
    EXPECT_FALSE(SharedOutput::Instance().IsOpen());
    EXPECT_EQ(SharedOutput::Instance().Places(), 0);
    EXPECT_EQ(AudioSystem::Users(), 0);
}

}  // namespace
}  // namespace glimmet
