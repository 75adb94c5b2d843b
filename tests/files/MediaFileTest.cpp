#include <gtest/gtest.h>

#include <functional>

#include "SoundFixtures.h"
#include "TrackReading.h"
#include "WavBytes.h"
#include "files/MediaFile.h"
#include "files/MediaTrack.h"

namespace glimmet {
namespace {

using test::ReadWholeTrack;
using test::SoundFixtures;
using test::WavBytes;

constexpr int64_t kFrames = 10007;

struct LosslessCase {
    const char* name;
    const char* arguments;
    media_type encodedType;
    /// What a 16-bit sample becomes after the trip through the format.
    int16_t (*expected)(int16_t);
};

int16_t Same(int16_t sample)
{
    return sample;
}

int16_t EightBit(int16_t sample)
{
    // 8-bit unsigned keeps the high byte of each sample.
    return int16_t(sample & 0xff00);
}

class LosslessFormatTest : public ::testing::TestWithParam<LosslessCase> {
protected:
    SoundFixtures fixtures;
};

TEST_P(LosslessFormatTest, ReadsExactFramesAndSamples)
{
    const LosslessCase& format = GetParam();
    const std::vector<int16_t> source = SoundFixtures::Pattern(kFrames, 2);
    const auto path = fixtures.Encode(format.name, source, 44100, 2, format.arguments);
    ASSERT_FALSE(path.empty()) << "ffmpeg could not make " << format.name;

    MediaFile file(path);
    ASSERT_EQ(file.InitCheck(), B_OK);
    ASSERT_EQ(file.CountTracks(), 1);
    MediaTrack* track = file.TrackAt(0);
    ASSERT_NE(track, nullptr);
    media_format encoded;
    ASSERT_EQ(track->EncodedFormat(&encoded), B_OK);
    EXPECT_EQ(encoded.type, format.encodedType);
    EXPECT_EQ(track->CountFrames(), kFrames);

    media_format decoded;
    const std::vector<int16_t> samples = ReadWholeTrack(track, &decoded);
    EXPECT_EQ(decoded.raw_audio.frame_rate, 44100.0f);
    EXPECT_EQ(decoded.raw_audio.channel_count, 2u);
    EXPECT_EQ(decoded.raw_audio.format, uint32_t(B_AUDIO_SHORT));
    ASSERT_EQ(samples.size(), source.size());
    for (size_t i = 0; i < source.size(); ++i)
        ASSERT_EQ(samples[i], format.expected(source[i])) << "sample " << i;
}

INSTANTIATE_TEST_SUITE_P(
    Formats, LosslessFormatTest,
    ::testing::Values(LosslessCase{"u8.wav", "-c:a pcm_u8", B_MEDIA_RAW_AUDIO, EightBit},
                      LosslessCase{"s16.wav", "-c:a pcm_s16le", B_MEDIA_RAW_AUDIO, Same},
                      LosslessCase{"s24.wav", "-c:a pcm_s24le", B_MEDIA_RAW_AUDIO, Same},
                      LosslessCase{"f32.wav", "-c:a pcm_f32le", B_MEDIA_RAW_AUDIO, Same},
                      LosslessCase{"s16.aiff", "-c:a pcm_s16be", B_MEDIA_RAW_AUDIO, Same},
                      LosslessCase{"s16.flac", "-c:a flac", B_MEDIA_ENCODED_AUDIO, Same},
                      LosslessCase{"s16.mkv", "-c:a flac", B_MEDIA_ENCODED_AUDIO, Same}),
    [](const ::testing::TestParamInfo<LosslessCase>& info) {
        std::string name = info.param.name;
        for (char& c : name)
            c = c == '.' ? '_' : c;
        return name;
    });

class LossyFormatTest : public ::testing::TestWithParam<std::pair<const char*, const char*>> {
protected:
    SoundFixtures fixtures;
};

TEST_P(LossyFormatTest, CountsAndDecodesLikeFFmpegItself)
{
    const auto& [name, arguments] = GetParam();
    const auto path = fixtures.Encode(name, SoundFixtures::Pattern(kFrames, 2), 44100, 2, arguments);
    ASSERT_FALSE(path.empty()) << "ffmpeg could not make " << name;
    const std::vector<int16_t> reference = fixtures.DecodeWithFFmpeg(path);
    ASSERT_FALSE(reference.empty());

    MediaFile file(path);
    ASSERT_EQ(file.InitCheck(), B_OK);
    MediaTrack* track = file.TrackAt(0);
    ASSERT_NE(track, nullptr);
    media_format encoded;
    ASSERT_EQ(track->EncodedFormat(&encoded), B_OK);
    EXPECT_EQ(encoded.type, B_MEDIA_ENCODED_AUDIO);
    EXPECT_EQ(track->CountFrames(), int64_t(reference.size() / 2));
    const std::vector<int16_t> samples = ReadWholeTrack(track);
    EXPECT_EQ(samples, reference);
}

INSTANTIATE_TEST_SUITE_P(Formats, LossyFormatTest,
                         ::testing::Values(std::make_pair("a.ogg", "-c:a libvorbis"),
                                           std::make_pair("a.mp3", "-c:a libmp3lame")),
                         [](const auto& info) { return std::string(info.param.first).substr(2); });

struct ShapeCase {
    int32_t rate;
    int32_t channels;
};

class RateAndChannelsTest : public ::testing::TestWithParam<ShapeCase> {
protected:
    SoundFixtures fixtures;
};

TEST_P(RateAndChannelsTest, ReadsEveryShape)
{
    const ShapeCase shape = GetParam();
    const int64_t frames = shape.rate / 20;  // 50 ms
    const std::vector<int16_t> source = SoundFixtures::Pattern(frames, shape.channels, shape.rate);
    const auto path = fixtures.Encode("shape.wav", source, shape.rate, shape.channels);
    ASSERT_FALSE(path.empty());
    MediaFile file(path);
    ASSERT_EQ(file.InitCheck(), B_OK);
    MediaTrack* track = file.TrackAt(0);
    EXPECT_EQ(track->CountFrames(), frames);
    media_format decoded;
    EXPECT_EQ(ReadWholeTrack(track, &decoded), source);
    EXPECT_EQ(decoded.raw_audio.frame_rate, float(shape.rate));
    EXPECT_EQ(decoded.raw_audio.channel_count, uint32_t(shape.channels));
}

INSTANTIATE_TEST_SUITE_P(Shapes, RateAndChannelsTest,
                         ::testing::Values(ShapeCase{8000, 1}, ShapeCase{11025, 2}, ShapeCase{22050, 3},
                                           ShapeCase{44100, 6}, ShapeCase{48000, 8}, ShapeCase{96000, 16},
                                           ShapeCase{192000, 2}, ShapeCase{8000, 64}),
                         [](const auto& info) {
                             return std::to_string(info.param.rate) + "Hz_" + std::to_string(info.param.channels)
                                 + "ch";
                         });

class MediaFileEdgeTest : public ::testing::Test {
protected:
    /// Opens path and returns the first track's count (-1 when the file does
    /// not open or has no track), reading the whole track as well.
    int64_t CountAndRead(const std::filesystem::path& path, std::vector<int16_t>* samples = nullptr)
    {
        MediaFile file(path);
        if (file.InitCheck() != B_OK || file.CountTracks() < 1)
            return -1;
        MediaTrack* track = file.TrackAt(0);
        const int64_t count = track->CountFrames();
        std::vector<int16_t> read = ReadWholeTrack(track);
        if (samples != nullptr)
            *samples = read;
        return count;
    }

