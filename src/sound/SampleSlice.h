#pragma once

#include <cstdint>

#include "sound/BlockList.h"

namespace glimmet {

/// A stretch of a channel's timeline kept for later: silence, then shared
/// blocks, then silence. This is what undo snapshots and cut-out parts hold
/// instead of copies, so keeping a range costs only the blocks that had to be
/// cut at its edges. Silence takes no memory.
struct SampleSlice {
    int64_t leading = 0;
    BlockList blocks;
    int64_t trailing = 0;
    /// Bytes of the blocks made for this slice alone (its cut edges); shared
    /// blocks count nothing.
    int64_t newBytes = 0;

    int64_t Count() const { return leading + blocks.Count() + trailing; }
    /// True when both hold the same samples; blocks they share are not read.
    bool SameSamples(const SampleSlice& other) const;
    /// Writes the Count() samples to destination.
    void CopyTo(int16_t* destination) const;
};

}  // namespace glimmet
