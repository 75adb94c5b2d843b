// Feeds arbitrary bytes, as a file, through MediaFile, MediaTrack, Channel
// loading and the document loader.

#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>

extern "C" {
#include <libavutil/log.h>
}

#include "files/ChannelTrackLoader.h"
#include "files/DocumentLoader.h"
#include "files/MediaFile.h"
#include "files/MediaFormat.h"
#include "files/MediaTrack.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace {

using namespace glimmet;

// Decoded samples (all channels) a single input may load: real files of any
// size are the tests' business; the fuzzer wants many inputs per second.
constexpr int64_t kMaxLoadedSamples = int64_t(1) << 22;
constexpr int32_t kMaxTracksVisited = 16;

const std::filesystem::path& InputPath()
{
    static const std::filesystem::path path = [] {
        std::string pattern = (std::filesystem::temp_directory_path() / "glimmet-fuzz-XXXXXX").string();
        const int fd = mkstemp(pattern.data());
        if (fd < 0)
            std::abort();
        close(fd);
        std::atexit([] { std::filesystem::remove(InputPath()); });
        return std::filesystem::path(pattern);
    }();
    return path;
}

bool WriteInput(const uint8_t* data, size_t size)
{
    FILE* file = std::fopen(InputPath().c_str(), "wb");
    if (file == nullptr)
        return false;
    const bool written = std::fwrite(data, 1, size, file) == size;
    return std::fclose(file) == 0 && written;
}

/// True when the track's decoded size is within the budget.
bool ExerciseTrack(MediaTrack* track)
{
    media_format encoded;
    track->EncodedFormat(&encoded);
    media_format decoded;
    decoded.type = B_MEDIA_RAW_AUDIO;
    decoded.raw_audio.format = B_AUDIO_SHORT;
    if (track->DecodedFormat(&decoded) != B_OK)
        return true;
    const int64_t frames = track->CountFrames();
    if (frames * int64_t(decoded.raw_audio.channel_count) > kMaxLoadedSamples)
        return false;
    Channel channel;
    ChannelTrackLoader::Load(channel, track, 0);
    DocumentLoader::LoadChannels(track, decoded);
    return true;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    // FFmpeg's complaints about broken input are expected by the thousand.
    av_log_set_level(AV_LOG_QUIET);
    if (!WriteInput(data, size))
        return 0;
    bool withinBudget = true;
    {
        MediaFile file(InputPath());
        if (file.InitCheck() != B_OK)
            return 0;
        for (int32_t index = 0; index < file.CountTracks() && index < kMaxTracksVisited; ++index) {
            MediaTrack* track = file.TrackAt(index);
            withinBudget = withinBudget && ExerciseTrack(track);
            file.ReleaseTrack(track);
        }
    }
    if (withinBudget) {
        ChannelManager document(nullptr);
        DocumentLoader::Load(InputPath(), &document, false);
    }
    return 0;
}
