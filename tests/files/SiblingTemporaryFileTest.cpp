#include <gtest/gtest.h>

#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <csignal>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "RecordingTarget.h"
#include "SoundFixtures.h"
#include "files/DocumentSaver.h"
#include "files/SiblingTemporaryFile.h"
#include "files/WavFileWriter.h"

namespace glimmet {
namespace {

using test::RecordingTarget;
using test::SoundFixtures;

std::vector<std::string> DirectoryListing(const std::filesystem::path& directory)
{
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(directory))
        names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    return names;
}

std::string ReadFile(const std::filesystem::path& path)
{
    std::ifstream in(path, std::ios::binary);
    return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

/// Starts a save to target in a child process and kills it (SIGKILL) half
/// way, as a crash or the OOM killer would. True when it got that far.
bool KillASaveHalfWay(const std::filesystem::path& target)
{
    int ready[2];
    if (pipe(ready) != 0)
        return false;
    const pid_t child = fork();
    if (child < 0)
        return false;
    if (child == 0) {
        close(ready[0]);
        WavFileWriter writer(target);
        const std::vector<int16_t> frames = SoundFixtures::Pattern(4000, 2);
        const bool writing = writer.CommitHeader() == B_OK && writer.WriteFrames(frames.data(), 4000) == B_OK;
        const char answer = writing ? 'y' : 'n';
        (void)!write(ready[1], &answer, 1);
        pause();
        _exit(1);
    }
    close(ready[1]);
    char answer = 'n';
    const bool read = ::read(ready[0], &answer, 1) == 1;
    close(ready[0]);
    kill(child, SIGKILL);
    waitpid(child, nullptr, 0);
    return read && answer == 'y';
}

TEST(SiblingTemporaryFileTest, NamesAreShortHiddenAndTellTheirTarget)
{
    SoundFixtures fixtures;
    const std::string longName = std::string(251, 'x') + ".wav";
    for (const std::string& name : {std::string("a.wav"), longName}) {
        WavFileWriter writer(fixtures.PathOf(name));
        ASSERT_EQ(writer.InitCheck(), B_OK) << name.size();
        const std::string temporary = writer.TemporaryPath().filename().string();
        EXPECT_LE(temporary.size(), 40u);
        EXPECT_EQ(temporary.front(), '.');
        EXPECT_EQ(writer.TemporaryPath().parent_path(), fixtures.Directory());
        EXPECT_TRUE(SiblingTemporaryFile::Belongs(temporary, fixtures.PathOf(name)));
        EXPECT_FALSE(SiblingTemporaryFile::Belongs(temporary, fixtures.PathOf("b.wav")));
    }
}

TEST(SiblingTemporaryFileTest, WhatAKilledSaveLeftIsRemovedByTheNextSaveOfThatFile)
{
    SoundFixtures fixtures;
    const auto target = fixtures.WriteBytes("take.wav", "the previous recording");
    const auto other = fixtures.WriteBytes("other.wav", "another recording");
    ASSERT_TRUE(KillASaveHalfWay(target));
    ASSERT_TRUE(KillASaveHalfWay(other));
    // The target itself is safe; the killed saves left their files.
    EXPECT_EQ(ReadFile(target), "the previous recording");
    ASSERT_EQ(DirectoryListing(fixtures.Directory()).size(), 4u);

    RecordingTarget window;
    ASSERT_EQ(DocumentSaver::SaveFile(target, window), B_OK);
    // Only take.wav's leftover goes; other.wav's waits for its own save.
    const auto names = DirectoryListing(fixtures.Directory());
    ASSERT_EQ(names.size(), 3u);
    EXPECT_TRUE(SiblingTemporaryFile::Belongs(names[0], other)) << names[0];
    EXPECT_EQ(names[1], "other.wav");
    EXPECT_EQ(names[2], "take.wav");
    ASSERT_EQ(DocumentSaver::SaveFile(other, window), B_OK);
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), (std::vector<std::string>{"other.wav", "take.wav"}));
}

TEST(SiblingTemporaryFileTest, AFileASaveIsStillWritingIsLeftAlone)
{
    SoundFixtures fixtures;
    const auto target = fixtures.PathOf("busy.wav");
    WavFileWriter running(target);
    ASSERT_EQ(running.InitCheck(), B_OK);
    EXPECT_EQ(SiblingTemporaryFile::RemoveAbandoned(target), 0);
    EXPECT_TRUE(std::filesystem::exists(running.TemporaryPath()));

    // A second save of the same file meanwhile leaves it too, and the first
    // one still completes.
    RecordingTarget window;
    ASSERT_EQ(DocumentSaver::SaveFile(target, window), B_OK);
    EXPECT_TRUE(std::filesystem::exists(running.TemporaryPath()));
    ASSERT_EQ(running.CommitHeader(), B_OK);
    EXPECT_EQ(running.Finish(), B_OK);
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{"busy.wav"});
}

TEST(SiblingTemporaryFileTest, OnlyRegularFilesWithOurNamesAreRemoved)
{
    SoundFixtures fixtures;
    const auto target = fixtures.PathOf("take.wav");
    const std::string prefix = SiblingTemporaryFile::PrefixFor(target);
    const std::string ours = prefix + "0123abcd.tmp";
    ASSERT_TRUE(SiblingTemporaryFile::Belongs(ours, target));
    fixtures.WriteBytes(ours, "left over");
    fixtures.WriteBytes(prefix + "0123abcd.wav", "somebody's file");
    fixtures.WriteBytes(".take.wav.tmp", "somebody else's");
    std::filesystem::create_directory(fixtures.PathOf(prefix + "99999999.tmp"));
    EXPECT_EQ(SiblingTemporaryFile::RemoveAbandoned(target), 1);
    EXPECT_FALSE(std::filesystem::exists(fixtures.PathOf(ours)));
    EXPECT_EQ(DirectoryListing(fixtures.Directory()).size(), 3u);
}

}  // namespace
}  // namespace glimmet
