#include <gtest/gtest.h>

#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "RecordingTarget.h"
#include "SoundFixtures.h"
#include "WavBytes.h"
#include "files/DocumentLoader.h"
#include "files/MemoryBudget.h"
#include "sound/Channel.h"
#include "support/DiagnosticsCapture.h"
#include "support/MessageCodes.h"
#include "sound/ChannelSamples.h"

namespace glimmet {
namespace {

using test::RecordingTarget;
using test::SoundFixtures;

constexpr int64_t kMiB = int64_t(1) << 20;

/// A /proc/self/status figure in bytes ("VmSize", "VmRSS").
int64_t ProcessFigure(const std::string& field)
{
    std::ifstream status("/proc/self/status");
    std::string line;
    while (std::getline(status, line)) {
        if (line.rfind(field + ":", 0) == 0)
            return std::atoll(line.c_str() + field.size() + 1) * 1024;
    }
    return -1;
}

/// Runs work in a forked child whose address space may grow by at most
/// room bytes, so that a loader that asks for what it should not gets
/// nothing (and fails the test) instead of making the machine swap. The
/// child's exit code is work's result: 0 for success.
int RunWithAddressSpaceRoom(int64_t room, const std::function<int()>& work)
{
    const pid_t child = fork();
    if (child == 0) {
        const rlimit limit{rlim_t(ProcessFigure("VmSize") + room), rlim_t(ProcessFigure("VmSize") + room)};
        if (setrlimit(RLIMIT_AS, &limit) != 0)
            _exit(100);
        _exit(work());
    }
    int status = 0;
    waitpid(child, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : 200 + (WIFSIGNALED(status) ? WTERMSIG(status) : 0);
}

/// Sets GLIMMET_MEMORY_LIMIT for the life of the object.
class MemoryLimit {
public:
    explicit MemoryLimit(int64_t bytes) { setenv(MemoryBudget::kLimitVariable, std::to_string(bytes).c_str(), 1); }
    ~MemoryLimit() { unsetenv(MemoryBudget::kLimitVariable); }
};

class LoadMemoryTest : public ::testing::Test {
protected:
    /// The document as a file opened before left it: one channel, a title.
    void OpenSomethingFirst()
    {
        const auto path = fixtures.Encode("before.wav", SoundFixtures::Pattern(500, 1), 8000, 1);
        ASSERT_EQ(DocumentLoader::Load(path, window), B_OK);
        window.posted.clear();
        window.replacements = 0;
        ASSERT_EQ(window.manager.CountChannels(), 1);
        before_ = window.manager.ChannelAt(0);
    }

    /// Nothing of the window changed since OpenSomethingFirst.
    void ExpectWindowAsItWas()
    {
        ASSERT_EQ(window.manager.CountChannels(), 1);
        EXPECT_EQ(window.manager.ChannelAt(0), before_);
        EXPECT_EQ(window.manager.ChannelAt(0)->FrameCount(), 500);
        EXPECT_EQ(window.title, "Glimmet - before.wav");
        EXPECT_EQ(window.entry.filename(), "before.wav");
        EXPECT_TRUE(window.posted.empty());
        EXPECT_EQ(window.replacements, 0);
    }

    /// seconds of eight channels of silence as FLAC; through a pipe the
    /// encoder cannot go back to write the length into the header.
    std::filesystem::path SilentFlac(const std::string& name, int seconds, bool lengthInHeader)
    {
        const auto path = fixtures.PathOf(name);
        const std::string input = "ffmpeg -nostdin -v error -y -f lavfi -i anullsrc=r=44100:cl=7.1 -t "
            + std::to_string(seconds) + " -c:a flac ";
        const std::string command = lengthInHeader ? input + SoundFixtures::Quote(path)
                                                   : "(" + input + "-f flac - > " + SoundFixtures::Quote(path) + ")";
        EXPECT_TRUE(SoundFixtures::Run(command));
        return path;
    }

    SoundFixtures fixtures;
    RecordingTarget window;
    Channel* before_ = nullptr;
};

#if defined(__SANITIZE_ADDRESS__)
constexpr int64_t kResidentGrowth = 96 * kMiB;
#else
constexpr int64_t kResidentGrowth = 16 * kMiB;
#endif

TEST_F(LoadMemoryTest, SparseJunkChunkAfterTheDataCostsNothing)
{
    // One second of stereo, then a chunk that claims 3 GiB of the file and
    // takes none of the disk.
    const std::vector<int16_t> source = SoundFixtures::Pattern(44100, 2);
    std::string bytes = test::WavBytes{}.Make(source);
    const uint32_t junk = 3u << 30;
    bytes += "junk";
    for (int i = 0; i < 4; ++i)
        bytes += char((junk >> (8 * i)) & 0xff);
    const auto path = fixtures.WriteBytes("junk.wav", bytes);
    std::filesystem::resize_file(path, bytes.size() + junk);

    const int result = RunWithAddressSpaceRoom(512 * kMiB, [&] {
        const int64_t resident = ProcessFigure("VmRSS");
        RecordingTarget target;
        if (DocumentLoader::Load(path, target) != B_OK || target.manager.CountChannels() != 2)
            return 1;
        for (int32_t k = 0; k < 2; ++k) {
            Channel* channel = target.manager.ChannelAt(k);
            if (channel->FrameCount() != 44100)
                return 2;
            const std::vector<int16_t> samples = test::SamplesOf(*channel);
            for (int64_t i = 0; i < 44100; ++i) {
                if (samples[size_t(i)] != source[size_t(2 * i + k)])
                    return 3;
            }
        }
        // 176 KB of samples; the rest is the decoder's and the allocator's
        // (more under AddressSanitizer, whose quarantine keeps freed memory).
        return ProcessFigure("VmRSS") - resident < kResidentGrowth ? 0 : 4;
    });
    EXPECT_EQ(result, 0);
}

TEST_F(LoadMemoryTest, HeaderLengthPastTheBudgetIsRefusedBeforeDecoding)
{
    OpenSomethingFirst();
    const auto path = SilentFlac("minute.flac", 60, true);
    const int64_t needed = int64_t(60) * 44100 * 8 * 2;
    MemoryLimit limit(needed / 2);
    DiagnosticsCapture errors(Diagnostics::Channel::Error);
    LoadReport report;
    EXPECT_EQ(DocumentLoader::Load(path, window), B_NO_MEMORY);
    EXPECT_EQ(DocumentLoader::Load(path, nullptr, false, &report), B_OK);  // no document: nothing to refuse
    EXPECT_FALSE(report.refused);
    ExpectWindowAsItWas();
    const std::string text = errors.Finish();
    EXPECT_NE(text.find("minute.flac"), std::string::npos) << text;
    EXPECT_NE(text.find("42 MB"), std::string::npos) << text;
    EXPECT_NE(text.find("21 MB"), std::string::npos) << text;
}

TEST_F(LoadMemoryTest, TheReportSaysWhatTheHeaderAskedFor)
{
    const auto path = SilentFlac("minute.flac", 60, true);
    MemoryLimit limit(10 * kMiB);
    DiagnosticsCapture quiet(Diagnostics::Channel::Error);
    ChannelManager document(nullptr);
    LoadReport report;
    EXPECT_EQ(DocumentLoader::Load(path, &document, false, &report), B_NO_MEMORY);
    EXPECT_TRUE(report.refused);
    EXPECT_EQ(report.neededBytes, int64_t(60) * 44100 * 8 * 2);
    EXPECT_EQ(report.budgetBytes, 10 * kMiB);
    EXPECT_EQ(document.CountChannels(), 0);
}

TEST_F(LoadMemoryTest, WithoutALengthTheDecodingStopsAtTheBudget)
{
    OpenSomethingFirst();
    const auto path = SilentFlac("unsized.flac", 60, false);
    MemoryLimit limit(8 * kMiB);
    DiagnosticsCapture errors(Diagnostics::Channel::Error);
    EXPECT_EQ(DocumentLoader::Load(path, window), B_NO_MEMORY);
    ExpectWindowAsItWas();
    EXPECT_NE(errors.Finish().find("more than the 8.4 MB"), std::string::npos);

    ChannelManager document(nullptr);
    LoadReport report;
    DiagnosticsCapture quiet(Diagnostics::Channel::Error);
    EXPECT_EQ(DocumentLoader::Load(path, &document, false, &report), B_NO_MEMORY);
    // Found by decoding: the file did not say.
    EXPECT_EQ(report.neededBytes, -1);
}

TEST_F(LoadMemoryTest, AFileThatFitsTheBudgetLoadsWhole)
{
    const auto path = SilentFlac("unsized.flac", 2, false);
    MemoryLimit limit(int64_t(2) * 44100 * 8 * 2 + 1);
    ASSERT_EQ(DocumentLoader::Load(path, window), B_OK);
    ASSERT_EQ(window.manager.CountChannels(), 8);
    for (int32_t k = 0; k < 8; ++k)
        EXPECT_EQ(window.manager.ChannelAt(k)->FrameCount(), 2 * 44100);
}

TEST_F(LoadMemoryTest, AnAddressSpaceLimitRefusesWhatWouldNotFit)
{
    // Six minutes of eight channels decode to 254 MB; the child has room
    // for 192 MiB in all. Nothing tells the loader but the limit itself.
    const auto path = SilentFlac("six.flac", 360, false);
    const int result = RunWithAddressSpaceRoom(192 * kMiB, [&] {
        DiagnosticsCapture quiet(Diagnostics::Channel::Error);
        ChannelManager document(nullptr);
        LoadReport report;
        const status_t status = DocumentLoader::Load(path, &document, false, &report);
        if (status != B_NO_MEMORY || !report.refused)
            return 1;
        return report.budgetBytes > 0 && report.budgetBytes < 192 * kMiB ? 0 : 2;
    });
    EXPECT_EQ(result, 0);
}

TEST_F(LoadMemoryTest, EveryTrackIsCheckedBeforeTheDocumentChanges)
{
    OpenSomethingFirst();
    // A short track and a long one: the first would fit, the second not, so
    // the file is refused and the first track's channels never arrive.
    const auto shortTrack = fixtures.Encode("short.wav", SoundFixtures::Pattern(1000, 2), 8000, 2);
    const auto longTrack = SilentFlac("minute.flac", 60, true);
    const auto both = fixtures.PathOf("both.mkv");
    ASSERT_TRUE(SoundFixtures::Run("ffmpeg -nostdin -v error -y -i " + SoundFixtures::Quote(shortTrack) + " -i "
                                   + SoundFixtures::Quote(longTrack) + " -map 0:a -map 1:a -c:a flac "
                                   + SoundFixtures::Quote(both)));
    window.appendOnLoad = true;
    MemoryLimit limit(4 * kMiB);
    DiagnosticsCapture quiet(Diagnostics::Channel::Error);
    EXPECT_EQ(DocumentLoader::Load(both, window), B_NO_MEMORY);
    ExpectWindowAsItWas();
}

TEST(MemoryBudget, TheEnvironmentLowersTheBudgetButNeverRaisesIt)
{
    EXPECT_GT(MemoryBudget::ForSamples(), 0);
    {
        MemoryLimit limit(1000000);
        EXPECT_EQ(MemoryBudget::ForSamples(), 1000000);
    }
    {
        MemoryLimit limit(INT64_MAX - 1);
        EXPECT_LT(MemoryBudget::ForSamples(), INT64_MAX - 1);
    }
    setenv(MemoryBudget::kLimitVariable, "lots", 1);
    EXPECT_LT(MemoryBudget::ForSamples(), MemoryBudget::kUnlimited);
    unsetenv(MemoryBudget::kLimitVariable);
}

TEST(MemoryBudget, TheSystemFigureIsMemAvailable)
{
    SoundFixtures fixtures;
    const auto meminfo = fixtures.WriteBytes("meminfo",
        "MemTotal:       16000000 kB\nMemFree:         1000000 kB\nMemAvailable:    3000000 kB\n");
    EXPECT_EQ(MemoryBudget::SystemAvailable(meminfo), int64_t(3000000) * 1024);
    EXPECT_EQ(MemoryBudget::SystemAvailable(fixtures.PathOf("missing")), MemoryBudget::kUnlimited);
}

TEST(MemoryBudget, AProcessLimitCountsWhatIsAlreadyMapped)
{
    const int result = RunWithAddressSpaceRoom(300 * kMiB, [] {
        const int64_t room = MemoryBudget::ProcessLimitRoom();
        if (room > 300 * kMiB || room < 250 * kMiB)
            return 1;
        // A margin stays free of samples.
        const int64_t budget = MemoryBudget::ForSamples();
        return budget < room - MemoryBudget::kFixedMargin && budget > room / 2 ? 0 : 2;
    });
    EXPECT_EQ(result, 0);
}

TEST(MemoryBudget, NoRoomLeavesNothing)
{
    EXPECT_EQ(MemoryBudget::AfterMargin(0), 0);
    EXPECT_EQ(MemoryBudget::AfterMargin(MemoryBudget::kFixedMargin), 0);
    EXPECT_EQ(MemoryBudget::AfterMargin(MemoryBudget::kUnlimited), MemoryBudget::kUnlimited);
    EXPECT_GT(MemoryBudget::AfterMargin(int64_t(1) << 30), int64_t(1) << 29);
}

TEST(MemoryBudget, SizesReadAsPeopleWriteThem)
{
    EXPECT_EQ(MemoryBudget::Describe(512), "512 bytes");
    EXPECT_EQ(MemoryBudget::Describe(42336000), "42 MB");
    EXPECT_EQ(MemoryBudget::Describe(2540160000), "2.5 GB");
}

}  // namespace
}  // namespace glimmet
