#include <gtest/gtest.h>

#include <memory>

#include <sys/resource.h>
#include <sys/stat.h>

#include <csignal>
#include <fstream>
#include <iterator>

#include "RecordingTarget.h"
#include "SoundFixtures.h"
#include "TrackReading.h"
#include "edit/Action.h"
#include "edit/EditPosition.h"
#include "files/DocumentSaver.h"
#include "files/FileTypeAttribute.h"
#include "files/FrameWriter.h"
#include "files/MediaFile.h"
#include "files/MediaTrack.h"
#include "files/WavFileWriter.h"
#include "sound/Channel.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet {
namespace {

using test::RecordingTarget;
using test::SoundFixtures;

/// Keeps the size of every buffer it is handed, and the frames.
class RecordingWriter : public FrameWriter {
public:
    status_t WriteFrames(const int16_t* frames, int64_t count) override
    {
        sizes.push_back(count);
        samples.insert(samples.end(), frames, frames + 2 * count);
        return sizes.size() == failAt ? B_IO_ERROR : B_OK;
    }

    std::vector<int64_t> sizes;
    std::vector<int16_t> samples;
    size_t failAt = 0;
};

std::string ReadFile(const std::filesystem::path& path)
{
    std::ifstream in(path, std::ios::binary);
    return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

uint32_t Read32(const std::string& bytes, size_t at)
{
    return uint32_t(uint8_t(bytes[at])) | uint32_t(uint8_t(bytes[at + 1])) << 8
        | uint32_t(uint8_t(bytes[at + 2])) << 16 | uint32_t(uint8_t(bytes[at + 3])) << 24;
}

uint16_t Read16(const std::string& bytes, size_t at)
{
    return uint16_t(uint8_t(bytes[at]) | uint8_t(bytes[at + 1]) << 8);
}

std::vector<int16_t> SamplesAfterHeader(const std::string& bytes)
{
    std::vector<int16_t> samples((bytes.size() - 44) / 2);
    std::copy(bytes.data() + 44, bytes.data() + 44 + samples.size() * 2, reinterpret_cast<char*>(samples.data()));
    return samples;
}

std::vector<std::string> DirectoryListing(const std::filesystem::path& directory)
{
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(directory))
        names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    return names;
}

class DocumentSaverTest : public ::testing::Test {
protected:
    Channel* AddChannel(const std::vector<int16_t>& samples, int8_t pan, bool muted = false)
    {
        auto* channel = new Channel();
        auto* copy = new int16_t[samples.size()];
        std::copy(samples.begin(), samples.end(), copy);
        channel->SetTo(copy, int64_t(samples.size()));
        channel->SetPanPosition(pan);
        channel->SetMuted(muted);
        window.manager.AddChannel(std::unique_ptr<Channel>(channel));
        return channel;
    }

    /// The document's save mix, taken straight from the manager.
    std::vector<int16_t> Mix()
    {
        RecordingWriter writer;
        DocumentSaver::WriteDocument(&window.manager, writer);
        return writer.samples;
    }

    /// Gives the history an action, so that it is not saved.
    void MakeUnsaved()
    {
        auto action = std::make_unique<Action>(nullptr);
        ASSERT_EQ(action->SetTo(&window.manager, &position), B_OK);
        ASSERT_EQ(window.history.AddAction(action), B_OK);
        ASSERT_FALSE(window.history.IsSaved());
    }

