#include <gtest/gtest.h>

#include <thread>

#include "SoundFixtures.h"
#include "files/AsyncFrameWriter.h"

namespace glimmet {
namespace {

using test::SoundFixtures;

/// Keeps what it is given and the thread it was called on; fails from the
/// failAt-th call on when asked to.
class CollectingWriter : public FrameWriter {
public:
    status_t WriteFrames(const int16_t* frames, int64_t count) override
    {
        ++calls;
        threads.push_back(std::this_thread::get_id());
        if (failAt != 0 && calls >= failAt)
            return B_DEVICE_FULL;
        samples.insert(samples.end(), frames, frames + 2 * count);
        return B_OK;
    }

    std::vector<int16_t> samples;
    std::vector<std::thread::id> threads;
    int calls = 0;
    int failAt = 0;
};

/// Feeds the frames in buffers of 1024 frames, as saving does.
status_t Feed(FrameWriter& writer, const std::vector<int16_t>& frames)
{
    for (size_t at = 0; at < frames.size(); at += 2048) {
        const size_t samples = std::min<size_t>(2048, frames.size() - at);
        const status_t status = writer.WriteFrames(frames.data() + at, int64_t(samples / 2));
        if (status != B_OK)
            return status;
    }
    return B_OK;
}

TEST(AsyncFrameWriterTest, HandsOnTheSameFramesInOrderOnAnotherThread)
{
    const std::vector<int16_t> frames = SoundFixtures::Pattern(300000, 2);
    CollectingWriter target;
    {
        AsyncFrameWriter writer(target);
        EXPECT_EQ(Feed(writer, frames), B_OK);
        EXPECT_EQ(writer.Close(), B_OK);
        EXPECT_EQ(writer.Close(), B_OK);
    }
    EXPECT_EQ(target.samples, frames);
    // Gathered into chunks: far fewer calls than buffers.
    EXPECT_EQ(target.calls, 5);
    for (const auto& id : target.threads)
        EXPECT_NE(id, std::this_thread::get_id());
}

TEST(AsyncFrameWriterTest, ReportsTheTargetsFailureAndStopsWriting)
{
    const std::vector<int16_t> frames = SoundFixtures::Pattern(2000000, 2);
    CollectingWriter target;
    target.failAt = 2;
    AsyncFrameWriter writer(target);
    const status_t fed = Feed(writer, frames);
    EXPECT_EQ(writer.Close(), B_DEVICE_FULL);
    // The producer learns of the failure within a few chunks.
    EXPECT_EQ(fed, B_DEVICE_FULL);
    EXPECT_EQ(target.samples.size(), size_t(AsyncFrameWriter::kChunkFrames) * 2);
    EXPECT_LE(target.calls, 2);
}

TEST(AsyncFrameWriterTest, DestructionWritesWhatIsLeft)
{
    const std::vector<int16_t> frames = SoundFixtures::Pattern(1000, 2);
    CollectingWriter target;
    {
        AsyncFrameWriter writer(target);
        EXPECT_EQ(Feed(writer, frames), B_OK);
    }
    EXPECT_EQ(target.samples, frames);
}

TEST(AsyncFrameWriterTest, RefusesEmptyWrites)
{
    CollectingWriter target;
    AsyncFrameWriter writer(target);
    const int16_t frame[2] = {1, 2};
    EXPECT_EQ(writer.WriteFrames(nullptr, 1), B_BAD_VALUE);
    EXPECT_EQ(writer.WriteFrames(frame, 0), B_BAD_VALUE);
    EXPECT_EQ(writer.Close(), B_OK);
    EXPECT_EQ(target.calls, 0);
}

}  // namespace
}  // namespace glimmet