    SoundFixtures fixtures;
};

TEST_F(MediaFileEdgeTest, MissingPathIsEntryNotFound)
{
    EXPECT_EQ(MediaFile(fixtures.PathOf("absent.wav")).InitCheck(), B_ENTRY_NOT_FOUND);
}

TEST_F(MediaFileEdgeTest, DirectoryIsRefused)
{
    EXPECT_EQ(MediaFile(fixtures.Directory()).InitCheck(), B_IS_A_DIRECTORY);
}

TEST_F(MediaFileEdgeTest, EmptyFileHasNoHandler)
{
    EXPECT_EQ(MediaFile(fixtures.WriteBytes("empty.wav", "")).InitCheck(), B_MEDIA_NO_HANDLER);
}

TEST_F(MediaFileEdgeTest, TextFileHasNoHandler)
{
    const auto path = fixtures.WriteBytes("notes.wav", "These are my notes about the recording.\n");
    EXPECT_EQ(MediaFile(path).InitCheck(), B_MEDIA_NO_HANDLER);
}

TEST_F(MediaFileEdgeTest, RandomBytesAreRefused)
{
    const std::vector<int16_t> noise = SoundFixtures::Pattern(4096, 1, 7);
    const auto path = fixtures.WriteRaw("noise.bin", noise);
    EXPECT_NE(MediaFile(path).InitCheck(), B_OK);
}

TEST_F(MediaFileEdgeTest, DevicesAreRefusedWithoutReading)
{
    // /dev/zero would never end; it must not even be opened.
    EXPECT_EQ(MediaFile("/dev/zero").InitCheck(), B_BAD_VALUE);
}

TEST_F(MediaFileEdgeTest, HeaderWithoutDataHasNoFrames)
{
    const auto path = fixtures.WriteBytes("nodata.wav", WavBytes{}.Make({}));
    EXPECT_EQ(CountAndRead(path), 0);
}

TEST_F(MediaFileEdgeTest, TruncatedDataChunkCountsWhatIsThere)
{
    const std::vector<int16_t> source = SoundFixtures::Pattern(3000, 2);
    WavBytes header;
    header.dataSizeOverride = 10000 * 4;
    std::vector<int16_t> samples;
    EXPECT_EQ(CountAndRead(fixtures.WriteBytes("cut.wav", header.Make(source)), &samples), 3000);
    EXPECT_EQ(samples, source);
}

TEST_F(MediaFileEdgeTest, GigabyteSizesInASmallFileCountWhatIsThere)
{
    const std::vector<int16_t> source = SoundFixtures::Pattern(1000, 2);
    WavBytes header;
    header.riffSizeOverride = 0xfffffff0;
    header.dataSizeOverride = 0xffffffe0;
    std::vector<int16_t> samples;
    EXPECT_EQ(CountAndRead(fixtures.WriteBytes("huge.wav", header.Make(source)), &samples), 1000);
    EXPECT_EQ(samples, source);
}

TEST_F(MediaFileEdgeTest, AbsurdChannelCountIsRefusedWithoutDecoding)
{
    WavBytes header;
    header.channels = 65535;
    const auto path = fixtures.WriteBytes("many.wav", header.Make(SoundFixtures::Pattern(70000, 1)));
    MediaFile file(path);
    if (file.InitCheck() != B_OK)
        return;  // refusing the whole file is just as good
    MediaTrack* track = file.TrackAt(0);
    ASSERT_NE(track, nullptr);
    media_format request;
    request.type = B_MEDIA_RAW_AUDIO;
    request.raw_audio.format = B_AUDIO_SHORT;
    EXPECT_EQ(track->DecodedFormat(&request), B_MEDIA_BAD_FORMAT);
    EXPECT_EQ(track->CountFrames(), 0);
}

TEST_F(MediaFileEdgeTest, ChannelCountAboveTheLimitIsRefused)
{
    WavBytes header;
    header.channels = 300;
    const auto path = fixtures.WriteBytes("300.wav", header.Make(SoundFixtures::Pattern(3000, 300)));
    MediaFile file(path);
    ASSERT_EQ(file.InitCheck(), B_OK);
    media_format request;
    request.raw_audio.format = B_AUDIO_SHORT;
    EXPECT_EQ(file.TrackAt(0)->DecodedFormat(&request), B_MEDIA_BAD_FORMAT);
}

TEST_F(MediaFileEdgeTest, FiveMillisecondsAreTwoHundredTwentyFrames)
{
    const std::vector<int16_t> source = SoundFixtures::Pattern(220, 1);
    std::vector<int16_t> samples;
    EXPECT_EQ(CountAndRead(fixtures.Encode("short.wav", source, 44100, 1), &samples), 220);
    EXPECT_EQ(samples, source);
}

TEST_F(MediaFileEdgeTest, VideoOnlyFileHasNoAudioTrack)
{
    const auto path = fixtures.PathOf("video.mkv");
    ASSERT_TRUE(SoundFixtures::Run("ffmpeg -nostdin -v error -y -f lavfi -i testsrc=size=64x48:rate=10:duration=1 "
                                   "-c:v ffv1 " + SoundFixtures::Quote(path)));
    MediaFile file(path);
    ASSERT_EQ(file.InitCheck(), B_OK);
    ASSERT_EQ(file.CountTracks(), 1);
    MediaTrack* track = file.TrackAt(0);
    media_format encoded;
    ASSERT_EQ(track->EncodedFormat(&encoded), B_OK);
    EXPECT_EQ(encoded.type, B_MEDIA_ENCODED_VIDEO);
    media_format request;
    EXPECT_EQ(track->DecodedFormat(&request), B_MEDIA_BAD_FORMAT);
    EXPECT_EQ(track->CountFrames(), 0);
}

TEST_F(MediaFileEdgeTest, PlaylistsMayNotOpenOtherFiles)
{
    fixtures.Encode("inner.wav", SoundFixtures::Pattern(4410, 1), 44100, 1);
    const auto path = fixtures.WriteBytes("list.m3u8", "#EXTM3U\n#EXT-X-TARGETDURATION:1\n#EXTINF:1,\n"
                                                       "inner.wav\n#EXT-X-ENDLIST\n");
    MediaFile file(path);
    if (file.InitCheck() == B_OK) {
        for (int32_t i = 0; i < file.CountTracks(); ++i)
            EXPECT_EQ(file.TrackAt(i)->CountFrames(), 0);
    }
}

TEST_F(MediaFileEdgeTest, NamesThatLookLikeProtocolsAreFiles)
{
    const std::vector<int16_t> source = SoundFixtures::Pattern(500, 1);
    const auto made = fixtures.Encode("plain.wav", source, 44100, 1);
    const auto odd = fixtures.PathOf("concat:plain.wav");
    std::filesystem::rename(made, odd);
    std::vector<int16_t> samples;
    EXPECT_EQ(CountAndRead(odd, &samples), 500);
    EXPECT_EQ(samples, source);
}

class MediaTrackTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        source = SoundFixtures::Pattern(9000, 2);
        path = fixtures.Encode("track.wav", source, 22050, 2);
        ASSERT_FALSE(path.empty());
    }

