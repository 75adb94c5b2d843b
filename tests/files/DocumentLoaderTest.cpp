#include <gtest/gtest.h>

#include <memory>

#include "RecordingTarget.h"
#include "SoundFixtures.h"
#include "WavBytes.h"
#include "files/DocumentLoader.h"
#include "sound/Channel.h"
#include "sound/BlockBuilder.h"
#include "sound/SampleBlock.h"
#include "support/MessageCodes.h"
#include "sound/ChannelSamples.h"

namespace glimmet {
namespace {

using test::RecordingTarget;
using test::SoundFixtures;

class DocumentLoaderTest : public ::testing::Test {
protected:
    /// Puts a channel of n frames in the document, as if loaded before.
    Channel* AddExistingChannel(int64_t frames)
    {
        auto* channel = new Channel();
        channel->SetTo(new int16_t[size_t(frames)](), frames);
        window.manager.AddChannel(std::unique_ptr<Channel>(channel));
        return channel;
    }

    std::vector<int8_t> Pans()
    {
        std::vector<int8_t> pans;
        for (int32_t i = 0; i < window.manager.CountChannels(); ++i)
            pans.push_back(window.manager.ChannelAt(i)->PanPosition());
        return pans;
    }

    std::filesystem::path TwoTrackFile(int32_t firstChannels, int32_t secondChannels)
    {
        const auto first = fixtures.Encode("first.wav", SoundFixtures::Pattern(1000, firstChannels), 8000,
                                           firstChannels);
        const auto second = fixtures.Encode("second.wav", SoundFixtures::Pattern(700, secondChannels, 4), 8000,
                                            secondChannels);
        const auto both = fixtures.PathOf("both.mkv");
        EXPECT_TRUE(SoundFixtures::Run("ffmpeg -nostdin -v error -y -i " + SoundFixtures::Quote(first) + " -i "
                                       + SoundFixtures::Quote(second) + " -map 0:a -map 1:a -c:a flac "
                                       + SoundFixtures::Quote(both)));
        return both;
    }

