#include <gtest/gtest.h>

#include <random>

#include "PlaybackTestSupport.h"
#include "playback/AudioProducer.h"
#include "playback/PlaybackController.h"
#include "sound/ChannelManager.h"
#include "support/DiagnosticsCapture.h"
#include "support/MessageCodes.h"

namespace glimmet {
namespace {

using test::ChannelRecipe;
using test::DiskAudio;
using test::FakePlaybackWindow;
using test::ReferencePlayback;

constexpr int64_t kLength = 12000;

// Positive samples everywhere, so that every played frame is heard on both
// sides and the first sound in the device's output marks the start; small
// enough that no sum reaches the soft-clipping curve.
std::vector<ChannelRecipe> Document()
{
    std::mt19937 random(23);
    std::vector<ChannelRecipe> channels;
    channels.push_back({test::RandomSamples(random, kLength, 100, 2400), 0, 0, false});
    channels.push_back({test::RandomSamples(random, kLength - 700, 100, 2400), 700, 0, false});
    channels.push_back({test::RandomSamples(random, kLength - 2000, 100, 2400), 0, -128, false});
    channels.push_back({test::RandomSamples(random, kLength, 100, 2400), 0, 127, false});
    channels.push_back({test::RandomSamples(random, kLength, 20000, 30000), 0, 0, true});
    return channels;
}

class PlaybackTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        channels = Document();
        manager = std::make_unique<ChannelManager>(&window);
        test::AddChannels(manager.get(), channels);
        controller = std::make_unique<PlaybackController>(manager.get(), &window, &window);
        window.Attach(manager.get(), controller.get());
    }

    void TearDown() override { controller.reset(); }

    void Connect()
    {
        DiagnosticsCapture capture;
        ASSERT_EQ(controller->SetUp(), B_OK);
        capture.Finish();
    }

    void Send(uint32_t what) { window.PostMessage(Message(what)); }

    void ChooseMode(int32_t mode, bool loop)
    {
        window.markedPlayMode = mode;
        window.loopChecked = loop;
        Send(kMsgPlayMode);
        Send(kMsgLoop);
        window.ProcessPending();
        ASSERT_EQ(manager->PlayMode(), mode);
        ASSERT_EQ(manager->Loop(), loop);
    }

    bool WaitForUpdates(size_t count)
    {
        return window.ProcessUntil([&] { return window.playmarkUpdates.size() >= count; });
    }

    bool WaitUntilStopped()
    {
        return window.ProcessUntil([&] { return window.stopMessages > 0 && !controller->IsPlaying(); });
    }

    /// How many buffers the producer sent since its latest start, and
    /// whether every one of them reached the window as an update.
    void NoteBuffersSent()
    {
        AudioProducer* producer = controller->Graph().Producer();
        buffersSent = producer->FramesSent() / test::kBufferFrames;
        updatesDropped = producer->Relay().DroppedUpdates();
    }

    /// Delivers every position update of the buffers produced so far.
    void CollectUpdates()
    {
        if (controller->Graph().Producer() != nullptr)
            controller->Graph().Producer()->Relay().Drain();
        window.ProcessPending();
    }

    /// Stops playback if it runs, collects what is left, closes the device
    /// and reads what it played.
    void Finish()
    {
        if (controller->IsPlaying())
            controller->MessageReceived(Message(kMsgStop));
        CollectUpdates();
        NoteBuffersSent();
        controller->TearDown();
        output = disk.ReadOutput();
    }

    ReferencePlayback Reference() const
    {
        return ReferencePlayback(channels, manager->PlayMode(), manager->Loop(), manager->RangeStart(),
            manager->RangeEnd(), window.visibleFirst, window.visibleLast);
    }

