#pragma once

#include <cstdint>
#include <vector>

#include "files/MediaFormat.h"
#include "files/MediaTrack.h"

namespace glimmet::test {

/// Every frame a track decodes to, interleaved; empty when it refuses 16-bit.
inline std::vector<int16_t> ReadWholeTrack(MediaTrack* track, media_format* decoded = nullptr)
{
    media_format format;
    format.type = B_MEDIA_RAW_AUDIO;
    format.raw_audio.format = B_AUDIO_SHORT;
    if (track->DecodedFormat(&format) != B_OK)
        return {};
    if (decoded != nullptr)
        *decoded = format;
    std::vector<int16_t> samples;
    std::vector<int16_t> buffer(format.raw_audio.buffer_size / 2);
    int64_t frames = 0;
    while (track->ReadFrames(buffer.data(), &frames) == B_OK)
        samples.insert(samples.end(), buffer.begin(), buffer.begin() + frames * format.raw_audio.channel_count);
    return samples;
}

}  // namespace glimmet::test
