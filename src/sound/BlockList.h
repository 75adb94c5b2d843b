#pragma once

#include <algorithm>
#include <cstdint>
#include <vector>

#include "sound/SampleBlock.h"

namespace glimmet {

/// A channel's samples as an ordered run of shared blocks, with where each
/// block starts so that a sample index finds its block by binary search.
///
/// Copying a list copies block references, never samples: that is how an
/// edit keeps what it leaves alone and how a snapshot keeps what an undo
/// needs. Reading through ForEachSpan touches no reference count, so the
/// audio thread may do it under the channel's lock.
class BlockList {
public:
    int64_t Count() const { return count_; }
    bool Empty() const { return blocks_.empty(); }
    size_t BlockCount() const { return blocks_.size(); }
    const BlockRef& BlockAt(size_t position) const { return blocks_[position]; }
    int64_t StartOf(size_t position) const { return starts_[position]; }

    /// Adds block at the end; a null or empty block is ignored.
    void Append(BlockRef block);
    void Clear();

    /// Calls f(const SampleSpan&) for the samples index .. index + count - 1,
    /// clipped to the list, in order, one span per block touched.
    template <typename F>
    void ForEachSpan(int64_t index, int64_t count, F&& f) const
    {
        const int64_t stop = std::min(index + count, count_);
        index = std::max<int64_t>(index, 0);
        if (index >= stop)
            return;
        for (size_t position = Find(index); index < stop; ++position) {
            const SampleBlock* block = blocks_[position].get();
            SampleSpan span;
            span.block = block;
            span.offset = index - starts_[position];
            span.count = std::min(block->Count() - span.offset, stop - index);
            span.samples = block->Samples() + span.offset;
            f(static_cast<const SampleSpan&>(span));
            index += span.count;
        }
    }

    /// Copies the samples index .. index + count - 1 (which must lie in the
    /// list) to destination.
    void CopyOut(int64_t index, int64_t count, int16_t* destination) const;

    /// Brings back every block whose samples were moved out of memory (see
    /// SampleBlock); false when one cannot be read back. Called before the
    /// list's blocks go where the audio thread reads them.
    bool MakeResident() const;

    /// The position of the block holding index (0 <= index < Count()).
    size_t Find(int64_t index) const;

private:

    std::vector<BlockRef> blocks_;
    std::vector<int64_t> starts_;
    int64_t count_ = 0;
};

}  // namespace glimmet
