#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

namespace glimmet {

class Channel;
class SampleBlock;
class MediaTrack;

/// Fills one Channel from one channel of an audio track. Channels know
/// nothing of files; reading a track is this layer's business.
class ChannelTrackLoader {
public:
    /// Loads channel index of track into channel: the track's frame count,
    /// its decoded rate, its samples (signed 16-bit), and the pan of a
    /// stereo pair (odd index right, even index left). False when the track
    /// is missing or not audio, cannot be decoded to 16-bit, has no frames,
    /// or the memory cannot be had; the frame count (and from the decoded
    /// format on, the rate) stay stored even then. A decode that yields fewer
    /// frames than counted leaves the rest silent; frames beyond the count
    /// are dropped. Decodes the whole track from its start.
    static bool Load(Channel& channel, MediaTrack* track, uint32_t index);

private:
    /// The decoded shape of the track, once it is known to fit.
    struct TrackShape {
        /// Set once the track agreed to a decoded format, fitting or not.
        bool rateKnown = false;
        float frameRate = 0;
        int32_t channels = 0;
        size_t bufferSize = 0;
    };

    /// False ends the load; *shape is filled as far as the track got.
    static bool AcceptTrackFormat(MediaTrack* track, uint32_t index, TrackShape* shape);
    /// Blocks that hold count samples together, all had before any decoding
    /// starts; empty when the memory cannot be had.
    static std::vector<std::shared_ptr<SampleBlock>> AllocateBlocks(int64_t count);
    /// Decodes the track from its start into blocks, one after the other:
    /// channel index of each frame, silence where the decode ends early.
    static void ReadTrackChannel(MediaTrack* track, uint32_t index, const TrackShape& shape,
        const std::vector<std::shared_ptr<SampleBlock>>& blocks);
};

}  // namespace glimmet
