#include "files/ChannelTrackLoader.h"

#include <algorithm>
#include <cstring>
#include <vector>

#include "files/MediaFormat.h"
#include "files/MediaTrack.h"
#include "sound/Channel.h"

namespace glimmet {

bool ChannelTrackLoader::Load(Channel& channel, MediaTrack* track, uint32_t index)
{
    if (track == nullptr || track->InitCheck() != B_OK)
        return false;
    const int64_t count = track->CountFrames();
    // The count is kept even when the load fails further on.
    channel.SetFrameCount(count);
    if (count <= 0)
        return false;
    TrackShape shape;
    const bool accepted = AcceptTrackFormat(track, index, &shape);
    if (shape.rateKnown)
        channel.SetFrameRate(shape.frameRate);
    if (!accepted)
        return false;
    channel.SetPanPosition(index % 2 == 1 ? Channel::kPanRight : Channel::kPanLeft);
    SampleAllocator::Array samples = Channel::Allocate(count);
    if (samples == nullptr)
        return false;
    ReadTrackChannel(track, index, shape, samples.get(), count);
    return channel.SetTo(std::move(samples), count);
}

bool ChannelTrackLoader::AcceptTrackFormat(MediaTrack* track, uint32_t index, TrackShape* shape)
{
    media_format encoded;
    if (track->EncodedFormat(&encoded) != B_OK
        || (encoded.type != B_MEDIA_RAW_AUDIO && encoded.type != B_MEDIA_ENCODED_AUDIO))
        return false;
    media_format decoded;
    decoded.type = B_MEDIA_RAW_AUDIO;
    decoded.raw_audio = media_raw_audio_format::wildcard;
    decoded.raw_audio.format = B_AUDIO_SHORT;
    if (track->DecodedFormat(&decoded) != B_OK)
        return false;
    shape->frameRate = decoded.raw_audio.frame_rate;
    shape->rateKnown = true;
    // Strictly smaller, so an index equal to the channel count passes; it
    // then picks up the samples one position further along.
    if (decoded.raw_audio.channel_count < index || decoded.raw_audio.channel_count == 0)
        return false;
    shape->channels = int32_t(decoded.raw_audio.channel_count);
    shape->bufferSize = decoded.raw_audio.buffer_size;
    return true;
}

void ChannelTrackLoader::ReadTrackChannel(MediaTrack* track, uint32_t index, const TrackShape& shape,
    int16_t* samples, int64_t count)
{
    std::vector<int16_t> buffer(2 * shape.bufferSize / sizeof(int16_t) + 1);
    int64_t seekTo = 0;
    track->SeekToFrame(&seekTo, 0);
    int64_t stored = 0;
    int64_t framesRead = 0;
    while (track->ReadFrames(buffer.data(), &framesRead) == B_OK) {
        const int64_t available = std::min<int64_t>(framesRead * shape.channels, int64_t(buffer.size()));
        // Frames beyond the counted length have no place in the array.
        for (int64_t position = index; position < available && stored < count; position += shape.channels)
            samples[size_t(stored++)] = buffer[size_t(position)];
    }
    // A decode that came up short leaves silence, not stale memory.
    if (count > stored)
        std::memset(samples + stored, 0, size_t(count - stored) * sizeof(int16_t));
}

}  // namespace glimmet
