#include <gtest/gtest.h>

#include <cstdint>
#include <ostream>
#include <string>
#include <vector>

#include "RecordingTarget.h"
#include "SoundFixtures.h"
#include "WavBytes.h"
#include "files/ChannelTrackLoader.h"
#include "files/DocumentLoader.h"
#include "files/MediaFile.h"
#include "files/MediaTrack.h"
#include "sound/Channel.h"
#include "sound/ChannelSamples.h"

namespace glimmet {
namespace {

using test::RecordingTarget;
using test::SoundFixtures;
using test::WavBytes;

/// How a hand-made WAV file departs from a plain one.
enum class Shape {
    Plain,
    HeaderClaimsMoreThanTheFileHolds,
    DataEndsInsideAFrame,
    DataSizeZero,
    SecondDataChunk,
    BlockOfTwoFrames,
    BlockNotAWholeFrame,
};

struct Case {
    const char* name;
    uint16_t channels;
    int64_t frames;
    Shape shape;
};

void PrintTo(const Case& c, std::ostream* out)
{
    *out << c.name;
}

std::string Bytes(const Case& c, const std::vector<int16_t>& samples)
{
    WavBytes wav;
    wav.channels = c.channels;
    wav.rate = 44100;
    const int64_t dataBytes = int64_t(samples.size()) * 2;
    const int frameBytes = 2 * c.channels;
    switch (c.shape) {
        case Shape::Plain: break;
        case Shape::HeaderClaimsMoreThanTheFileHolds: wav.dataSizeOverride = dataBytes + 1000003; break;
        case Shape::DataEndsInsideAFrame: wav.dataSizeOverride = dataBytes - 1; break;
        case Shape::DataSizeZero: wav.dataSizeOverride = 0; break;
        case Shape::SecondDataChunk: break;
        case Shape::BlockOfTwoFrames: wav.blockAlignOverride = 2 * frameBytes; break;
        case Shape::BlockNotAWholeFrame: wav.blockAlignOverride = frameBytes - 1; break;
    }
    std::string bytes = wav.Make(samples);
    if (c.shape == Shape::SecondDataChunk) {
        // A second data chunk of 1001 frames and a byte.
        const std::vector<int16_t> more = SoundFixtures::Pattern(1001, c.channels, 9);
        const uint32_t size = uint32_t(more.size() * 2 + 1);
        bytes += "data";
        for (int i = 0; i < 4; ++i)
            bytes += char((size >> (8 * i)) & 0xff);
        bytes.append(reinterpret_cast<const char*>(more.data()), more.size() * 2);
        bytes += '\x7f';
        bytes += '\0';  // the pad byte of an odd-sized chunk
    }
    return bytes;
}

/// WAV files of 16-bit PCM are read packet by packet without a decoder, in
/// packets far larger than FFmpeg's default. Whatever their shape, the
/// channels must hold exactly what FFmpeg's own decoder makes of the file.
class WavPacketLoadingTest : public ::testing::TestWithParam<Case> {
protected:
    SoundFixtures fixtures;
    RecordingTarget window;
};

TEST_P(WavPacketLoadingTest, ChannelsHoldWhatFFmpegDecodes)
{
    const Case& c = GetParam();
    const std::vector<int16_t> samples = SoundFixtures::Pattern(c.frames, c.channels, 3);
    const auto path = fixtures.WriteBytes(std::string(c.name) + ".wav", Bytes(c, samples));
    const std::vector<int16_t> reference = fixtures.DecodeWithFFmpeg(path);
    ASSERT_FALSE(reference.empty());
    ASSERT_EQ(reference.size() % c.channels, 0u);
    const int64_t frames = int64_t(reference.size() / c.channels);

    ASSERT_EQ(DocumentLoader::Load(path, window), B_OK);
    ASSERT_EQ(window.manager.CountChannels(), c.channels);
    for (int32_t k = 0; k < c.channels; ++k) {
        Channel* channel = window.manager.ChannelAt(k);
        ASSERT_EQ(channel->FrameCount(), frames) << "channel " << k;
        const std::vector<int16_t> data = test::SamplesOf(*channel);
        for (int64_t i = 0; i < frames; ++i)
            ASSERT_EQ(data[size_t(i)], reference[size_t(i * c.channels + k)]) << "channel " << k << " frame " << i;
    }
}

TEST_P(WavPacketLoadingTest, EachChannelAloneEqualsTheOnePassLoad)
{
    const Case& c = GetParam();
    const std::vector<int16_t> samples = SoundFixtures::Pattern(c.frames, c.channels, 5);
    const auto path = fixtures.WriteBytes(std::string(c.name) + ".wav", Bytes(c, samples));
    ASSERT_EQ(DocumentLoader::Load(path, window), B_OK);
    ASSERT_EQ(window.manager.CountChannels(), c.channels);

    MediaFile file(path);
    MediaTrack* track = file.TrackAt(0);
    ASSERT_NE(track, nullptr);
    for (int32_t k = 0; k < c.channels; ++k) {
        Channel alone;
        ASSERT_TRUE(ChannelTrackLoader::Load(alone, track, uint32_t(k)));
        Channel* loaded = window.manager.ChannelAt(k);
        ASSERT_EQ(alone.FrameCount(), loaded->FrameCount());
        const std::vector<int16_t> expected = test::SamplesOf(alone);
        const std::vector<int16_t> seen = test::SamplesOf(*loaded);
        for (size_t i = 0; i < expected.size(); ++i)
            ASSERT_EQ(expected[i], seen[i]) << "channel " << k << " frame " << i;
    }
}

// Frame counts that cross several large packets and end off any boundary.
INSTANTIATE_TEST_SUITE_P(
    Shapes, WavPacketLoadingTest,
    ::testing::Values(Case{"mono", 1, 300007, Shape::Plain}, Case{"stereo", 2, 200003, Shape::Plain},
                      Case{"three", 3, 100003, Shape::Plain}, Case{"six", 6, 50001, Shape::Plain},
                      Case{"stereoSmall", 2, 5, Shape::Plain},
                      Case{"monoTruncated", 1, 140001, Shape::HeaderClaimsMoreThanTheFileHolds},
                      Case{"stereoTruncated", 2, 140001, Shape::HeaderClaimsMoreThanTheFileHolds},
                      Case{"sixTruncated", 6, 30001, Shape::HeaderClaimsMoreThanTheFileHolds},
                      Case{"stereoPartial", 2, 140001, Shape::DataEndsInsideAFrame},
                      Case{"threePartial", 3, 90001, Shape::DataEndsInsideAFrame},
                      Case{"stereoZeroSize", 2, 70001, Shape::DataSizeZero},
                      Case{"stereoTwoChunks", 2, 70001, Shape::SecondDataChunk},
                      Case{"monoTwoChunks", 1, 70001, Shape::SecondDataChunk},
                      Case{"stereoTwoFrameBlocks", 2, 140001, Shape::BlockOfTwoFrames},
                      Case{"stereoBrokenBlocks", 2, 140001, Shape::BlockNotAWholeFrame},
                      Case{"threeBrokenBlocks", 3, 70001, Shape::BlockNotAWholeFrame}),
    [](const ::testing::TestParamInfo<Case>& info) { return std::string(info.param.name); });

}  // namespace
}  // namespace glimmet
