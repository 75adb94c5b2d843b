#pragma once

#include <algorithm>
#include <cstdint>
#include <memory>
#include <vector>

#include "sound/SampleBlock.h"

namespace glimmet {

/// A channel's samples as an ordered run of shared blocks, with where each
/// block starts so that a sample index finds its block by binary search.
///
/// Copying a list copies references, never samples: that is how an edit
/// keeps what it leaves alone and how a snapshot keeps what an undo needs.
/// The block references themselves sit in runs of up to kRunBlocks that
/// lists share whole, so copying an hour-long list, or building a new one
/// around an edit, touches a hundred reference counts instead of thousands
/// of blocks' own. Reading through ForEachSpan touches no reference count,
/// so the audio thread may do it under the channel's lock.
class BlockList {
public:
    /// Blocks per shared run: large enough that an hour of a channel is under
    /// a hundred runs, small enough that the runs split at an edit's seams
    /// copy next to nothing.
    static constexpr size_t kRunBlocks = 64;

    int64_t Count() const { return count_; }
    bool Empty() const { return count_ == 0; }
    size_t BlockCount() const { return blockCount_; }
    /// The block at position (0 <= position < BlockCount()).
    const BlockRef& BlockAt(size_t position) const;
    /// The index of the first sample of the block at position.
    int64_t StartOf(size_t position) const;

    /// Adds block at the end; a null or empty block is ignored.
    void Append(BlockRef block);
    /// Adds count blocks of other from position first on, sharing every run
    /// of other that they cover whole.
    void AppendBlocks(const BlockList& other, size_t first, size_t count);
    void Clear();

    /// The number of leading blocks that lie wholly before sample index stop.
    size_t BlocksBefore(int64_t stop) const;

    /// Calls f(const SampleSpan&) for the samples index .. index + count - 1,
    /// clipped to the list, in order, one span per block touched.
    template <typename F>
    void ForEachSpan(int64_t index, int64_t count, F&& f) const
    {
        const int64_t stop = std::min(index + count, count_);
        index = std::max<int64_t>(index, 0);
        if (index >= stop)
            return;
        size_t run = RunHolding(index);
        size_t inRun = runs_[run]->Find(index - runStarts_[run]);
        while (index < stop) {
            const Run& current = *runs_[run];
            const SampleBlock* block = current.blocks[inRun].get();
            SampleSpan span;
            span.block = block;
            span.offset = index - runStarts_[run] - current.starts[inRun];
            span.count = std::min(block->Count() - span.offset, stop - index);
            span.samples = block->Samples() + span.offset;
            f(static_cast<const SampleSpan&>(span));
            index += span.count;
            if (++inRun == current.blocks.size()) {
                ++run;
                inRun = 0;
            }
        }
    }

    /// Calls f(const BlockRef&) for every block, in order.
    template <typename F>
    void ForEachBlock(F&& f) const
    {
        for (const std::shared_ptr<Run>& run : runs_) {
            for (const BlockRef& block : run->blocks)
                f(block);
        }
    }

    /// Calls f(const void* run, long holders, const std::vector<BlockRef>&
    /// blocks) for every run of references in order, with how many lists
    /// hold it: that is what tells whose a block is, since a block's own
    /// count sees each run that holds it once, however many lists share the
    /// run. The count may change while another thread copies such a list.
    template <typename F>
    void ForEachRun(F&& f) const
    {
        for (const std::shared_ptr<Run>& run : runs_)
            f(static_cast<const void*>(run.get()), run.use_count(), run->blocks);
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
    /// Up to kRunBlocks consecutive blocks with where each starts within the
    /// run. A run that more than one list holds is never changed again.
    struct Run {
        std::vector<BlockRef> blocks;
        std::vector<int64_t> starts;
        int64_t count = 0;

        size_t Find(int64_t index) const
        {
            return size_t(std::upper_bound(starts.begin(), starts.end(), index) - starts.begin()) - 1;
        }
    };

    size_t RunHolding(int64_t index) const
    {
        return size_t(std::upper_bound(runStarts_.begin(), runStarts_.end(), index) - runStarts_.begin()) - 1;
    }
    size_t RunOfPosition(size_t position) const;
    /// The last run when this list alone holds it and it has room for more.
    Run* OpenTail();
    void AppendRun(const std::shared_ptr<Run>& run);

    std::vector<std::shared_ptr<Run>> runs_;
    // Per run: the index of its first sample and the position of its first
    // block in the list.
    std::vector<int64_t> runStarts_;
    std::vector<size_t> runFirsts_;
    size_t blockCount_ = 0;
    int64_t count_ = 0;
};

}  // namespace glimmet
