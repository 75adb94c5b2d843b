#include "files/ChannelTrackLoader.h"

#include <algorithm>
#include <cstring>
#include <vector>

#include "files/MediaFormat.h"
#include "files/MediaTrack.h"
#include "files/MemoryBudget.h"
#include "sound/BlockBuilder.h"
#include "sound/BlockList.h"
#include "sound/Channel.h"
#include "sound/SampleBlock.h"

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
    // Channels hold at most 2^32 - 1 samples, and never more than the
    // memory that can be had: the count is checked before anything is
    // allocated for it.
    if (count > int64_t(UINT32_MAX) || count > MemoryBudget::ForSamples() / int64_t(sizeof(int16_t)))
        return false;
    const std::vector<std::shared_ptr<SampleBlock>> blocks = AllocateBlocks(count);
    if (blocks.empty())
        return false;
    ReadTrackChannel(track, index, shape, blocks);
    BlockList list;
    for (const std::shared_ptr<SampleBlock>& block : blocks)
        list.Append(block);
    return channel.SetTo(std::move(list));
}

std::vector<std::shared_ptr<SampleBlock>> ChannelTrackLoader::AllocateBlocks(int64_t count)
{
    std::vector<std::shared_ptr<SampleBlock>> blocks;
    for (int64_t made = 0; made < count; made += BlockBuilder::kBlockSamples) {
        std::shared_ptr<SampleBlock> block = SampleBlock::Allocate(std::min(count - made, BlockBuilder::kBlockSamples));
        if (block == nullptr)
            return {};
        blocks.push_back(std::move(block));
    }
    return blocks;
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
    const std::vector<std::shared_ptr<SampleBlock>>& blocks)
{
    std::vector<int16_t> buffer(2 * shape.bufferSize / sizeof(int16_t) + 1);
    int64_t seekTo = 0;
    track->SeekToFrame(&seekTo, 0);
    size_t block = 0;
    int64_t stored = 0;  // in blocks[block]
    int64_t framesRead = 0;
    while (track->ReadFrames(buffer.data(), &framesRead) == B_OK) {
        const int64_t available = std::min<int64_t>(framesRead * shape.channels, int64_t(buffer.size()));
        // Frames beyond the counted length have no place in the blocks.
        for (int64_t position = index; position < available && block < blocks.size(); position += shape.channels) {
            blocks[block]->MutableSamples()[stored++] = buffer[size_t(position)];
            if (stored == blocks[block]->Count()) {
                ++block;
                stored = 0;
            }
        }
    }
    // A decode that came up short leaves silence, not stale memory.
    for (; block < blocks.size(); ++block, stored = 0) {
        int16_t* samples = blocks[block]->MutableSamples();
        std::memset(samples + stored, 0, size_t(blocks[block]->Count() - stored) * sizeof(int16_t));
    }
}

}  // namespace glimmet
