#include <gtest/gtest.h>

#include <sys/resource.h>

#include <algorithm>
#include <csignal>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "SoundFixtures.h"
#include "files/WavFileWriter.h"

namespace glimmet {
namespace {

using test::SoundFixtures;

// Writeback started every 4 KiB and waited for 16 KiB behind, so that small
// files go through every step of it.
constexpr WavFileWriter::Writeback kEager{4096, 16384};

std::string ReadFile(const std::filesystem::path& path)
{
    std::ifstream in(path, std::ios::binary);
    return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

std::vector<std::string> DirectoryListing(const std::filesystem::path& directory)
{
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(directory))
        names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    return names;
}

/// Writes frames in pieces of uneven sizes; the first failure is returned.
status_t WriteInPieces(WavFileWriter& writer, const std::vector<int16_t>& frames)
{
    const int64_t total = int64_t(frames.size() / 2);
    int64_t at = 0;
    for (int64_t piece = 1; at < total; piece = piece * 3 % 5003 + 1) {
        const int64_t count = std::min(piece, total - at);
        const status_t status = writer.WriteFrames(frames.data() + 2 * at, count);
        if (status != B_OK)
            return status;
        at += count;
    }
    return B_OK;
}

class WavFileWriterTest : public ::testing::TestWithParam<int64_t> {
protected:
    /// The WAV file FFmpeg's own command line makes of the frames.
    std::string FFmpegWav(const std::vector<int16_t>& frames)
    {
        const auto raw = fixtures.WriteRaw("reference.raw", frames);
        const auto wav = fixtures.PathOf("reference.wav");
        EXPECT_TRUE(SoundFixtures::Run("ffmpeg -nostdin -v error -y -f s16le -ar 44100 -ac 2 -i "
                                       + SoundFixtures::Quote(raw)
                                       + " -fflags +bitexact -flags:a +bitexact -c:a pcm_s16le -rf64 never "
                                       + SoundFixtures::Quote(wav)));
        const std::string bytes = ReadFile(wav);
        std::filesystem::remove(raw);
        std::filesystem::remove(wav);
        return bytes;
    }

    SoundFixtures fixtures;
};

TEST_P(WavFileWriterTest, FileEqualsFFmpegsOwnByteForByte)
{
    const std::vector<int16_t> frames = SoundFixtures::Pattern(GetParam(), 2, 7);
    const auto path = fixtures.PathOf("ours.wav");
    {
        WavFileWriter writer(path, kEager);
        ASSERT_EQ(writer.InitCheck(), B_OK);
        ASSERT_EQ(writer.CommitHeader(), B_OK);
        ASSERT_EQ(WriteInPieces(writer, frames), B_OK);
        ASSERT_EQ(writer.Finish(), B_OK);
    }
    const std::string ours = ReadFile(path);
    ASSERT_EQ(ours.size(), 44 + 4 * frames.size() / 2);
    ASSERT_EQ(ours, FFmpegWav(frames));
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{"ours.wav"});
}

TEST_P(WavFileWriterTest, DefaultWritebackGivesTheSameFile)
{
    const std::vector<int16_t> frames = SoundFixtures::Pattern(GetParam(), 2, 8);
    const auto eager = fixtures.PathOf("eager.wav");
    const auto plain = fixtures.PathOf("plain.wav");
    WavFileWriter first(eager, kEager);
    WavFileWriter second(plain);
    for (WavFileWriter* writer : {&first, &second}) {
        ASSERT_EQ(writer->CommitHeader(), B_OK);
        ASSERT_EQ(WriteInPieces(*writer, frames), B_OK);
        ASSERT_EQ(writer->Finish(), B_OK);
    }
    EXPECT_EQ(ReadFile(eager), ReadFile(plain));
}

INSTANTIATE_TEST_SUITE_P(FrameCounts, WavFileWriterTest, ::testing::Values(1, 1023, 1024, 1025, 40000, 300007));

TEST(WavFileWriterFailureTest, FailureHalfWayKeepsTheOldFileAndLeavesNoTemporaryFile)
{
    SoundFixtures fixtures;
    const auto path = fixtures.WriteBytes("keep.wav", "the previous recording");
    const std::vector<int16_t> frames = SoundFixtures::Pattern(100000, 2);
    rlimit previous {};
    ASSERT_EQ(getrlimit(RLIMIT_FSIZE, &previous), 0);
    const auto oldHandler = std::signal(SIGXFSZ, SIG_IGN);
    status_t written = B_OK;
    status_t again = B_OK;
    status_t finished = B_OK;
    {
        WavFileWriter writer(path, kEager);
        ASSERT_EQ(writer.CommitHeader(), B_OK);
        // Files may not grow past 100 KB for a moment, as on a full disk.
        rlimit small = previous;
        small.rlim_cur = 100 * 1000;
        ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &small), 0);
        written = WriteInPieces(writer, frames);
        setrlimit(RLIMIT_FSIZE, &previous);
        // Later frames are refused with the first failure, even though they
        // would fit now.
        again = writer.WriteFrames(frames.data(), 1);
        finished = writer.Finish();
    }
    std::signal(SIGXFSZ, oldHandler);
    // The limit's own error, not a full disk's.
    EXPECT_STREQ(StatusText(written), "File too large");
    EXPECT_EQ(again, written);
    EXPECT_EQ(finished, written);
    EXPECT_EQ(ReadFile(path), "the previous recording");
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{"keep.wav"});
}

TEST(WavFileWriterFailureTest, TemporaryFileGoneBeforeTheRenameKeepsTheOldFile)
{
    SoundFixtures fixtures;
    const auto path = fixtures.WriteBytes("keep.wav", "the previous recording");
    const std::vector<int16_t> frames = SoundFixtures::Pattern(30000, 2);
    WavFileWriter writer(path, kEager);
    ASSERT_EQ(writer.CommitHeader(), B_OK);
    ASSERT_EQ(WriteInPieces(writer, frames), B_OK);
    // Someone removes the temporary file: everything still writes to it, but
    // it cannot be put in the destination's place.
    std::filesystem::remove(writer.TemporaryPath());
    EXPECT_EQ(writer.Finish(), B_ENTRY_NOT_FOUND);
    EXPECT_EQ(ReadFile(path), "the previous recording");
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{"keep.wav"});
}

}  // namespace
}  // namespace glimmet
