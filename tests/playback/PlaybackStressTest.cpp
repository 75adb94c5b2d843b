#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <fstream>
#include <memory>
#include <random>

#include "PlaybackTestSupport.h"
#include "edit/Action.h"
#include "edit/EditPosition.h"
#include "edit/FadeInAction.h"
#include "edit/FadeOutAction.h"
#include "edit/HistoryManager.h"
#include "edit/MaximizeAction.h"
#include "edit/RevertAction.h"
#include "edit/RevertPhasesAction.h"
#include "playback/AudioProducer.h"
#include "sound/Channel.h"
#include "support/DiagnosticsCapture.h"
#include "support/MessageCodes.h"
#include "support/SystemTime.h"

namespace glimmet {
namespace {

using test::ChannelRecipe;

std::vector<std::vector<int16_t>> Samples(ChannelManager* manager)
{
    std::vector<std::vector<int16_t>> samples;
    manager->Lock();
    for (int32_t i = 0; i < manager->CountChannels(); i++) {
        Channel* channel = manager->ChannelAt(i);
        std::vector<int16_t> data(size_t(channel->FrameCount()));
        channel->FillBuffer(data.data(), channel->FirstFrame(), channel->FrameCount());
        samples.push_back(std::move(data));
    }
    manager->Unlock();
    return samples;
}

std::unique_ptr<Action> MakeTransform(int64_t which)
{
    switch (which) {
        case 0: return std::make_unique<FadeInAction>(nullptr);
        case 1: return std::make_unique<FadeOutAction>(nullptr);
        case 2: return std::make_unique<MaximizeAction>(nullptr);
        case 3: return std::make_unique<RevertAction>(nullptr);
        default: return std::make_unique<RevertPhasesAction>(nullptr);
    }
}

// The device's audio thread mixes buffer after buffer while the window
// thread transforms, undoes and redoes, cuts and re-inserts frames, takes a
// channel out and puts it back, switches play modes and toggles playback.
// Every buffer must be mixed from a consistent document, and ThreadSanitizer
// watches every access.
TEST(PlaybackStressTest, PlaysWhileTheWindowEditsUndoesAndRedoes)
{
    constexpr int64_t kLength = 30000;
    test::DiskAudio disk;
    // Paced at a millisecond a period, so that the device thread leaves the
    // processor to the edits.
    setenv("SDL_DISKAUDIODELAY", "1", 1);
    test::FakePlaybackWindow window;
    window.visibleFirst = 1000;
    window.visibleLast = 9000;
    std::mt19937 random(2024);
    std::vector<ChannelRecipe> channels;
    channels.push_back({test::RandomSamples(random, kLength, -20000, 20000), 0, 0, false});
    channels.push_back({test::RandomSamples(random, kLength, -20000, 20000), 0, -128, false});
    channels.push_back({test::RandomSamples(random, kLength, -20000, 20000), 0, 127, false});
    ChannelManager manager(&window);
    test::AddChannels(&manager, channels);
    for (int32_t i = 0; i < manager.CountChannels(); i++)
        manager.ChannelAt(i)->SetSelected(true);
    const auto initial = Samples(&manager);

    PlaybackController controller(&manager, &window, &window);
    window.Attach(&manager, &controller);
    DiagnosticsCapture capture;
    ASSERT_EQ(controller.SetUp(), B_OK);
    capture.Finish();
    window.PostMessage(kMsgPlay);
    ASSERT_TRUE(window.ProcessUntil([&] { return window.playmarkUpdates.size() >= 5; }));

    EditPosition position;
    HistoryManager history;
    auto pick = [&random](int64_t low, int64_t high) {
        return std::uniform_int_distribution<int64_t>(low, high)(random);
    };
    int recorded = 0;
    const size_t updatesBefore = window.playmarkUpdates.size();
    for (int step = 0; step < 600; step++) {
        const int64_t choice = pick(0, 9);
        if (choice <= 2) {
            const int64_t start = pick(0, kLength - 2);
            manager.SetRangeStart(start);
            manager.SetRangeEnd(std::min(kLength - 1, start + pick(1, 8000)));
            std::unique_ptr<Action> action = MakeTransform(pick(0, 4));
            ASSERT_EQ(action->SetTo(&manager, &position), B_OK);
            Action* raw = action.get();
            ASSERT_EQ(history.AddAction(action), B_OK);
            ASSERT_EQ(raw->Go(), B_OK);
            recorded++;
        } else if (choice == 3 || choice == 4) {
            history.Undo();
        } else if (choice == 5) {
            history.Redo();
        } else if (choice == 6) {
            // Cut a stretch out of one channel and put it back.
            manager.Lock();
            Channel* channel = manager.ChannelAt(int32_t(pick(0, manager.CountChannels() - 1)));
            const int64_t from = channel->FirstFrame() + pick(0, channel->FrameCount() - 300);
            std::vector<int16_t> cut(200);
            channel->FillBuffer(cut.data(), from, 200);
            ASSERT_EQ(channel->RemoveFrames(from, from + 199), B_OK);
            ASSERT_EQ(channel->InsertFrames(cut.data(), 200, from), B_OK);
            manager.Unlock();
        } else if (choice == 7) {
            // A channel leaves the document and comes back at its place.
            const int32_t index = int32_t(pick(0, manager.CountChannels() - 1));
            std::unique_ptr<Channel> channel = manager.RemoveChannel(manager.ChannelAt(index));
            window.ProcessPending();
            ASSERT_EQ(manager.AddChannel(std::move(channel), index), nullptr);
        } else if (choice == 8) {
            window.markedPlayMode = int32_t(pick(0, 2));
            window.loopChecked = pick(0, 3) != 0;
            window.PostMessage(kMsgPlayMode);
            window.PostMessage(kMsgLoop);
        } else if (!controller.IsPlaying()) {
            window.PostMessage(kMsgPlay);
        } else if (pick(0, 1) == 0) {
            window.PostMessage(kMsgTogglePlay);
        }
        window.ProcessPending();
    }
    // On a busy machine the steps above can all fit into a few buffers: keep
    // undoing and redoing while playing until playback has clearly moved on,
    // so that the two really ran side by side.
    if (!controller.IsPlaying())
        window.PostMessage(kMsgPlay);
    for (int extra = 0; extra < 20000 && window.playmarkUpdates.size() <= updatesBefore + 10; extra++) {
        if (history.Undo() == B_OK)
            history.Redo();
        window.ProcessPending();
        snooze(500);
    }
    EXPECT_GT(window.playmarkUpdates.size(), updatesBefore + 10);
    while (history.Undo() == B_OK) {
    }

    // Play the restored document for a while more.
    window.markedPlayMode = 0;
    window.loopChecked = true;
    window.PostMessage(kMsgPlayMode);
    window.PostMessage(kMsgLoop);
    window.PostMessage(kMsgPlay);
    const size_t seen = window.playmarkUpdates.size();
    ASSERT_TRUE(window.ProcessUntil([&] { return window.playmarkUpdates.size() >= seen + 10; }));
    controller.MessageReceived(Message(kMsgStop));
    window.ProcessPending();
    controller.TearDown();

    EXPECT_GT(recorded, 0);
    EXPECT_EQ(Samples(&manager), initial);
    // Every float the device wrote is a finite value no larger than full
    // scale: a lone channel is at most full scale, and the soft-clipping
    // curve peaks at 1.0. Read in pieces, since the device wrote for as long
    // as the test ran.
    std::ifstream in(disk.File(), std::ios::binary);
    std::vector<float> piece(1 << 16);
    int64_t floats = 0;
    int64_t bad = 0;
    while (in.read(reinterpret_cast<char*>(piece.data()), std::streamsize(piece.size() * sizeof(float)))
        || in.gcount() > 0) {
        const size_t count = size_t(in.gcount()) / sizeof(float);
        for (size_t i = 0; i < count; i++) {
            if (!std::isfinite(piece[i]) || std::fabs(piece[i]) > 1.0f)
                bad++;
        }
        floats += int64_t(count);
    }
    EXPECT_GT(floats, 2 * test::kBufferFrames * 10);
    EXPECT_EQ(bad, 0);
}

}  // namespace
}  // namespace glimmet
