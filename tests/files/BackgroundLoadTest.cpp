#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <thread>

#include "RecordingTarget.h"
#include "SoundFixtures.h"
#include "files/BackgroundLoad.h"
#include "files/DocumentLoader.h"
#include "files/LoadProgress.h"
#include "sound/Channel.h"
#include "support/MessageCodes.h"

namespace glimmet {
namespace {

using test::RecordingTarget;
using test::SoundFixtures;

/// What a load leaves in a target, channel by channel.
struct Outcome {
    status_t status = B_OK;
    std::vector<std::vector<int16_t>> samples;
    std::vector<int8_t> pans;
    std::vector<float> rates;
    std::filesystem::path entry;
    std::string title;
    std::vector<uint32_t> posted;
    int replacements = 0;

    bool operator==(const Outcome&) const = default;
};

Outcome Read(RecordingTarget& target, status_t status)
{
    Outcome outcome;
    outcome.status = status;
    for (int32_t i = 0; i < target.manager.CountChannels(); ++i) {
        Channel* channel = target.manager.ChannelAt(i);
        std::vector<int16_t> samples(size_t(channel->FrameCount()));
        channel->FillBuffer(samples.data(), 0, channel->FrameCount());
        outcome.samples.push_back(std::move(samples));
        outcome.pans.push_back(channel->PanPosition());
        outcome.rates.push_back(channel->FrameRate());
    }
    outcome.entry = target.entry;
    outcome.title = target.title;
    outcome.posted = target.posted;
    outcome.replacements = target.replacements;
    return outcome;
}

void AddExisting(RecordingTarget& target, int64_t frames)
{
    auto* channel = new Channel();
    channel->SetTo(new int16_t[size_t(frames)](), frames);
    target.manager.AddChannel(std::unique_ptr<Channel>(channel));
}

class BackgroundLoadTest : public ::testing::Test {
protected:
    ~BackgroundLoadTest() override { BackgroundLoad::SetWorkerHook(nullptr); }

    /// Loads file into two alike targets, directly and on a worker thread,
    /// and expects the same outcome.
    void ExpectSameAsDirect(const std::filesystem::path& file, bool append, int existing, bool withDocument = true)
    {
        RecordingTarget direct;
        RecordingTarget background;
        for (RecordingTarget* target : {&direct, &background}) {
            target->appendOnLoad = append;
            target->withDocument = withDocument;
            for (int i = 0; i < existing; ++i)
                AddExisting(*target, 10 + i);
        }
        const status_t directStatus = DocumentLoader::Load(file, direct);
        BackgroundLoad load(file, append, withDocument);
        const status_t backgroundStatus = load.Finish(background);
        const Outcome expected = Read(direct, directStatus);
        const Outcome got = Read(background, backgroundStatus);
        EXPECT_EQ(got.status, expected.status);
        EXPECT_EQ(got.samples.size(), expected.samples.size());
        EXPECT_TRUE(got == expected) << file;
    }

