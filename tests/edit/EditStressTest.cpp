#include <gtest/gtest.h>

#include <atomic>
#include <random>
#include <thread>

#include "TestDocument.h"
#include "edit/AddChannelAction.h"
#include "edit/CopyBuffer.h"
#include "edit/HistoryManager.h"
#include "edit/PasteAction.h"
#include "edit/RemoveAction.h"
#include "edit/RemoveChannelAction.h"
#include "edit/TruncateAction.h"

namespace glimmet {
namespace {

using test::DocumentState;
using test::TestDocument;

/// Runs one seeded sequence of edits, undos and redos, with or without a
/// playback thread mixing all the while; returns the document after the
/// sequence and after undoing everything.
std::pair<DocumentState, DocumentState> RunSequence(bool withPlayback, int64_t* buffersMixed)
{
    TestDocument document;
    std::mt19937 random(17);
    for (int c = 0; c < 3; c++)
        document.AddChannel(test::RandomSamples(random, 30000), 0, true);
    CopyBuffer copyBuffer;
    std::vector<CopyBuffer::Samples> arrays;
    for (int c = 0; c < 2; c++) {
        arrays.emplace_back(new int16_t[500]);
        std::fill(arrays.back().get(), arrays.back().get() + 500, int16_t(100 * (c + 1)));
    }
    copyBuffer.SetCopyBuffer(std::move(arrays), 500);

    std::atomic<bool> stop{false};
    std::atomic<int64_t> buffers{0};
    std::thread playback([&] {
        std::vector<float> out(2 * 256);
        while (withPlayback && !stop.load()) {
            if (document.manager.FillBuffer(out.data(), 256))
                buffers++;
        }
    });

    HistoryManager history;
    auto pick = [&random](int64_t low, int64_t high) {
        return std::uniform_int_distribution<int64_t>(low, high)(random);
    };
    for (int step = 0; step < 400; step++) {
        const int64_t choice = pick(0, 9);
        if (choice < 5) {
            for (int32_t c = 0; Channel* channel = document.manager.ChannelAt(c); c++)
                channel->SetSelected(pick(0, 1) == 1);
            const int64_t start = pick(0, 20000);
            document.SetRange(start, start + pick(0, 3000));
            document.position.SetCursorFrame(pick(0, 20000));
            // Sometimes one channel has the focus, sometimes none.
            const int32_t count = document.mirror.Count();
            document.position.SetFocusIndex(count > 0 && pick(0, 1) == 1 ? int32_t(pick(0, count - 1)) : -1);
            std::unique_ptr<Action> action;
            switch (pick(0, 4)) {
            case 0: action = std::make_unique<PasteAction>(nullptr, &copyBuffer); break;
            case 1: action = std::make_unique<RemoveAction>(nullptr); break;
            case 2: action = std::make_unique<TruncateAction>(nullptr); break;
            case 3: action = std::make_unique<AddChannelAction>(nullptr); break;
            default: action = std::make_unique<RemoveChannelAction>(nullptr); break;
            }
            action->SetTo(&document.manager, &document.position);
            Action* raw = action.get();
            history.AddAction(action);
            raw->Go();
        } else if (choice < 8) {
            history.Undo();
        } else {
            history.Redo();
        }
        // Whatever the step did to the channel list, it was announced.
        EXPECT_EQ(document.mirror.shown, document.mirror.DocumentChannels());
    }
    const DocumentState edited = document.State();
    while (history.Undo() == B_OK) {
    }
    // Let playback run against the final state for a moment.
    const int64_t seen = buffers.load();
    while (withPlayback && buffers.load() < seen + 10)
        std::this_thread::yield();
    stop = true;
    playback.join();
    *buffersMixed = buffers.load();
    return {edited, document.State()};
}

// Playback mixes in its own thread while the window thread pastes, removes,
// truncates, adds and removes channels, undoes and redoes. ThreadSanitizer
// sees every access; the results must be those of the same sequence run
// without playback.
TEST(EditStressTest, EditsAndUndosWhilePlaybackMixes)
{
    int64_t mixed = 0;
    const auto alone = RunSequence(false, &mixed);
    EXPECT_EQ(mixed, 0);
    const auto concurrent = RunSequence(true, &mixed);
    EXPECT_GT(mixed, 10);
    EXPECT_EQ(concurrent.first, alone.first);
    EXPECT_EQ(concurrent.second, alone.second);
    // Undoing everything gives back every channel, in order.
    EXPECT_EQ(concurrent.second.channels.size(), 3u);
}

}  // namespace
}  // namespace glimmet
