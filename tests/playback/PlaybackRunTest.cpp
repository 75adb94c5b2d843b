#include <gtest/gtest.h>

#include <chrono>
#include <random>
#include <thread>

#include "PlaybackTestSupport.h"
#include "playback/AudioProducer.h"
#include "playback/PlaybackController.h"
#include "sound/ChannelManager.h"
#include "support/DiagnosticsCapture.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"

namespace glimmet {
namespace {

// Messages of a playback that has been stopped can still be on their way
// when the stop is handled: in the producer's relay, or already in the
// window's queue behind the stop. They must not undo what the stop did.
class PlaybackRun : public ::testing::Test {
protected:
    void SetUp() override
    {
        std::mt19937 random(5);
        // Long enough (about 9 s) not to end while a test plays it.
        test::AddChannels(manager.get(), {{test::RandomSamples(random, 400000, 100, 2400), 0, 0, false}});
        window.Attach(manager.get(), &controller);
        DiagnosticsCapture capture;
        ASSERT_EQ(controller.SetUp(), B_OK);
        capture.Finish();
        window.markedPlayMode = ChannelManager::kPlayAll;
        window.loopChecked = false;
        Send(kMsgPlayMode);
        Send(kMsgLoop);
        window.ProcessPending();
    }

    void TearDown() override { controller.TearDown(); }

    void Send(uint32_t what) { window.PostMessage(Message(what)); }

    AudioProducer& Producer() { return *controller.Graph().Producer(); }

    void StartPlaying()
    {
        Send(kMsgPlay);
        ASSERT_TRUE(window.ProcessUntil([&] { return window.playmarkUpdates.size() >= 5; }));
        window.ProcessPending();
        ASSERT_TRUE(controller.IsPlaying());
        ASSERT_TRUE(controller.IsPlaymarkAcknowledged());
    }

    /// Lets the producer mix a few more buffers without the window looking,
    /// so that their updates wait in the relay.
    void LetUpdatesPileUp()
    {
        const int64_t sent = Producer().FramesSent();
        const auto limit = std::chrono::steady_clock::now() + std::chrono::seconds(10);
        while (Producer().FramesSent() < sent + 3 * test::kBufferFrames && std::chrono::steady_clock::now() < limit)
            std::this_thread::sleep_for(std::chrono::milliseconds(2));
        ASSERT_GE(Producer().FramesSent(), sent + 3 * test::kBufferFrames);
    }

    size_t UpdatesReceivedAfterTheFirstStop() const
    {
        const auto stop = std::find(window.received.begin(), window.received.end(), kMsgStop);
        return size_t(std::count(stop, window.received.end(), kMsgUpdatePlaymark));
    }

    test::DiskAudio disk;
    test::FakePlaybackWindow window;
    std::unique_ptr<ChannelManager> manager = std::make_unique<ChannelManager>(&window);
    PlaybackController controller{manager.get(), &window, &window};
};

TEST_F(PlaybackRun, UpdatesQueuedBehindAStopLeaveThePlayMarkAtTheBeginning)
{
    StartPlaying();
    LetUpdatesPileUp();
    // The user's click on stop is in the queue; then the relay hands over
    // what the producer posted meanwhile, behind it.
    Send(kMsgStop);
    Producer().Relay().Drain();
    window.ProcessPending();

    EXPECT_FALSE(controller.IsPlaying());
    EXPECT_GE(UpdatesReceivedAfterTheFirstStop(), 3u);
    ASSERT_FALSE(window.playmarkMoves.empty());
    EXPECT_EQ(window.playmarkMoves.back(), 0);
    EXPECT_EQ(manager->CurrentFrame(), 0);
    EXPECT_TRUE(controller.IsPlaymarkAcknowledged());
}

TEST_F(PlaybackRun, TheNextPlaybackMovesThePlayMarkAgain)
{
    StartPlaying();
    Send(kMsgStop);
    window.ProcessPending();
    const size_t moves = window.playmarkMoves.size();

    Send(kMsgPlay);
    ASSERT_TRUE(window.ProcessUntil([&] {
        return window.playmarkMoves.size() >= moves + 3 && window.playmarkMoves.back() > 0;
    }));
    EXPECT_TRUE(controller.IsPlaying());
}

TEST_F(PlaybackRun, AnEndOfRangeStopFromAStoppedPlaybackDoesNotStopTheNextOne)
{
    StartPlaying();
    const int32_t stoppedRun = Producer().Relay().CurrentRun();
    Send(kMsgStop);
    window.ProcessPending();
    Send(kMsgPlay);
    window.ProcessPending();
    ASSERT_TRUE(controller.IsPlaying());

    Message late(kMsgStop);
    late.AddInt32(kFieldPlaybackRun, stoppedRun);
    window.PostMessage(late);
    window.ProcessPending();
    EXPECT_TRUE(controller.IsPlaying());

    Message current(kMsgStop);
    current.AddInt32(kFieldPlaybackRun, Producer().Relay().CurrentRun());
    window.PostMessage(current);
    window.ProcessPending();
    EXPECT_FALSE(controller.IsPlaying());
}

TEST_F(PlaybackRun, AnUpdateFromAStoppedPlaybackIsPassedOverAndOneFromTheWindowIsNot)
{
    const int32_t firstRun = Producer().Relay().CurrentRun();
    Send(kMsgStop);
    window.ProcessPending();
    ASSERT_EQ(window.playmarkMoves, (std::vector<int64_t>{0}));

    Message stale(kMsgUpdatePlaymark);
    stale.AddInt64(kFieldCurrentFrame, 5000);
    stale.AddInt32(kFieldPlaybackRun, firstRun);
    window.PostMessage(stale);
    window.ProcessPending();
    EXPECT_EQ(window.playmarkMoves, (std::vector<int64_t>{0}));
    EXPECT_TRUE(controller.IsPlaymarkAcknowledged());

    Message unstamped(kMsgUpdatePlaymark);
    unstamped.AddInt64(kFieldCurrentFrame, 6000);
    window.PostMessage(unstamped);
    window.ProcessPending();
    EXPECT_EQ(window.playmarkMoves, (std::vector<int64_t>{0, 6000}));
}

}  // namespace
}  // namespace glimmet
