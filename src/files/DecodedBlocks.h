#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "sound/BlockList.h"

namespace glimmet {

class SampleBlock;

/// The channels of a track as it decodes: interleaved frames are spread
/// straight into one block per channel, and each full block joins its
/// channel's list. Memory grows with what was decoded (blocks are taken at
/// most 8 MiB ahead of it), whatever the file claims its length to be, and
/// the samples are written once (no whole-channel array to cut into blocks
/// afterwards).
class DecodedBlocks {
public:
    explicit DecodedBlocks(int32_t channels);
    ~DecodedBlocks();
    DecodedBlocks(const DecodedBlocks&) = delete;
    DecodedBlocks& operator=(const DecodedBlocks&) = delete;

    /// Spreads frames interleaved frames over the channels. False, keeping
    /// what came before, when a block cannot be had.
    bool Append(const int16_t* interleaved, int64_t frames);

    /// Frames appended so far.
    int64_t Frames() const { return frames_; }
    /// Bytes of samples held for them, all channels together.
    int64_t Bytes() const { return frames_ * int64_t(blocks_.size()) * int64_t(sizeof(int16_t)); }

    /// Channel channel's samples; the block being filled is cut to what it
    /// holds. Call once per channel, after the last Append.
    BlockList Take(int32_t channel);

private:
    bool StartBlocks();
    void SpreadInto(const int16_t* interleaved, int64_t frames);
    /// Ends the partly filled blocks: copies cut to the frames they hold, so
    /// no channel keeps room it was never given samples for.
    void CloseBlocks();

    std::vector<std::shared_ptr<SampleBlock>> blocks_;  // being filled, one per channel
    // Per channel, blocks taken from the pool and not yet filled.
    std::vector<std::vector<std::shared_ptr<SampleBlock>>> spares_;
    std::vector<BlockList> lists_;
    int64_t filled_ = 0;  // frames in blocks_
    int64_t frames_ = 0;
    bool closed_ = false;
};

}  // namespace glimmet