    SoundFixtures fixtures;
    RecordingTarget window;
};

TEST_F(DocumentLoaderTest, MonoFileReplacesTheDocumentByOneLeftChannel)
{
    AddExistingChannel(10);
    AddExistingChannel(20);
    const auto path = fixtures.Encode("mono.wav", SoundFixtures::Pattern(3000, 1), 22050, 1);
    EXPECT_EQ(DocumentLoader::Load(path, window), B_OK);
    ASSERT_EQ(window.manager.CountChannels(), 1);
    EXPECT_EQ(Pans(), std::vector<int8_t>{Channel::kPanLeft});
    EXPECT_EQ(window.manager.ChannelAt(0)->FrameCount(), 3000);
    ASSERT_EQ(window.mirror.shown.size(), 1u);
    EXPECT_EQ(window.mirror.shown[0], window.manager.ChannelAt(0));
    EXPECT_EQ(window.title, "Glimmet - mono.wav");
    EXPECT_EQ(window.entry, std::filesystem::canonical(path));
    EXPECT_EQ(window.posted, std::vector<uint32_t>{kMsgShowAll});
}

TEST_F(DocumentLoaderTest, StereoFileGivesLeftAndRight)
{
    const auto path = fixtures.Encode("stereo.flac", SoundFixtures::Pattern(3000, 2), 44100, 2, "-c:a flac");
    EXPECT_EQ(DocumentLoader::Load(path, window), B_OK);
    EXPECT_EQ(Pans(), (std::vector<int8_t>{Channel::kPanLeft, Channel::kPanRight}));
    for (int32_t i = 0; i < 2; ++i) {
        Channel* channel = window.manager.ChannelAt(i);
        EXPECT_EQ(channel->FirstFrame(), 0);
        EXPECT_FALSE(channel->IsMuted());
        EXPECT_FALSE(channel->IsSelected());
        EXPECT_EQ(channel->FrameRate(), 44100.0f);
    }
    // The document keeps its own rate whatever the file's.
    EXPECT_EQ(window.manager.FrameRate(), 44100.0f);
}

TEST_F(DocumentLoaderTest, DocumentRateIsNotTakenFromTheFile)
{
    const auto path = fixtures.Encode("slow.wav", SoundFixtures::Pattern(100, 1), 8000, 1);
    EXPECT_EQ(DocumentLoader::Load(path, window), B_OK);
    EXPECT_EQ(window.manager.ChannelAt(0)->FrameRate(), 8000.0f);
    EXPECT_EQ(window.manager.FrameRate(), 44100.0f);
}

TEST_F(DocumentLoaderTest, PansAlternateAcrossSixChannels)
{
    const auto path = fixtures.Encode("six.wav", SoundFixtures::Pattern(500, 6), 48000, 6);
    EXPECT_EQ(DocumentLoader::Load(path, window), B_OK);
    EXPECT_EQ(Pans(), (std::vector<int8_t>{-128, 127, -128, 127, -128, 127}));
}

TEST_F(DocumentLoaderTest, AppendAddsAfterTheExistingChannelsAndKeepsTheTitle)
{
    Channel* existing = AddExistingChannel(10);
    window.appendOnLoad = true;
    const auto path = fixtures.Encode("stereo.wav", SoundFixtures::Pattern(3000, 2), 44100, 2);
    EXPECT_EQ(DocumentLoader::Load(path, window), B_OK);
    ASSERT_EQ(window.manager.CountChannels(), 3);
    EXPECT_EQ(window.manager.ChannelAt(0), existing);
    EXPECT_EQ(window.mirror.shown.size(), 3u);
    EXPECT_EQ(window.title, "untitled");
    // The file entry is replaced all the same.
    EXPECT_EQ(window.entry.filename(), "stereo.wav");
    EXPECT_EQ(window.replacements, 0);
}

TEST_F(DocumentLoaderTest, OnlyTheLastAudioTracksChannelsRemain)
{
    const auto path = TwoTrackFile(2, 1);
    EXPECT_EQ(DocumentLoader::Load(path, window), B_OK);
    ASSERT_EQ(window.manager.CountChannels(), 1);
    EXPECT_EQ(window.manager.ChannelAt(0)->FrameCount(), 700);
    EXPECT_EQ(window.mirror.shown.size(), 1u);
    EXPECT_EQ(window.posted, (std::vector<uint32_t>{kMsgShowAll, kMsgShowAll}));
    EXPECT_EQ(window.replacements, 1);
}

TEST_F(DocumentLoaderTest, AppendKeepsEveryTracksChannels)
{
    window.appendOnLoad = true;
    EXPECT_EQ(DocumentLoader::Load(TwoTrackFile(2, 1), window), B_OK);
    ASSERT_EQ(window.manager.CountChannels(), 3);
    EXPECT_EQ(window.manager.ChannelAt(0)->FrameCount(), 1000);
    EXPECT_EQ(window.manager.ChannelAt(2)->FrameCount(), 700);
}

TEST_F(DocumentLoaderTest, VideoBeforeAudioLoadsOnlyTheAudio)
{
    const auto audio = fixtures.Encode("audio.wav", SoundFixtures::Pattern(4410, 2), 44100, 2);
    const auto movie = fixtures.PathOf("movie.mkv");
    ASSERT_TRUE(SoundFixtures::Run("ffmpeg -nostdin -v error -y -f lavfi -i testsrc=size=64x48:rate=10:duration=1 -i "
                                   + SoundFixtures::Quote(audio) + " -map 0:v -map 1:a -c:v ffv1 -c:a pcm_s16le "
                                   + SoundFixtures::Quote(movie)));
    EXPECT_EQ(DocumentLoader::Load(movie, window), B_OK);
    ASSERT_EQ(window.manager.CountChannels(), 2);
    EXPECT_EQ(window.manager.ChannelAt(0)->FrameCount(), 4410);
    EXPECT_EQ(window.posted, std::vector<uint32_t>{kMsgShowAll});
    EXPECT_EQ(window.title, "Glimmet - movie.mkv");
}

TEST_F(DocumentLoaderTest, FileWithoutAudioOnlyChangesTitleAndEntry)
{
    AddExistingChannel(10);
    const auto movie = fixtures.PathOf("silent-movie.mkv");
    ASSERT_TRUE(SoundFixtures::Run("ffmpeg -nostdin -v error -y -f lavfi -i testsrc=size=64x48:rate=10:duration=1 "
                                   "-c:v ffv1 " + SoundFixtures::Quote(movie)));
    EXPECT_EQ(DocumentLoader::Load(movie, window), B_OK);
    EXPECT_EQ(window.manager.CountChannels(), 1);
    EXPECT_EQ(window.title, "Glimmet - silent-movie.mkv");
    EXPECT_TRUE(window.posted.empty());
    // Nothing of the document went, so its history stays.
    EXPECT_EQ(window.replacements, 0);
}

TEST_F(DocumentLoaderTest, UnopenableFileLeavesTheDocumentUntouched)
{
    AddExistingChannel(10);
    EXPECT_EQ(DocumentLoader::Load(fixtures.PathOf("missing.wav"), window), B_ENTRY_NOT_FOUND);
    EXPECT_EQ(DocumentLoader::Load(fixtures.WriteBytes("empty.wav", ""), window), B_MEDIA_NO_HANDLER);
    EXPECT_EQ(DocumentLoader::Load(fixtures.Directory(), window), B_IS_A_DIRECTORY);
    EXPECT_EQ(window.manager.CountChannels(), 1);
    EXPECT_EQ(window.title, "untitled");
    EXPECT_TRUE(window.entry.empty());
    EXPECT_TRUE(window.posted.empty());
    EXPECT_EQ(window.replacements, 0);
}

TEST_F(DocumentLoaderTest, TrackWithoutFramesEmptiesTheDocumentAndStillPosts)
{
    AddExistingChannel(10);
    const auto path = fixtures.WriteBytes("nodata.wav", test::WavBytes{}.Make({}));
    EXPECT_EQ(DocumentLoader::Load(path, window), B_OK);
    EXPECT_EQ(window.manager.CountChannels(), 0);
    EXPECT_TRUE(window.mirror.shown.empty());
    EXPECT_EQ(window.posted, std::vector<uint32_t>{kMsgShowAll});
}

TEST_F(DocumentLoaderTest, RefusedTrackReturnsItsStatusAndPostsNothing)
{
    AddExistingChannel(10);
    test::WavBytes header;
    header.channels = 300;
    const auto path = fixtures.WriteBytes("300.wav", header.Make(SoundFixtures::Pattern(600, 300)));
    EXPECT_EQ(DocumentLoader::Load(path, window), B_MEDIA_BAD_FORMAT);
    // The document was emptied before the track refused.
    EXPECT_EQ(window.manager.CountChannels(), 0);
    EXPECT_TRUE(window.posted.empty());
}

TEST_F(DocumentLoaderTest, WindowWithoutDocumentSkipsAudio)
{
    window.withDocument = false;
    const auto path = fixtures.Encode("mono.wav", SoundFixtures::Pattern(300, 1), 8000, 1);
    EXPECT_EQ(DocumentLoader::Load(path, window), B_OK);
    EXPECT_EQ(window.manager.CountChannels(), 0);
    EXPECT_EQ(window.title, "Glimmet - mono.wav");
    EXPECT_TRUE(window.posted.empty());
}

TEST_F(DocumentLoaderTest, LinksAreFollowedForEntryAndTitle)
{
    const auto path = fixtures.Encode("real.wav", SoundFixtures::Pattern(300, 1), 8000, 1);
    const auto link = fixtures.PathOf("link.wav");
    std::filesystem::create_symlink(path, link);
    EXPECT_EQ(DocumentLoader::Load(link, window), B_OK);
    EXPECT_EQ(window.entry, std::filesystem::canonical(path));
    EXPECT_EQ(window.title, "Glimmet - real.wav");
}

}  // namespace
}  // namespace glimmet