    /// The device's output holds, from its first sound on, exactly the
    /// reference playback of the given buffers from `from`, and nothing but
    /// silence after them. Returns where the played part ended.
    int64_t ExpectPlayed(const ReferencePlayback& reference, int64_t from, int64_t buffers, int64_t searchFrom = 0)
    {
        std::vector<float> rest(output.begin() + std::min<int64_t>(searchFrom, int64_t(output.size())), output.end());
        const int64_t first = test::FirstSound(rest);
        EXPECT_GE(first, 0);
        if (first < 0)
            return searchFrom;
        // Buffers fill whole device periods.
        EXPECT_EQ((searchFrom + first) % (2 * test::kBufferFrames), 0);
        const std::vector<float> expected = reference.Play(from, buffers);
        EXPECT_GE(rest.size(), size_t(first) + expected.size());
        if (rest.size() < size_t(first) + expected.size())
            return searchFrom;
        int64_t mismatches = 0;
        int64_t firstMismatch = -1;
        for (size_t i = 0; i < expected.size(); i++) {
            if (rest[size_t(first) + i] != expected[i]) {
                if (firstMismatch < 0)
                    firstMismatch = int64_t(i);
                mismatches++;
            }
        }
        EXPECT_EQ(mismatches, 0) << "first difference at float " << firstMismatch;
        return searchFrom + first + int64_t(expected.size());
    }

    void ExpectSilenceFrom(int64_t index)
    {
        const int64_t loud = test::FirstSound(std::vector<float>(output.begin() + index, output.end()));
        EXPECT_EQ(loud, -1) << "sound at float " << index + loud;
    }

    /// Every 'udpm' carried the play position after its buffer: all of them
    /// in order, or, if the window fell so far behind that some were
    /// dropped, those that came, still in order.
    void ExpectUpdates(const ReferencePlayback& reference, int64_t from, size_t begin, size_t end, int64_t buffers)
    {
        const std::vector<int64_t> positions = reference.Positions(from, buffers);
        if (updatesDropped == 0) {
            ASSERT_EQ(int64_t(end - begin), buffers);
            for (size_t i = begin; i < end; i++)
                ASSERT_EQ(window.playmarkUpdates[i], positions[i - begin]) << "update " << i;
        } else {
            auto next = positions.begin();
            for (size_t i = begin; i < end; i++) {
                next = std::find(next, positions.end(), window.playmarkUpdates[i]);
                ASSERT_NE(next, positions.end()) << "update " << i;
            }
        }
        for (size_t i = begin + 1; i < end; i++)
            EXPECT_GE(window.playmarkUpdateTimes[i], window.playmarkUpdateTimes[i - 1]);
    }

    int64_t buffersSent = 0;
    int64_t updatesDropped = 0;
    DiskAudio disk;
    FakePlaybackWindow window;
    std::vector<ChannelRecipe> channels;
    std::unique_ptr<ChannelManager> manager;
    std::unique_ptr<PlaybackController> controller;
    std::vector<float> output;
};

TEST_F(PlaybackTest, PlaysAllFromTheStartAndStopsAtTheEnd)
{
    Connect();
    ChooseMode(ChannelManager::kPlayAll, false);
    Send(kMsgPlay);
    ASSERT_TRUE(WaitUntilStopped());
    EXPECT_EQ(manager->CurrentFrame(), 0);
    EXPECT_EQ(window.buttonModes, (std::vector<int32_t>{0, 1}));
    Finish();

    const ReferencePlayback reference = Reference();
    const int64_t buffers = buffersSent;
    // The whole document, then the mixer's 'stop' (and whatever it mixed
    // before the window took the stop).
    ASSERT_GE(buffers, (kLength + test::kBufferFrames - 1) / test::kBufferFrames);
    ExpectUpdates(reference, 0, 0, window.playmarkUpdates.size(), buffers);
    for (int64_t i = 1; i < kLength / test::kBufferFrames; i++)
        EXPECT_EQ(window.playmarkUpdates[size_t(i)] - window.playmarkUpdates[size_t(i - 1)], test::kBufferFrames);
    ExpectSilenceFrom(ExpectPlayed(reference, 0, buffers));
}

TEST_F(PlaybackTest, PlaysAllLoopedFromTheCursor)
{
    Connect();
    ChooseMode(ChannelManager::kPlayAll, true);
    window.cursorFrame = 1234;
    Send(kMsgPlayFromCursor);
    ASSERT_TRUE(WaitForUpdates(70));
    EXPECT_TRUE(controller->IsPlaying());
    Send(kMsgStop);
    window.ProcessPending();
    EXPECT_FALSE(controller->IsPlaying());
    Finish();
    EXPECT_EQ(window.stopMessages, 1);

    const ReferencePlayback reference = Reference();
    const int64_t buffers = buffersSent;
    ExpectUpdates(reference, 1234, 0, window.playmarkUpdates.size(), buffers);
    ExpectSilenceFrom(ExpectPlayed(reference, 1234, buffers));
}