    SoundFixtures fixtures;
};

TEST_F(BackgroundLoadTest, MonoOverExistingChannelsEndsAsADirectLoad)
{
    ExpectSameAsDirect(fixtures.Encode("mono.wav", SoundFixtures::Pattern(3000, 1), 22050, 1), false, 2);
}

TEST_F(BackgroundLoadTest, StereoAppendedEndsAsADirectLoad)
{
    ExpectSameAsDirect(fixtures.Encode("stereo.wav", SoundFixtures::Pattern(5000, 2), 44100, 2), true, 1);
}

TEST_F(BackgroundLoadTest, CompressedFileEndsAsADirectLoad)
{
    ExpectSameAsDirect(fixtures.Encode("coded.flac", SoundFixtures::Pattern(4000, 2, 3), 8000, 2), false, 0);
}

TEST_F(BackgroundLoadTest, TwoAudioTracksEndAsADirectLoad)
{
    const auto first = fixtures.Encode("first.wav", SoundFixtures::Pattern(1000, 2), 8000, 2);
    const auto second = fixtures.Encode("second.wav", SoundFixtures::Pattern(700, 1, 4), 8000, 1);
    const auto both = fixtures.PathOf("both.mkv");
    ASSERT_TRUE(SoundFixtures::Run("ffmpeg -nostdin -v error -y -i " + SoundFixtures::Quote(first) + " -i "
        + SoundFixtures::Quote(second) + " -map 0:a -map 1:a -c:a flac " + SoundFixtures::Quote(both)));
    ExpectSameAsDirect(both, false, 1);
    ExpectSameAsDirect(both, true, 1);
}

TEST_F(BackgroundLoadTest, MissingFileAndMissingDocumentEndAsADirectLoad)
{
    ExpectSameAsDirect(fixtures.PathOf("missing.wav"), false, 1);
    ExpectSameAsDirect(fixtures.Encode("nodoc.wav", SoundFixtures::Pattern(100, 1), 8000, 1), false, 0, false);
}

TEST_F(BackgroundLoadTest, NothingReachesTheTargetBeforeFinish)
{
    const auto file = fixtures.Encode("held.wav", SoundFixtures::Pattern(2000, 1), 8000, 1);
    std::atomic<bool> release{false};
    BackgroundLoad::SetWorkerHook([&release](const std::filesystem::path&, const LoadProgress&) {
        while (!release.load())
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
    });
    RecordingTarget target;
    AddExisting(target, 5);
    BackgroundLoad load(file, false, true);
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
    EXPECT_FALSE(load.IsDone());
    EXPECT_EQ(target.manager.CountChannels(), 1);
    release = true;
    EXPECT_EQ(load.Finish(target), B_OK);
    ASSERT_EQ(target.manager.CountChannels(), 1);
    EXPECT_EQ(target.manager.ChannelAt(0)->FrameCount(), 2000);
    EXPECT_EQ(target.posted, std::vector<uint32_t>{kMsgShowAll});
}

TEST_F(BackgroundLoadTest, ACancelledLoadLeavesTheTargetAlone)
{
    const auto file = fixtures.Encode("dropped.wav", SoundFixtures::Pattern(2000, 2), 8000, 2);
    std::atomic<bool> sawCancel{false};
    BackgroundLoad::SetWorkerHook([&sawCancel](const std::filesystem::path&, const LoadProgress& progress) {
        while (!progress.IsCancelled())
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        sawCancel = true;
    });
    RecordingTarget target;
    AddExisting(target, 5);
    {
        BackgroundLoad load(file, false, true);
        load.Cancel();
        EXPECT_EQ(load.Finish(target), B_ERROR);
    }
    EXPECT_TRUE(sawCancel);
    ASSERT_EQ(target.manager.CountChannels(), 1);
    EXPECT_EQ(target.manager.ChannelAt(0)->FrameCount(), 5);
    EXPECT_TRUE(target.posted.empty());
    EXPECT_EQ(target.title, "untitled");
}

TEST_F(BackgroundLoadTest, DestroyingAnUnfinishedLoadEndsItsWorker)
{
    const auto file = fixtures.Encode("abandoned.wav", SoundFixtures::Pattern(2000, 1), 8000, 1);
    std::atomic<bool> sawCancel{false};
    BackgroundLoad::SetWorkerHook([&sawCancel](const std::filesystem::path&, const LoadProgress& progress) {
        while (!progress.IsCancelled())
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        sawCancel = true;
    });
    { BackgroundLoad load(file, false, true); }
    EXPECT_TRUE(sawCancel);
}

TEST_F(BackgroundLoadTest, TheDoneHookRunsOnceTheLoadIsDone)
{
    const auto file = fixtures.Encode("told.wav", SoundFixtures::Pattern(3000, 2), 44100, 2);
    std::atomic<int> calls{0};
    std::atomic<bool> doneWhenCalled{false};
    BackgroundLoad* self = nullptr;
    std::atomic<bool> ready{false};
    BackgroundLoad load(file, false, true, [&] {
        while (!ready.load())
            std::this_thread::yield();
        doneWhenCalled = self->IsDone();
        ++calls;
    });
    self = &load;
    ready = true;
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (calls.load() == 0 && std::chrono::steady_clock::now() < deadline)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    EXPECT_EQ(calls.load(), 1);
    EXPECT_TRUE(doneWhenCalled.load());
    RecordingTarget target;
    EXPECT_EQ(load.Finish(target), B_OK);
    EXPECT_EQ(target.manager.CountChannels(), 2);
    EXPECT_EQ(calls.load(), 1);
}

TEST(LoadProgress, ACancelledLoadStopsReadingTheFile)
{
    SoundFixtures fixtures;
    const auto file = fixtures.Encode("long.wav", SoundFixtures::Pattern(200000, 1), 8000, 1);
    RecordingTarget whole;
    DocumentLoader::Load(file, whole);
    ASSERT_EQ(whole.manager.ChannelAt(0)->FrameCount(), 200000);

    LoadProgress progress;
    progress.Cancel();
    RecordingTarget cut;
    {
        LoadProgress::Scope scope(progress);
        DocumentLoader::Load(file, cut);
    }
    const int64_t frames = cut.manager.CountChannels() == 0 ? 0 : cut.manager.ChannelAt(0)->FrameCount();
    EXPECT_LT(frames, 200000);
}

TEST(LoadProgress, FollowsThePositionOfTheFileRead)
{
    SoundFixtures fixtures;
    const auto file = fixtures.Encode("measured.wav", SoundFixtures::Pattern(100000, 2), 8000, 2);
    LoadProgress progress;
    EXPECT_EQ(progress.Fraction(), 0.0);
    RecordingTarget target;
    {
        LoadProgress::Scope scope(progress);
        DocumentLoader::Load(file, target);
    }
    EXPECT_GT(progress.Fraction(), 0.95);
    EXPECT_LE(progress.Fraction(), 1.0);
    EXPECT_GE(progress.Passes(), 1);
    // Outside the scope nothing reports to it.
    EXPECT_TRUE(LoadProgress::Report(0, 100));
    EXPECT_GT(progress.Fraction(), 0.95);
}

}  // namespace
}  // namespace glimmet