    SoundFixtures fixtures;
    std::vector<int16_t> source;
    std::filesystem::path path;
};

TEST_F(MediaTrackTest, ReadFramesNeedsADecodedFormat)
{
    MediaFile file(path);
    std::vector<int16_t> buffer(MediaTrack::kFramesPerBuffer * 2);
    int64_t frames = 99;
    EXPECT_EQ(file.TrackAt(0)->ReadFrames(buffer.data(), &frames), B_NO_INIT);
    EXPECT_EQ(frames, 0);
}

TEST_F(MediaTrackTest, RefusesFormatsOtherThanItsOwnSixteenBit)
{
    MediaFile file(path);
    MediaTrack* track = file.TrackAt(0);
    media_format floats;
    floats.type = B_MEDIA_RAW_AUDIO;
    floats.raw_audio.format = B_AUDIO_FLOAT;
    EXPECT_EQ(track->DecodedFormat(&floats), B_MEDIA_BAD_FORMAT);
    media_format otherRate;
    otherRate.raw_audio.frame_rate = 44100;
    EXPECT_EQ(track->DecodedFormat(&otherRate), B_MEDIA_BAD_FORMAT);
    media_format video;
    video.type = B_MEDIA_RAW_VIDEO;
    EXPECT_EQ(track->DecodedFormat(&video), B_MEDIA_BAD_FORMAT);
    media_format any;
    EXPECT_EQ(track->DecodedFormat(&any), B_OK);
    EXPECT_EQ(any.raw_audio.buffer_size, size_t(MediaTrack::kFramesPerBuffer * 2 * 2));
    EXPECT_EQ(any.raw_audio.byte_order, uint32_t(B_MEDIA_LITTLE_ENDIAN));
}