TEST_F(PlaybackTest, PlaysTheRangeLooped)
{
    Connect();
    ChooseMode(ChannelManager::kPlayRange, true);
    manager->SetRangeStart(3000);
    manager->SetRangeEnd(4499);
    Send(kMsgPlay);
    ASSERT_TRUE(WaitForUpdates(30));
    Finish();

    const ReferencePlayback reference = Reference();
    const int64_t buffers = buffersSent;
    ExpectUpdates(reference, 0, 0, window.playmarkUpdates.size(), buffers);
    ExpectSilenceFrom(ExpectPlayed(reference, 0, buffers));
    // A looped range never ends by itself.
    EXPECT_EQ(window.stopMessages, 0);
}

TEST_F(PlaybackTest, PlaysTheRangeOnceAndEndsInTheStoppedState)
{
    Connect();
    ChooseMode(ChannelManager::kPlayRange, false);
    manager->SetRangeStart(3000);
    manager->SetRangeEnd(4499);
    Send(kMsgPlay);
    ASSERT_TRUE(WaitUntilStopped());
    EXPECT_FALSE(controller->IsPlaying());
    EXPECT_EQ(window.buttonModes.back(), 1);
    EXPECT_EQ(manager->CurrentFrame(), 0);
    Finish();

    const ReferencePlayback reference = Reference();
    const int64_t buffers = buffersSent;
    // 1500 frames: six buffers, the last ending in zeros.
    ASSERT_GE(buffers, 6);
    EXPECT_EQ(window.playmarkUpdates[5], 4500);
    ExpectUpdates(reference, 0, 0, window.playmarkUpdates.size(), buffers);
    ExpectSilenceFrom(ExpectPlayed(reference, 0, buffers));
}

TEST_F(PlaybackTest, PlaysTheVisibleFramesLooped)
{
    window.visibleFirst = 5000;
    window.visibleLast = 6999;
    Connect();
    ChooseMode(ChannelManager::kPlayVisible, true);
    Send(kMsgPlay);
    ASSERT_TRUE(WaitForUpdates(40));
    Finish();

    const ReferencePlayback reference = Reference();
    const int64_t buffers = buffersSent;
    ExpectUpdates(reference, 0, 0, window.playmarkUpdates.size(), buffers);
    ExpectSilenceFrom(ExpectPlayed(reference, 0, buffers));
}

TEST_F(PlaybackTest, PlaysTheVisibleFramesOnceFromTheCursor)
{
    window.visibleFirst = 5000;
    window.visibleLast = 6999;
    Connect();
    ChooseMode(ChannelManager::kPlayVisible, false);
    window.cursorFrame = 6000;
    Send(kMsgPlayFromCursor);
    ASSERT_TRUE(WaitUntilStopped());
    Finish();

    const ReferencePlayback reference = Reference();
    const int64_t buffers = buffersSent;
    ASSERT_GE(buffers, 4);
    EXPECT_EQ(window.playmarkUpdates[3], 7000);
    ExpectUpdates(reference, 6000, 0, window.playmarkUpdates.size(), buffers);
    ExpectSilenceFrom(ExpectPlayed(reference, 6000, buffers));
}

TEST_F(PlaybackTest, SpaceTogglesAndPlaybackResumesWhereItStopped)
{
    Connect();
    ChooseMode(ChannelManager::kPlayAll, true);
    // The trial mix at connection left the play position one buffer on, and
    // toggling does not reset it.
    ASSERT_EQ(manager->CurrentFrame(), test::kBufferFrames);
    Send(kMsgTogglePlay);
    ASSERT_TRUE(WaitForUpdates(10));
    EXPECT_TRUE(controller->IsPlaying());
    Send(kMsgTogglePlay);
    window.ProcessPending();
    EXPECT_FALSE(controller->IsPlaying());
    EXPECT_EQ(window.buttonModes, (std::vector<int32_t>{0, 1}));
    CollectUpdates();
    NoteBuffersSent();
    const int64_t firstBuffers = buffersSent;
    const size_t firstUpdates = window.playmarkUpdates.size();
    const int64_t resumeAt = manager->CurrentFrame();

    Send(kMsgTogglePlay);
    ASSERT_TRUE(WaitForUpdates(firstUpdates + 10));
    Send(kMsgTogglePlay);
    window.ProcessPending();
    EXPECT_EQ(window.buttonModes, (std::vector<int32_t>{0, 1, 0, 1}));
    Finish();
    const int64_t secondBuffers = buffersSent;

    const ReferencePlayback reference = Reference();
    EXPECT_EQ(resumeAt, reference.PositionAfter(test::kBufferFrames, firstBuffers));
    ExpectUpdates(reference, test::kBufferFrames, 0, firstUpdates, firstBuffers);
    ExpectUpdates(reference, resumeAt, firstUpdates, window.playmarkUpdates.size(), secondBuffers);
    const int64_t firstEnd = ExpectPlayed(reference, test::kBufferFrames, firstBuffers);
    const int64_t secondEnd = ExpectPlayed(reference, resumeAt, secondBuffers, firstEnd);
    ExpectSilenceFrom(secondEnd);
}