namespace glimmet {
namespace {

TEST_F(DocumentLoaderTest, ChunksAfterTheDataDoNotLengthenTheChannels)
{
    // The loader sizes plain PCM by the file; what it keeps is what decodes.
    const std::vector<int16_t> source = SoundFixtures::Pattern(1000, 2);
    std::string bytes = test::WavBytes{}.Make(source);
    bytes += std::string("LIST\x40\x00\x00\x00", 8) + std::string(64, 'x');
    const auto path = fixtures.WriteBytes("trailing.wav", bytes);
    ASSERT_EQ(DocumentLoader::Load(path, window), B_OK);
    ASSERT_EQ(window.manager.CountChannels(), 2);
    Channel* right = window.manager.ChannelAt(1);
    ASSERT_EQ(right->FrameCount(), 1000);
    const std::vector<int16_t> samples = test::SamplesOf(*right);
    for (int64_t i = 0; i < 1000; ++i)
        ASSERT_EQ(samples[size_t(i)], source[size_t(2 * i + 1)]) << i;
}

}  // namespace
}  // namespace glimmet

namespace glimmet {
namespace {

TEST_F(DocumentLoaderTest, LongChannelsArriveInWholeBlocksCutToWhatDecoded)
{
    // 2.5 million frames: 76 whole blocks and part of one more per channel.
    const std::vector<int16_t> source = SoundFixtures::Pattern(2500000, 2);
    const auto path = fixtures.WriteBytes("long.wav", test::WavBytes{}.Make(source));
    ASSERT_EQ(DocumentLoader::Load(path, window), B_OK);
    ASSERT_EQ(window.manager.CountChannels(), 2);
    for (int32_t k = 0; k < 2; ++k) {
        Channel* channel = window.manager.ChannelAt(k);
        ASSERT_EQ(channel->FrameCount(), 2500000);
        std::vector<int64_t> blockSizes;
        channel->ReadSpans(0, channel->FrameCount(), [&](const SampleSpan& span) {
            EXPECT_EQ(span.offset, 0);
            blockSizes.push_back(span.block->Count());
        });
        ASSERT_EQ(blockSizes.size(), 77u);
        for (size_t b = 0; b + 1 < blockSizes.size(); ++b)
            EXPECT_EQ(blockSizes[b], BlockBuilder::kBlockSamples);
        // The last block holds what decoded and no room beyond it.
        EXPECT_EQ(blockSizes.back(), 2500000 - 76 * BlockBuilder::kBlockSamples);
        const std::vector<int16_t> samples = test::SamplesOf(*channel);
        for (int64_t i = 0; i < 2500000; ++i)
            ASSERT_EQ(samples[size_t(i)], source[size_t(2 * i + k)]) << k << " " << i;
    }
}

}  // namespace
}  // namespace glimmet
