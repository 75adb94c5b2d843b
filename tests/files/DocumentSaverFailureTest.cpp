#include <gtest/gtest.h>

#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>
#include <vector>

#include "RecordingTarget.h"
#include "SoundFixtures.h"
#include "edit/Action.h"
#include "edit/EditPosition.h"
#include "files/DocumentSaver.h"
#include "files/WriteFaults.h"
#include "sound/Channel.h"

namespace glimmet {
namespace {

using test::RecordingTarget;
using test::SoundFixtures;

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

/// A document with edits that no file holds yet, saved where saving fails.
class DocumentSaverFailureTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        auto channel = std::make_unique<Channel>();
        const std::vector<int16_t> samples = SoundFixtures::Pattern(50000, 1);
        auto* copy = new int16_t[samples.size()];
        std::copy(samples.begin(), samples.end(), copy);
        channel->SetTo(copy, int64_t(samples.size()));
        window.manager.AddChannel(std::move(channel));
        auto action = std::make_unique<Action>(nullptr);
        ASSERT_EQ(action->SetTo(&window.manager, &position), B_OK);
        ASSERT_EQ(window.history.AddAction(action), B_OK);
        ASSERT_FALSE(window.history.IsSaved());
        // The item as a save that worked before the edit left it.
        window.saveItemEnabled = false;
    }
    void TearDown() override { WriteFaults::Clear(); }

    /// The edits are in no file: the history says so and "Save" is offered.
    void ExpectStillUnsaved()
    {
        EXPECT_FALSE(window.history.IsSaved());
        EXPECT_TRUE(window.saveItemEnabled);
    }

    SoundFixtures fixtures;
    RecordingTarget window;
    EditPosition position;
};

struct Fault {
    WriteFaults::Step step;
    int error;
};

class InjectedFault : public DocumentSaverFailureTest, public ::testing::WithParamInterface<Fault> {};

TEST_P(InjectedFault, LeavesTheOldFileTheEditsUnsavedAndNamesTheCause)
{
    const auto path = fixtures.WriteBytes("take.wav", "the previous recording");
    status_t status = B_OK;
    {
        ScopedWriteFault fault(GetParam().step, GetParam().error);
        status = DocumentSaver::SaveFile(path, window);
    }
    EXPECT_STREQ(StatusText(status), std::strerror(GetParam().error));
    ExpectStillUnsaved();
    EXPECT_EQ(ReadFile(path), "the previous recording");
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{"take.wav"});

    // With the fault gone the same save works.
    EXPECT_EQ(DocumentSaver::SaveFile(path, window), B_OK);
    EXPECT_TRUE(window.history.IsSaved());
    EXPECT_FALSE(window.saveItemEnabled);
    EXPECT_EQ(ReadFile(path).size(), 44u + 50000 * 4);
}

INSTANTIATE_TEST_SUITE_P(EveryStep, InjectedFault,
    ::testing::Values(Fault{WriteFaults::Step::Create, EROFS}, Fault{WriteFaults::Step::Create, EACCES},
        Fault{WriteFaults::Step::Write, ENOSPC}, Fault{WriteFaults::Step::Write, EIO},
        Fault{WriteFaults::Step::Sync, EIO}, Fault{WriteFaults::Step::Sync, EDQUOT},
        Fault{WriteFaults::Step::Rename, EXDEV}, Fault{WriteFaults::Step::Rename, EROFS}));

TEST_F(DocumentSaverFailureTest, ANewFileInAReadOnlyFolderNamesTheReadOnlyFileSystem)
{
    const auto path = fixtures.PathOf("new.wav");
    ScopedWriteFault fault(WriteFaults::Step::Create, EROFS);
    EXPECT_STREQ(StatusText(DocumentSaver::SaveFile(path, window)), "Read-only file system");
    ExpectStillUnsaved();
    EXPECT_TRUE(DirectoryListing(fixtures.Directory()).empty());
}

TEST_F(DocumentSaverFailureTest, AFolderWeMayNotWriteIntoNamesThePermission)
{
    // The superuser may write into any folder; anyone else is refused here.
    if (geteuid() == 0)
        GTEST_SKIP() << "permission bits do not bind the superuser";
    const auto folder = fixtures.PathOf("locked");
    std::filesystem::create_directory(folder);
    ASSERT_EQ(chmod(folder.c_str(), 0555), 0);
    const status_t status = DocumentSaver::SaveFile(folder / "new.wav", window);
    chmod(folder.c_str(), 0755);
    EXPECT_STREQ(StatusText(status), "Permission denied");
    ExpectStillUnsaved();
}

TEST_F(DocumentSaverFailureTest, AWriteProtectedFileIsNotReplaced)
{
    const auto path = fixtures.WriteBytes("protected.wav", "keep me");
    ASSERT_EQ(chmod(path.c_str(), 0444), 0);
    EXPECT_STREQ(StatusText(DocumentSaver::SaveFile(path, window)), "Permission denied");
    ExpectStillUnsaved();
    EXPECT_EQ(ReadFile(path), "keep me");
    struct stat info {};
    ASSERT_EQ(stat(path.c_str(), &info), 0);
    EXPECT_EQ(info.st_mode & 07777, 0444u);
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{"protected.wav"});
}