TEST_F(MediaTrackTest, SeekingToZeroReadsTheSameAgain)
{
    MediaFile file(path);
    MediaTrack* track = file.TrackAt(0);
    const std::vector<int16_t> first = ReadWholeTrack(track);
    int64_t frame = 0;
    ASSERT_EQ(track->SeekToFrame(&frame), B_OK);
    EXPECT_EQ(ReadWholeTrack(track), first);
    EXPECT_EQ(first, source);
}

TEST_F(MediaTrackTest, SeekingForwardSkipsFrames)
{
    MediaFile file(path);
    MediaTrack* track = file.TrackAt(0);
    int64_t frame = 5000;
    ASSERT_EQ(track->SeekToFrame(&frame), B_OK);
    EXPECT_EQ(ReadWholeTrack(track), std::vector<int16_t>(source.begin() + 10000, source.end()));
    frame = -1;
    EXPECT_EQ(track->SeekToFrame(&frame), B_BAD_VALUE);
}

TEST_F(MediaTrackTest, TracksBelongToTheirFile)
{
    MediaFile file(path);
    EXPECT_EQ(file.TrackAt(1), nullptr);
    EXPECT_EQ(file.TrackAt(-1), nullptr);
    MediaFile other(path);
    MediaTrack* foreign = other.TrackAt(0);
    EXPECT_EQ(file.ReleaseTrack(foreign), B_BAD_VALUE);
    EXPECT_EQ(other.ReleaseTrack(foreign), B_OK);
    EXPECT_EQ(other.ReleaseTrack(foreign), B_BAD_VALUE);
}

