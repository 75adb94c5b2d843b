#include <gtest/gtest.h>

#include <cstdlib>

#include "SoundFixtures.h"
#include "WavBytes.h"
#include "files/MediaFile.h"

namespace glimmet {
namespace {

using test::SoundFixtures;

// Small files of every kind the reader meets, for the fuzzer to start from.
// With GLIMMET_SEED_CORPUS set they are copied into that directory.
TEST(SeedCorpusTest, MakesSmallSeedsOfEveryKind)
{
    SoundFixtures fixtures;
    const std::vector<int16_t> stereo = SoundFixtures::Pattern(600, 2);
    std::vector<std::filesystem::path> seeds = {
        fixtures.Encode("s16.wav", stereo, 8000, 2),
        fixtures.Encode("u8.wav", stereo, 8000, 2, "-c:a pcm_u8"),
        fixtures.Encode("f32.wav", stereo, 8000, 2, "-c:a pcm_f32le"),
        fixtures.Encode("s24.aiff", stereo, 8000, 2, "-c:a pcm_s24be"),
        fixtures.Encode("a.flac", stereo, 8000, 2),
        fixtures.Encode("a.ogg", stereo, 8000, 2, "-c:a libvorbis"),
        fixtures.Encode("a.mp3", stereo, 8000, 2, "-c:a libmp3lame -b:a 32k"),
        fixtures.Encode("a.mka", stereo, 8000, 2, "-c:a flac"),
    };
    test::WavBytes lying;
    lying.riffSizeOverride = 0xfffffff0;
    lying.dataSizeOverride = 0xffffffe0;
    seeds.push_back(fixtures.WriteBytes("lying.wav", lying.Make(SoundFixtures::Pattern(100, 2))));
    test::WavBytes wide;
    wide.channels = 64;
    seeds.push_back(fixtures.WriteBytes("wide.wav", wide.Make(SoundFixtures::Pattern(20, 64))));

    const char* corpus = std::getenv("GLIMMET_SEED_CORPUS");
    for (const auto& seed : seeds) {
        ASSERT_FALSE(seed.empty());
        EXPECT_EQ(MediaFile(seed).InitCheck(), B_OK) << seed;
        EXPECT_LT(std::filesystem::file_size(seed), 32768u) << seed;
        if (corpus != nullptr)
            std::filesystem::copy_file(seed, std::filesystem::path(corpus) / seed.filename(),
                                       std::filesystem::copy_options::overwrite_existing);
    }
}

}  // namespace
}  // namespace glimmet