TEST_F(PlaybackTest, ThePlayMarkFollowsPlaybackOneAcknowledgedMoveAtATime)
{
    Connect();
    ChooseMode(ChannelManager::kPlayAll, true);
    Send(kMsgPlay);
    // Two moves while playing: on a busy machine twenty updates can come in
    // one burst, which moves the mark once.
    ASSERT_TRUE(window.ProcessUntil(
        [&] { return window.playmarkUpdates.size() >= 20 && window.playmarkMoves.size() >= 2; }));
    Finish();
    // Moves wait for the view's acknowledgement, so some updates are passed
    // over, but each move shows a position that playback reported, in the
    // order it was reported. The stop returned the mark to 0 on the way.
    ASSERT_GE(window.playmarkMoves.size(), 3u);
    EXPECT_NE(std::find(window.playmarkMoves.begin(), window.playmarkMoves.end(), 0), window.playmarkMoves.end());
    auto searchFrom = window.playmarkUpdates.begin();
    for (int64_t move : window.playmarkMoves) {
        if (move == 0)
            continue;
        searchFrom = std::find(searchFrom, window.playmarkUpdates.end(), move);
        ASSERT_NE(searchFrom, window.playmarkUpdates.end()) << move;
    }
}

// Without a device ------------------------------------------------------------

class ControllerTest : public PlaybackTest {};

TEST_F(ControllerTest, AFailedSetupSaysSoAndTheWindowWorksOn)
{
    setenv("SDL_AUDIODRIVER", "no-such-driver", 1);
    controller->Graph().SetFallbackDriver("no-such-fallback");
    DiagnosticsCapture capture;
    EXPECT_NE(controller->SetUp(), B_OK);
    const std::string printed = capture.Finish();
    EXPECT_EQ(printed.substr(printed.size() - 24), "Error setting up nodes!\n") << printed;
    DiagnosticsCapture secondCapture;
    controller->MessageReceived(Message(kMsgTogglePlay));
    EXPECT_TRUE(controller->IsPlaying());
    controller->MessageReceived(Message(kMsgStop));
    EXPECT_FALSE(controller->IsPlaying());
    controller->TearDown();
    EXPECT_EQ(secondCapture.Finish(), "");
}

TEST_F(ControllerTest, StopWhileStoppedResetsThePositionAndMovesThePlayMark)
{
    manager->SetCurrentFrame(777);
    EXPECT_TRUE(controller->MessageReceived(Message(kMsgStop)));
    EXPECT_EQ(manager->CurrentFrame(), 0);
    EXPECT_EQ(window.playmarkMoves, (std::vector<int64_t>{0}));
    EXPECT_TRUE(window.buttonModes.empty());
    EXPECT_FALSE(controller->IsPlaying());
}

TEST_F(ControllerTest, ABurstOfUpdatesMovesThePlayMarkOnce)
{
    window.acknowledgePlaymark = false;
    for (int64_t frame : {256, 512, 768, 1024}) {
        Message update(kMsgUpdatePlaymark);
        update.AddInt64("current frame", frame);
        update.AddInt64("time", 1);
        window.PostMessage(update);
    }
    window.ProcessPending();
    EXPECT_EQ(window.playmarkMoves, (std::vector<int64_t>{256}));
    EXPECT_FALSE(controller->IsPlaymarkAcknowledged());

    Send(kMsgPlaymarkUpdated);
    Message next(kMsgUpdatePlaymark);
    next.AddInt64("current frame", 2048);
    window.PostMessage(next);
    window.ProcessPending();
    EXPECT_EQ(window.playmarkMoves, (std::vector<int64_t>{256, 2048}));
}