    SoundFixtures fixtures;
    RecordingTarget window;
    EditPosition position;
};

TEST_F(DocumentSaverTest, WritesBuffersOf1024Frames)
{
    AddChannel(SoundFixtures::Pattern(2500, 1), Channel::kPanMiddle);
    RecordingWriter writer;
    EXPECT_EQ(DocumentSaver::WriteDocument(&window.manager, writer), B_OK);
    EXPECT_EQ(writer.sizes, (std::vector<int64_t>{1024, 1024, 452}));
    EXPECT_EQ(window.manager.CurrentFrame(), 2500);
}

TEST_F(DocumentSaverTest, StartsFromFrameZeroWherePlaybackWas)
{
    AddChannel(SoundFixtures::Pattern(2500, 1), Channel::kPanMiddle);
    window.manager.SetCurrentFrame(2000);
    RecordingWriter writer;
    DocumentSaver::WriteDocument(&window.manager, writer);
    EXPECT_EQ(writer.sizes, (std::vector<int64_t>{1024, 1024, 452}));
}

TEST_F(DocumentSaverTest, StopsAtTheFirstWriteError)
{
    AddChannel(SoundFixtures::Pattern(5000, 1), Channel::kPanMiddle);
    RecordingWriter writer;
    writer.failAt = 2;
    EXPECT_EQ(DocumentSaver::WriteDocument(&window.manager, writer), B_IO_ERROR);
    EXPECT_EQ(writer.sizes.size(), 2u);
}

TEST_F(DocumentSaverTest, EmptyDocumentWritesNoBuffer)
{
    RecordingWriter writer;
    EXPECT_EQ(DocumentSaver::WriteDocument(&window.manager, writer), B_OK);
    EXPECT_TRUE(writer.sizes.empty());
    EXPECT_EQ(DocumentSaver::WriteDocument(nullptr, writer), B_OK);
}

TEST_F(DocumentSaverTest, SavesACanonicalWavFile)
{
    AddChannel(SoundFixtures::Pattern(2500, 1), Channel::kPanMiddle);
    MakeUnsaved();
    const auto path = fixtures.PathOf("out.wav");
    EXPECT_EQ(DocumentSaver::SaveFile(path, window), B_OK);

    const std::string bytes = ReadFile(path);
    ASSERT_EQ(bytes.size(), 44u + 2500 * 4);
    EXPECT_EQ(bytes.substr(0, 4), "RIFF");
    EXPECT_EQ(Read32(bytes, 4), 36u + 2500 * 4);
    EXPECT_EQ(bytes.substr(8, 8), "WAVEfmt ");
    EXPECT_EQ(Read32(bytes, 16), 16u);
    EXPECT_EQ(Read16(bytes, 20), 1);       // PCM
    EXPECT_EQ(Read16(bytes, 22), 2);       // stereo
    EXPECT_EQ(Read32(bytes, 24), 44100u);  // whatever the document's rate
    EXPECT_EQ(Read32(bytes, 28), 44100u * 4);
    EXPECT_EQ(Read16(bytes, 32), 4);
    EXPECT_EQ(Read16(bytes, 34), 16);
    EXPECT_EQ(bytes.substr(36, 4), "data");
    EXPECT_EQ(Read32(bytes, 40), 2500u * 4);
    EXPECT_EQ(SamplesAfterHeader(bytes), Mix());

    EXPECT_TRUE(window.history.IsSaved());
    EXPECT_FALSE(window.saveItemEnabled);
    EXPECT_EQ(FileType(path), "audio/x-wav");
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{"out.wav"});
}

TEST_F(DocumentSaverTest, SavedFileReadsBackThroughOurReader)
{
    AddChannel(SoundFixtures::Pattern(3000, 1, 1), Channel::kPanLeft);
    AddChannel(SoundFixtures::Pattern(2000, 1, 2), Channel::kPanRight);
    const auto path = fixtures.PathOf("back.wav");
    ASSERT_EQ(DocumentSaver::SaveFile(path, window), B_OK);
    MediaFile file(path);
    ASSERT_EQ(file.InitCheck(), B_OK);
    MediaTrack* track = file.TrackAt(0);
    EXPECT_EQ(track->CountFrames(), 3000);
    media_format decoded;
    EXPECT_EQ(test::ReadWholeTrack(track, &decoded), Mix());
    EXPECT_EQ(decoded.raw_audio.frame_rate, 44100.0f);
    EXPECT_EQ(decoded.raw_audio.channel_count, 2u);
}

TEST_F(DocumentSaverTest, MutedChannelIsAbsentAndLeftChannelOnlyLeft)
{
    AddChannel(SoundFixtures::Pattern(1500, 1, 1), Channel::kPanLeft);
    AddChannel(SoundFixtures::Pattern(1500, 1, 2), Channel::kPanRight, true);
    const auto path = fixtures.PathOf("sides.wav");
    ASSERT_EQ(DocumentSaver::SaveFile(path, window), B_OK);
    const std::vector<int16_t> saved = SamplesAfterHeader(ReadFile(path));
    ASSERT_EQ(saved.size(), 3000u);
    int nonZeroLeft = 0;
    for (size_t frame = 0; frame < 1500; ++frame) {
        ASSERT_EQ(saved[2 * frame + 1], 0) << "frame " << frame;
        nonZeroLeft += saved[2 * frame] != 0;
    }
    EXPECT_GT(nonZeroLeft, 1400);

    // Unmuted, the right channel shows on the right side only.
    window.manager.ChannelAt(1)->SetMuted(false);
    window.manager.ChannelAt(0)->SetMuted(true);
    ASSERT_EQ(DocumentSaver::SaveFile(path, window), B_OK);
    const std::vector<int16_t> right = SamplesAfterHeader(ReadFile(path));
    for (size_t frame = 0; frame < 1500; ++frame)
        ASSERT_EQ(right[2 * frame], 0) << "frame " << frame;
}

TEST_F(DocumentSaverTest, EmptyDocumentGivesHeaderOnlyAndMarksSaved)
{
    MakeUnsaved();
    const auto path = fixtures.PathOf("empty.wav");
    EXPECT_EQ(DocumentSaver::SaveFile(path, window), B_OK);
    const std::string bytes = ReadFile(path);
    ASSERT_EQ(bytes.size(), 44u);
    EXPECT_EQ(Read32(bytes, 40), 0u);
    EXPECT_EQ(Read32(bytes, 4), 36u);
    EXPECT_TRUE(window.history.IsSaved());
    EXPECT_FALSE(window.saveItemEnabled);
}

