#include <gtest/gtest.h>

#include "SoundFixtures.h"
#include "files/ChannelTrackLoader.h"
#include "files/DocumentLoader.h"
#include "files/MediaFile.h"
#include "files/MediaFormat.h"
#include "files/MediaTrack.h"
#include "sound/Channel.h"
#include "sound/ChannelSamples.h"

namespace glimmet {
namespace {

using test::SoundFixtures;

std::vector<int16_t> ChannelSamples(Channel& channel)
{
    return test::SamplesOf(channel);
}

std::vector<int16_t> Column(const std::vector<int16_t>& interleaved, int32_t channels, int32_t index)
{
    std::vector<int16_t> column;
    for (size_t i = size_t(index); i < interleaved.size(); i += size_t(channels))
        column.push_back(interleaved[i]);
    return column;
}

class ChannelTrackTest : public ::testing::Test {
protected:
    SoundFixtures fixtures;
};

TEST_F(ChannelTrackTest, LoadsEachChannelWithItsPan)
{
    const std::vector<int16_t> source = SoundFixtures::Pattern(5000, 2);
    MediaFile file(fixtures.Encode("stereo.wav", source, 48000, 2));
    MediaTrack* track = file.TrackAt(0);
    Channel left;
    Channel right;
    ASSERT_TRUE(ChannelTrackLoader::Load(left, track, 0));
    ASSERT_TRUE(ChannelTrackLoader::Load(right, track, 1));
    EXPECT_EQ(left.PanPosition(), Channel::kPanLeft);
    EXPECT_EQ(right.PanPosition(), Channel::kPanRight);
    EXPECT_EQ(left.FrameCount(), 5000);
    EXPECT_EQ(left.FrameRate(), 48000.0f);
    EXPECT_EQ(left.FirstFrame(), 0);
    EXPECT_FALSE(left.IsMuted());
    EXPECT_FALSE(left.IsSelected());
    EXPECT_EQ(ChannelSamples(left), Column(source, 2, 0));
    EXPECT_EQ(ChannelSamples(right), Column(source, 2, 1));
}

TEST_F(ChannelTrackTest, PansAlternateOverManyChannels)
{
    MediaFile file(fixtures.Encode("five.wav", SoundFixtures::Pattern(100, 5), 8000, 5));
    for (uint32_t k = 0; k < 5; ++k) {
        Channel channel;
        ASSERT_TRUE(ChannelTrackLoader::Load(channel, file.TrackAt(0), k));
        EXPECT_EQ(channel.PanPosition(), k % 2 == 0 ? Channel::kPanLeft : Channel::kPanRight) << k;
    }
}

TEST_F(ChannelTrackTest, FailsForMissingTrackAndNonAudio)
{
    Channel channel;
    EXPECT_FALSE(ChannelTrackLoader::Load(channel, static_cast<MediaTrack*>(nullptr), 0));
    const auto video = fixtures.PathOf("video.mkv");
    ASSERT_TRUE(SoundFixtures::Run("ffmpeg -nostdin -v error -y -f lavfi -i testsrc=size=32x32:rate=5:duration=1 "
                                   "-c:v ffv1 " + SoundFixtures::Quote(video)));
    MediaFile file(video);
    EXPECT_FALSE(ChannelTrackLoader::Load(channel, file.TrackAt(0), 0));
    EXPECT_EQ(channel.FrameCount(), 0);
    EXPECT_EQ(test::FirstStoredSample(channel), nullptr);
}

TEST_F(ChannelTrackTest, IndexBeyondTheChannelsFails)
{
    MediaFile file(fixtures.Encode("mono.wav", SoundFixtures::Pattern(100, 1), 8000, 1));
    Channel channel;
    EXPECT_FALSE(ChannelTrackLoader::Load(channel, file.TrackAt(0), 2));
    // The count was stored before the failure, and so was the rate.
    EXPECT_EQ(channel.FrameCount(), 100);
    EXPECT_EQ(channel.FrameRate(), 8000.0f);
}

TEST_F(ChannelTrackTest, IndexEqualToTheChannelCountPassesTheCheck)
{
    // The check is a strict smaller-than: index 1 of a mono track loads, and
    // takes each sample one frame later (the last frame reads as silence).
    const std::vector<int16_t> source = SoundFixtures::Pattern(100, 1);
    MediaFile file(fixtures.Encode("mono.wav", source, 8000, 1));
    Channel channel;
    ASSERT_TRUE(ChannelTrackLoader::Load(channel, file.TrackAt(0), 1));
    EXPECT_EQ(channel.PanPosition(), Channel::kPanRight);
    const std::vector<int16_t> samples = ChannelSamples(channel);
    ASSERT_EQ(samples.size(), 100u);
    EXPECT_EQ(std::vector<int16_t>(samples.begin(), samples.begin() + 99),
              std::vector<int16_t>(source.begin() + 1, source.end()));
    EXPECT_EQ(samples[99], 0);
}

TEST_F(ChannelTrackTest, EmptyTrackFails)
{
    MediaFile file(fixtures.Encode("silent.wav", {}, 8000, 1));
    if (file.InitCheck() != B_OK)
        GTEST_SKIP() << "ffmpeg made no file for zero frames";
    Channel channel;
    EXPECT_FALSE(ChannelTrackLoader::Load(channel, file.TrackAt(0), 0));
    EXPECT_EQ(channel.FrameCount(), 0);
}

TEST_F(ChannelTrackTest, ShorterDecodeThanCountedLeavesZeros)
{
    // The file shrinks between counting and decoding.
    const auto path = fixtures.Encode("changing.wav", SoundFixtures::Pattern(4000, 1), 8000, 1);
    MediaFile file(path);
    MediaTrack* track = file.TrackAt(0);
    ASSERT_EQ(track->CountFrames(), 4000);
    const std::vector<int16_t> shorter = SoundFixtures::Pattern(1500, 1, 3);
    ASSERT_FALSE(fixtures.Encode("changing.wav", shorter, 8000, 1).empty());
    Channel channel;
    ASSERT_TRUE(ChannelTrackLoader::Load(channel, track, 0));
    std::vector<int16_t> expected = shorter;
    expected.resize(4000, 0);
    EXPECT_EQ(ChannelSamples(channel), expected);
}

TEST_F(ChannelTrackTest, LongerDecodeThanCountedIsCut)
{
    const auto path = fixtures.Encode("growing.wav", SoundFixtures::Pattern(1000, 2), 8000, 2);
    MediaFile file(path);
    MediaTrack* track = file.TrackAt(0);
    ASSERT_EQ(track->CountFrames(), 1000);
    const std::vector<int16_t> longer = SoundFixtures::Pattern(9000, 2, 5);
    ASSERT_FALSE(fixtures.Encode("growing.wav", longer, 8000, 2).empty());
    Channel channel;
    ASSERT_TRUE(ChannelTrackLoader::Load(channel, track, 1));
    const std::vector<int16_t> column = Column(longer, 2, 1);
    EXPECT_EQ(ChannelSamples(channel), std::vector<int16_t>(column.begin(), column.begin() + 1000));

    // Loading all channels at once sizes plain PCM by the file as it is now.
    media_format decoded;
    ASSERT_EQ(track->DecodedFormat(&decoded), B_OK);
    auto channels = DocumentLoader::LoadChannels(track, decoded);
    ASSERT_EQ(channels.size(), 2u);
    EXPECT_EQ(ChannelSamples(*channels[1]), column);
}

TEST_F(ChannelTrackTest, OnePassLoadingEqualsLoadingEachChannel)
{
    const std::pair<const char*, int32_t> formats[] = {{"one.flac", 3}, {"one.ogg", 3}, {"one.mp3", 2}, {"one.wav", 3}};
    for (const auto& [name, channels] : formats) {
        MediaFile file(fixtures.Encode(name, SoundFixtures::Pattern(7000, channels), 44100, channels));
        MediaTrack* track = file.TrackAt(0);
        ASSERT_NE(track, nullptr) << name;
        media_format decoded;
        ASSERT_EQ(track->DecodedFormat(&decoded), B_OK);
        auto together = DocumentLoader::LoadChannels(track, decoded);
        ASSERT_EQ(together.size(), size_t(channels));
        for (uint32_t k = 0; k < uint32_t(channels); ++k) {
            Channel single;
            ASSERT_TRUE(ChannelTrackLoader::Load(single, track, k));
            ASSERT_NE(together[k], nullptr);
            EXPECT_EQ(ChannelSamples(*together[k]), ChannelSamples(single)) << name << " channel " << k;
            EXPECT_EQ(together[k]->PanPosition(), single.PanPosition());
            EXPECT_EQ(together[k]->FrameRate(), single.FrameRate());
            EXPECT_EQ(together[k]->FirstFrame(), single.FirstFrame());
        }
    }
}

TEST_F(ChannelTrackTest, ReloadingReplacesTheOldData)
{
    MediaFile first(fixtures.Encode("a.wav", SoundFixtures::Pattern(300, 1), 8000, 1));
    MediaFile second(fixtures.Encode("b.wav", SoundFixtures::Pattern(200, 1, 9), 8000, 1));
    Channel channel;
    ASSERT_TRUE(ChannelTrackLoader::Load(channel, first.TrackAt(0), 0));
    ASSERT_TRUE(ChannelTrackLoader::Load(channel, second.TrackAt(0), 0));
    EXPECT_EQ(ChannelSamples(channel), SoundFixtures::Pattern(200, 1, 9));
}

TEST_F(ChannelTrackTest, FailedReloadOfAnotherLengthLetsTheOldSamplesGo)
{
    // The count of the failed load is kept; samples of another length would
    // be read past their end.
    MediaFile longer(fixtures.Encode("long.wav", SoundFixtures::Pattern(300, 1), 8000, 1));
    MediaFile shorter(fixtures.Encode("short.wav", SoundFixtures::Pattern(100, 1), 8000, 1));
    Channel channel;
    ASSERT_TRUE(ChannelTrackLoader::Load(channel, longer.TrackAt(0), 0));
    EXPECT_FALSE(ChannelTrackLoader::Load(channel, shorter.TrackAt(0), 2));
    EXPECT_EQ(channel.FrameCount(), 100);
    EXPECT_EQ(test::FirstStoredSample(channel), nullptr);
    std::vector<int16_t> buffer(50, 7);
    ASSERT_TRUE(channel.FillBuffer(buffer.data(), 0, 50));
    EXPECT_EQ(buffer, std::vector<int16_t>(50, 0));
}

TEST_F(ChannelTrackTest, FailedReloadOfTheSameLengthKeepsTheOldSamples)
{
    MediaFile first(fixtures.Encode("first.wav", SoundFixtures::Pattern(200, 1), 8000, 1));
    MediaFile second(fixtures.Encode("second.wav", SoundFixtures::Pattern(200, 1, 9), 8000, 1));
    Channel channel;
    ASSERT_TRUE(ChannelTrackLoader::Load(channel, first.TrackAt(0), 0));
    EXPECT_FALSE(ChannelTrackLoader::Load(channel, second.TrackAt(0), 2));
    EXPECT_EQ(channel.FrameCount(), 200);
    EXPECT_EQ(ChannelSamples(channel), SoundFixtures::Pattern(200, 1));
}

}  // namespace
}  // namespace glimmet

namespace glimmet {
namespace {

TEST_F(ChannelTrackTest, OnePassShortOfTheCountedLengthLeavesZeros)
{
    // FLAC is counted by decoding; the file then shrinks before the load.
    const auto path = fixtures.Encode("shrinking.flac", SoundFixtures::Pattern(4000, 2), 8000, 2);
    MediaFile file(path);
    MediaTrack* track = file.TrackAt(0);
    ASSERT_EQ(track->CountFrames(), 4000);
    const std::vector<int16_t> shorter = SoundFixtures::Pattern(1500, 2, 3);
    ASSERT_FALSE(fixtures.Encode("shrinking.flac", shorter, 8000, 2).empty());
    media_format decoded;
    ASSERT_EQ(track->DecodedFormat(&decoded), B_OK);
    auto channels = DocumentLoader::LoadChannels(track, decoded);
    ASSERT_EQ(channels.size(), 2u);
    std::vector<int16_t> expected = Column(shorter, 2, 0);
    expected.resize(4000, 0);
    EXPECT_EQ(ChannelSamples(*channels[0]), expected);
}

}  // namespace
}  // namespace glimmet