TEST_F(ControllerTest, AnUpdateWithoutAFrameIsIgnored)
{
    Message update(kMsgUpdatePlaymark);
    update.AddInt32("current frame", 5);
    EXPECT_TRUE(controller->MessageReceived(update));
    EXPECT_TRUE(window.playmarkMoves.empty());
    EXPECT_TRUE(controller->IsPlaymarkAcknowledged());
}

TEST_F(ControllerTest, PlayResetsThePositionAndTogglesOnlyWhenStopped)
{
    manager->SetCurrentFrame(900);
    EXPECT_TRUE(controller->MessageReceived(Message(kMsgPlay)));
    EXPECT_EQ(manager->CurrentFrame(), 0);
    window.ProcessPending();
    EXPECT_EQ(window.toggleMessages, 1);
    EXPECT_TRUE(controller->IsPlaying());

    manager->SetCurrentFrame(900);
    controller->MessageReceived(Message(kMsgPlay));
    window.ProcessPending();
    EXPECT_EQ(manager->CurrentFrame(), 0);
    EXPECT_EQ(window.toggleMessages, 1);
    EXPECT_TRUE(controller->IsPlaying());
}

TEST_F(ControllerTest, PlayFromCursorMovesThePositionToTheCursor)
{
    window.cursorFrame = 4321;
    controller->MessageReceived(Message(kMsgPlayFromCursor));
    EXPECT_EQ(manager->CurrentFrame(), 4321);
    window.ProcessPending();
    EXPECT_EQ(window.toggleMessages, 1);
    EXPECT_TRUE(controller->IsPlaying());

    window.cursorFrame = 99;
    controller->MessageReceived(Message(kMsgPlayFromCursor));
    window.ProcessPending();
    EXPECT_EQ(manager->CurrentFrame(), 99);
    EXPECT_EQ(window.toggleMessages, 1);
}

TEST_F(ControllerTest, TheButtonsModeDecidesWhatTheToggleDoes)
{
    // The button went to mode 0 (running): playback starts.
    Message start(kMsgTogglePlay);
    start.AddInt32("mode", 0);
    controller->MessageReceived(start);
    EXPECT_TRUE(controller->IsPlaying());
    // Mode 1 (stopped): playback stops.
    Message stop(kMsgTogglePlay);
    stop.AddInt32("mode", 1);
    controller->MessageReceived(stop);
    EXPECT_FALSE(controller->IsPlaying());
    // Other modes leave the state to the toggle.
    Message other(kMsgTogglePlay);
    other.AddInt32("mode", 3);
    controller->MessageReceived(other);
    EXPECT_TRUE(controller->IsPlaying());
    // The button is not told about its own click.
    EXPECT_TRUE(window.buttonModes.empty());
}

TEST_F(ControllerTest, SpaceTwiceStartsAndStopsWithTheButtonFollowing)
{
    controller->MessageReceived(Message(kMsgTogglePlay));
    EXPECT_TRUE(controller->IsPlaying());
    controller->MessageReceived(Message(kMsgTogglePlay));
    EXPECT_FALSE(controller->IsPlaying());
    EXPECT_EQ(window.buttonModes, (std::vector<int32_t>{0, 1}));
}

TEST_F(ControllerTest, PlayModeComesFromTheMarkedItemAndLoopFromTheBox)
{
    window.markedPlayMode = 2;
    controller->MessageReceived(Message(kMsgPlayMode));
    EXPECT_EQ(manager->PlayMode(), 2);
    window.markedPlayMode = -1;
    controller->MessageReceived(Message(kMsgPlayMode));
    EXPECT_EQ(manager->PlayMode(), 2);

    window.loopChecked = false;
    controller->MessageReceived(Message(kMsgLoop));
    EXPECT_FALSE(manager->Loop());
    window.loopChecked = true;
    controller->MessageReceived(Message(kMsgLoop));
    EXPECT_TRUE(manager->Loop());
}

TEST_F(ControllerTest, OtherMessagesAreLeftToTheWindow)
{
    EXPECT_FALSE(controller->MessageReceived(Message(kMsgUndo)));
    EXPECT_FALSE(controller->MessageReceived(Message(kMsgSave)));
}

}  // namespace
}  // namespace glimmet