TEST_F(DocumentSaverTest, ReplacingKeepsPermissionsAndFollowsLinks)
{
    AddChannel(SoundFixtures::Pattern(100, 1), Channel::kPanMiddle);
    const auto real = fixtures.WriteBytes("real.wav", "old contents");
    ASSERT_EQ(chmod(real.c_str(), 0640), 0);
    const auto link = fixtures.PathOf("link.wav");
    std::filesystem::create_symlink(real, link);
    ASSERT_EQ(DocumentSaver::SaveFile(link, window), B_OK);
    EXPECT_TRUE(std::filesystem::is_symlink(link));
    EXPECT_EQ(ReadFile(real).size(), 44u + 400);
    struct stat info {};
    ASSERT_EQ(stat(real.c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 07777, 0640u);
}

TEST_F(DocumentSaverTest, FailedWriteLeavesTheOldFileAndNoTemporaryFile)
{
    AddChannel(SoundFixtures::Pattern(200000, 1), Channel::kPanMiddle);
    MakeUnsaved();
    const auto path = fixtures.WriteBytes("keep.wav", "the previous recording");
    // Files may not grow past 64 KB for a moment: the write fails half-way,
    // as on a full disk.
    rlimit previous {};
    ASSERT_EQ(getrlimit(RLIMIT_FSIZE, &previous), 0);
    const auto oldHandler = std::signal(SIGXFSZ, SIG_IGN);
    rlimit small = previous;
    small.rlim_cur = 64 * 1024;
    ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &small), 0);
    DiagnosticsCapture capture;
    const status_t status = DocumentSaver::SaveFile(path, window);
    const std::string printed = capture.Finish();
    setrlimit(RLIMIT_FSIZE, &previous);
    std::signal(SIGXFSZ, oldHandler);

    // The result is the failed write's, with the limit's own error; the
    // window prints it.
    EXPECT_STREQ(StatusText(status), "File too large");
    EXPECT_EQ(printed, "");
    EXPECT_EQ(ReadFile(path), "the previous recording");
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{"keep.wav"});
    // The edits are not in any file: they are still unsaved.
    EXPECT_FALSE(window.history.IsSaved());
    EXPECT_TRUE(window.saveItemEnabled);
}

TEST_F(DocumentSaverTest, MissingDirectoryFailsWithTheCreationsError)
{
    AddChannel(SoundFixtures::Pattern(100, 1), Channel::kPanMiddle);
    MakeUnsaved();
    const auto path = fixtures.PathOf("no/such/dir.wav");
    DiagnosticsCapture capture;
    EXPECT_EQ(DocumentSaver::SaveFile(path, window), B_ENTRY_NOT_FOUND);
    EXPECT_EQ(capture.Finish(), "");
    EXPECT_FALSE(std::filesystem::exists(path));
    // No track was made, so nothing was marked.
    EXPECT_FALSE(window.history.IsSaved());
    EXPECT_TRUE(window.saveItemEnabled);
}

TEST_F(DocumentSaverTest, WriterThatIsNeverFinishedLeavesNothing)
{
    const auto path = fixtures.PathOf("abandoned.wav");
    {
        WavFileWriter writer(path);
        ASSERT_EQ(writer.InitCheck(), B_OK);
        ASSERT_EQ(writer.CommitHeader(), B_OK);
        const std::vector<int16_t> frames = SoundFixtures::Pattern(100, 2);
        ASSERT_EQ(writer.WriteFrames(frames.data(), 100), B_OK);
        EXPECT_TRUE(std::filesystem::exists(writer.TemporaryPath()));
        EXPECT_FALSE(std::filesystem::exists(path));
    }
    EXPECT_TRUE(DirectoryListing(fixtures.Directory()).empty());
}

TEST_F(DocumentSaverTest, WriterRefusesFramesBeforeTheHeader)
{
    WavFileWriter writer(fixtures.PathOf("early.wav"));
    const std::vector<int16_t> frames = SoundFixtures::Pattern(10, 2);
    EXPECT_EQ(writer.WriteFrames(frames.data(), 10), B_NO_INIT);
    EXPECT_EQ(writer.Finish(), B_NO_INIT);
    EXPECT_TRUE(DirectoryListing(fixtures.Directory()).empty());
}

TEST_F(DocumentSaverTest, TypeAttributeWithoutUserAttributesIsNoError)
{
    // /proc keeps no user attributes at all.
    EXPECT_EQ(SetFileType("/proc/self/comm", "audio/x-wav"), B_OK);
    EXPECT_EQ(SetFileType(fixtures.PathOf("absent.wav"), "audio/x-wav"), B_ENTRY_NOT_FOUND);
}

}  // namespace
}  // namespace glimmet

namespace glimmet {
namespace {

TEST_F(DocumentSaverTest, DirectoryInTheWayIsNeitherWrittenNorLabelled)
{
    AddChannel(SoundFixtures::Pattern(100, 1), Channel::kPanMiddle);
    const auto directory = fixtures.PathOf("folder.wav");
    std::filesystem::create_directory(directory);
    DiagnosticsCapture capture;
    EXPECT_EQ(DocumentSaver::SaveFile(directory, window), B_IS_A_DIRECTORY);
    EXPECT_EQ(capture.Finish(), "");
    EXPECT_TRUE(std::filesystem::is_directory(directory));
    EXPECT_EQ(FileType(directory), "");
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{"folder.wav"});
}

}  // namespace
}  // namespace glimmet