TEST_F(MediaTrackTest, ReadsNeverExceedOneBuffer)
{
    MediaFile file(path);
    MediaTrack* track = file.TrackAt(0);
    media_format format;
    ASSERT_EQ(track->DecodedFormat(&format), B_OK);
    std::vector<int16_t> buffer(format.raw_audio.buffer_size / 2);
    int64_t frames = 0;
    int64_t total = 0;
    while (track->ReadFrames(buffer.data(), &frames) == B_OK) {
        EXPECT_GT(frames, 0);
        EXPECT_LE(frames, MediaTrack::kFramesPerBuffer);
        total += frames;
    }
    EXPECT_EQ(total, 9000);
    EXPECT_EQ(track->ReadFrames(buffer.data(), &frames), B_LAST_BUFFER_ERROR);
}

}  // namespace
}  // namespace glimmet

namespace glimmet {
namespace {

TEST_F(MediaTrackTest, FrameCountBoundCoversPlainPCMOnly)
{
    MediaFile file(path);
    MediaTrack* track = file.TrackAt(0);
    EXPECT_EQ(track->FrameCountBound(), -1);  // no decoded format yet
    media_format format;
    ASSERT_EQ(track->DecodedFormat(&format), B_OK);
    const int64_t bound = track->FrameCountBound();
    EXPECT_GE(bound, track->CountFrames());
    EXPECT_LE(bound, track->CountFrames() + 64);  // the header's bytes over 4 bytes a frame

    MediaFile flac(fixtures.Encode("bound.flac", source, 22050, 2));
    MediaTrack* encoded = flac.TrackAt(0);
    ASSERT_EQ(encoded->DecodedFormat(&format), B_OK);
    EXPECT_EQ(encoded->FrameCountBound(), -1);
}

}  // namespace
}  // namespace glimmet

namespace glimmet {
namespace {

TEST_F(MediaTrackTest, ReadingInPlaceGivesTheSameFrames)
{
    MediaFile file(path);
    MediaTrack* track = file.TrackAt(0);
    const int16_t* block = nullptr;
    int64_t frames = 0;
    EXPECT_EQ(track->ReadFramesInPlace(&block, &frames), B_NO_INIT);
    media_format format;
    ASSERT_EQ(track->DecodedFormat(&format), B_OK);
    std::vector<int16_t> samples;
    while (track->ReadFramesInPlace(&block, &frames) == B_OK) {
        EXPECT_LE(frames, MediaTrack::kFramesPerBuffer);
        samples.insert(samples.end(), block, block + 2 * frames);
    }
    EXPECT_EQ(samples, source);
}

}  // namespace
}  // namespace glimmet
