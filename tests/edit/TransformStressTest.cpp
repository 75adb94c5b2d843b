#include <gtest/gtest.h>

#include <atomic>
#include <cmath>
#include <random>
#include <thread>

#include "TestDocument.h"
#include "TransformCases.h"
#include "edit/HistoryManager.h"

namespace glimmet {
namespace {

using test::DocumentState;
using test::TestDocument;

// Playback mixes buffer after buffer in its own thread while the window
// thread transforms, undoes and redoes: the document lock must keep every
// buffer consistent, and ThreadSanitizer sees every access.
TEST(TransformStressTest, TransformsAndUndosWhilePlaybackMixes)
{
    TestDocument document;
    std::mt19937 random(99);
    constexpr int64_t kLength = 20000;
    for (int c = 0; c < 3; c++)
        document.AddChannel(test::RandomSamples(random, kLength), 0, true);
    const DocumentState initial = document.State();

    std::atomic<bool> stop{false};
    std::atomic<int64_t> buffers{0};
    std::atomic<bool> finite{true};
    std::thread playback([&] {
        std::vector<float> out(2 * 512);
        while (!stop.load()) {
            if (document.manager.FillBuffer(out.data(), 512)) {
                for (float value : out) {
                    if (!std::isfinite(value))
                        finite = false;
                }
                buffers++;
            }
        }
    });

    const auto transforms = test::AllTransforms();
    HistoryManager history;
    int recorded = 0;
    auto pick = [&random](int64_t low, int64_t high) {
        return std::uniform_int_distribution<int64_t>(low, high)(random);
    };
    for (int step = 0; step < 300; step++) {
        const int64_t choice = pick(0, 3);
        if (choice < 2) {
            const int64_t start = pick(0, kLength - 1);
            document.SetRange(start, std::min(kLength - 1, start + pick(0, 5000)));
            std::unique_ptr<Action> action = transforms[size_t(pick(0, 4))].make();
            ASSERT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
            Action* raw = action.get();
            ASSERT_EQ(history.AddAction(action), B_OK);
            ASSERT_EQ(raw->Go(), B_OK);
            recorded++;
        } else if (choice == 2) {
            history.Undo();
        } else {
            history.Redo();
        }
    }
    while (history.Undo() == B_OK) {
    }
    // Let playback run against the final state for a moment.
    const int64_t seen = buffers.load();
    while (buffers.load() < seen + 10)
        std::this_thread::yield();
    stop = true;
    playback.join();

    EXPECT_GT(recorded, 0);
    EXPECT_GT(buffers.load(), 10);
    EXPECT_TRUE(finite.load());
    // Everything undone: the samples are back byte for byte.
    const DocumentState final = document.State();
    ASSERT_EQ(final.channels.size(), initial.channels.size());
    for (size_t c = 0; c < final.channels.size(); c++)
        EXPECT_EQ(final.channels[c].samples, initial.channels[c].samples) << "channel " << c;
}

}  // namespace
}  // namespace glimmet
