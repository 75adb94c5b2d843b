#include <gtest/gtest.h>

#include <atomic>
#include <fstream>
#include <iterator>
#include <thread>

#include "RecordingTarget.h"
#include "SoundFixtures.h"
#include "files/DocumentLoader.h"
#include "files/DocumentSaver.h"
#include "sound/Channel.h"

namespace glimmet {
namespace {

using test::RecordingTarget;
using test::SoundFixtures;

/// Mixes playback buffers on a thread of its own, as the audio device does,
/// until stopped.
class PlaybackThread {
public:
    explicit PlaybackThread(ChannelManager& manager)
        : thread_([this, &manager] {
              std::vector<float> buffer(2 * 512);
              while (!stop_.load()) {
                  manager.FillBuffer(buffer.data(), 512);
                  buffers_.fetch_add(1);
              }
          })
    {
    }
    ~PlaybackThread()
    {
        stop_ = true;
        thread_.join();
    }

    int64_t Buffers() const { return buffers_.load(); }

private:
    std::atomic<bool> stop_{false};
    std::atomic<int64_t> buffers_{0};
    std::thread thread_;
};

TEST(FileStressTest, SavingWhilePlayingWritesAConsistentMix)
{
    SoundFixtures fixtures;
    RecordingTarget window;
    window.manager.SetLoop(true);
    const auto source = fixtures.Encode("play.wav", SoundFixtures::Pattern(20000, 2), 44100, 2);
    ASSERT_EQ(DocumentLoader::Load(source, window), B_OK);
    const auto path = fixtures.PathOf("saved.wav");

    std::string first;
    {
        PlaybackThread playback(window.manager);
        for (int round = 0; round < 5; ++round) {
            ASSERT_EQ(DocumentSaver::SaveFile(path, window), B_OK);
            std::ifstream in(path, std::ios::binary);
            const std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
            ASSERT_EQ(bytes.size(), 44u + 20000 * 4);
            if (round == 0)
                first = bytes;
            EXPECT_EQ(bytes, first) << "round " << round;
        }
        while (playback.Buffers() < 10)
            std::this_thread::yield();
    }
}

TEST(FileStressTest, AppendingWhilePlayingKeepsEveryChannel)
{
    SoundFixtures fixtures;
    RecordingTarget window;
    window.appendOnLoad = true;
    const auto source = fixtures.Encode("more.flac", SoundFixtures::Pattern(5000, 2), 44100, 2);
    PlaybackThread playback(window.manager);
    for (int round = 0; round < 4; ++round)
        ASSERT_EQ(DocumentLoader::Load(source, window), B_OK);
    EXPECT_EQ(window.manager.CountChannels(), 8);
    EXPECT_EQ(window.manager.FrameCount(), 5000);
}

}  // namespace
}  // namespace glimmet