TEST_F(DocumentSaverFailureTest, AFileOnlyItsGroupMayWriteIsNotReplacedEither)
{
    const auto path = fixtures.WriteBytes("group.wav", "keep me");
    ASSERT_EQ(chmod(path.c_str(), 0464), 0);
    EXPECT_STREQ(StatusText(DocumentSaver::SaveFile(path, window)), "Permission denied");
    EXPECT_EQ(ReadFile(path), "keep me");
}

TEST_F(DocumentSaverFailureTest, AFifoIsRefusedAndStaysAFifo)
{
    const auto path = fixtures.PathOf("pipe.wav");
    ASSERT_EQ(mkfifo(path.c_str(), 0644), 0);
    EXPECT_STREQ(StatusText(DocumentSaver::SaveFile(path, window)), "Not a regular file");
    ExpectStillUnsaved();
    struct stat info {};
    ASSERT_EQ(lstat(path.c_str(), &info), 0);
    EXPECT_TRUE(S_ISFIFO(info.st_mode));
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{"pipe.wav"});
}

TEST_F(DocumentSaverFailureTest, ALinkToADeviceIsRefusedAndTheDeviceLeftAlone)
{
    const auto link = fixtures.PathOf("null.wav");
    std::filesystem::create_symlink("/dev/null", link);
    EXPECT_STREQ(StatusText(DocumentSaver::SaveFile(link, window)), "Not a regular file");
    ExpectStillUnsaved();
    EXPECT_TRUE(std::filesystem::is_character_file("/dev/null"));
    EXPECT_EQ(std::filesystem::read_symlink(link), "/dev/null");
}

TEST_F(DocumentSaverFailureTest, ADanglingLinkCreatesTheFileItNamesAndStaysALink)
{
    const auto link = fixtures.PathOf("link.wav");
    std::filesystem::create_symlink("later.wav", link);
    EXPECT_EQ(DocumentSaver::SaveFile(link, window), B_OK);
    EXPECT_TRUE(std::filesystem::is_symlink(link));
    EXPECT_EQ(ReadFile(fixtures.PathOf("later.wav")).size(), 44u + 50000 * 4);
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), (std::vector<std::string>{"later.wav", "link.wav"}));
    EXPECT_TRUE(window.history.IsSaved());
}

TEST_F(DocumentSaverFailureTest, ALinkIntoAMissingFolderNamesTheMissingFolder)
{
    const auto link = fixtures.PathOf("link.wav");
    std::filesystem::create_symlink("gone/later.wav", link);
    EXPECT_STREQ(StatusText(DocumentSaver::SaveFile(link, window)), "No such file or directory");
    ExpectStillUnsaved();
    EXPECT_EQ(std::filesystem::read_symlink(link), "gone/later.wav");
}

TEST_F(DocumentSaverFailureTest, ALoopOfLinksIsNamedSo)
{
    std::filesystem::create_symlink("b.wav", fixtures.PathOf("a.wav"));
    std::filesystem::create_symlink("a.wav", fixtures.PathOf("b.wav"));
    EXPECT_STREQ(StatusText(DocumentSaver::SaveFile(fixtures.PathOf("a.wav"), window)), std::strerror(ELOOP));
    ExpectStillUnsaved();
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), (std::vector<std::string>{"a.wav", "b.wav"}));
}

TEST_F(DocumentSaverFailureTest, TheLongestLegalNamesSave)
{
    for (const size_t length : {240u, 255u}) {
        const std::string name = std::string(length - 4, 'n') + ".wav";
        const auto path = fixtures.PathOf(name);
        EXPECT_EQ(DocumentSaver::SaveFile(path, window), B_OK) << length;
        EXPECT_EQ(ReadFile(path).size(), 44u + 50000 * 4) << length;
        EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{name});
        std::filesystem::remove(path);
    }
}

TEST_F(DocumentSaverFailureTest, AFileSizeLimitFailsTheSaveInsteadOfKillingTheProgram)
{
    const auto path = fixtures.WriteBytes("limited.wav", "the previous recording");
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        // As the program starts: the signal as the system sets it, and a
        // limit far below the 200 KB the document needs.
        std::signal(SIGXFSZ, SIG_DFL);
        rlimit small {};
        getrlimit(RLIMIT_FSIZE, &small);
        small.rlim_cur = 16 * 1024;
        setrlimit(RLIMIT_FSIZE, &small);
        const status_t status = DocumentSaver::SaveFile(path, window);
        const bool named = std::strcmp(StatusText(status), "File too large") == 0;
        _exit(named && !window.history.IsSaved() && window.saveItemEnabled ? 0 : 1);
    }
    int result = 0;
    ASSERT_EQ(waitpid(child, &result, 0), child);
    ASSERT_TRUE(WIFEXITED(result)) << "killed by signal " << (WIFSIGNALED(result) ? WTERMSIG(result) : 0);
    EXPECT_EQ(WEXITSTATUS(result), 0);
    EXPECT_EQ(ReadFile(path), "the previous recording");
    EXPECT_EQ(DirectoryListing(fixtures.Directory()), std::vector<std::string>{"limited.wav"});
}

}  // namespace
}  // namespace glimmet
