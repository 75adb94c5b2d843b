#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace glimmet::test {

/// Hand-made RIFF WAV bytes for headers no encoder would write: sizes that
/// lie, absurd channel counts, missing data.
struct WavBytes {
    uint16_t channels = 2;
    uint32_t rate = 44100;
    uint16_t bitsPerSample = 16;
    /// When set, written instead of the true sizes.
    int64_t riffSizeOverride = -1;
    int64_t dataSizeOverride = -1;
    int32_t blockAlignOverride = -1;

    std::string Make(const std::vector<int16_t>& samples) const
    {
        const uint32_t dataSize = uint32_t(samples.size() * 2);
        const uint16_t blockAlign =
            uint16_t(blockAlignOverride >= 0 ? blockAlignOverride : channels * bitsPerSample / 8);
        std::string bytes;
        auto put32 = [&bytes](uint32_t value) {
            for (int i = 0; i < 4; ++i)
                bytes += char((value >> (8 * i)) & 0xff);
        };
        auto put16 = [&bytes](uint16_t value) {
            bytes += char(value & 0xff);
            bytes += char(value >> 8);
        };
        bytes += "RIFF";
        put32(riffSizeOverride >= 0 ? uint32_t(riffSizeOverride) : 36 + dataSize);
        bytes += "WAVEfmt ";
        put32(16);
        put16(1);
        put16(channels);
        put32(rate);
        put32(rate * blockAlign);
        put16(blockAlign);
        put16(bitsPerSample);
        bytes += "data";
        put32(dataSizeOverride >= 0 ? uint32_t(dataSizeOverride) : dataSize);
        bytes.append(reinterpret_cast<const char*>(samples.data()), samples.size() * 2);
        return bytes;
    }
};

}  // namespace glimmet::test
