#pragma once

#include <cstdint>
#include <memory>
#include <mutex>

namespace glimmet {

/// What the views keep about one block's samples (its waveform summary).
/// Defined by the views; the engine only carries it along with the block.
class BlockSummary;

/// A run of a channel's samples that never changes once it is shared.
///
/// Channels hold their samples as a sequence of blocks; an edit builds a new
/// sequence that shares every block it leaves alone, and the history keeps
/// the blocks an undo needs instead of copies of the samples. A block is
/// written only between Allocate and the moment it is handed out as a
/// BlockRef.
///
/// Every block has an identity that is never reused while the program runs,
/// so caches can be keyed by it.
class SampleBlock {
public:
    /// A writable block of count uninitialised samples, or null when count is
    /// below 1, above kMaxSamples, or the memory cannot be had.
    static std::shared_ptr<SampleBlock> Allocate(int64_t count);
    /// A block holding a copy of count samples, or null as for Allocate.
    static std::shared_ptr<const SampleBlock> CopyOf(const int16_t* samples, int64_t count);

    /// A block made of samples (from new[]) as they are, without a copy;
    /// null, freeing them, under the same conditions as Allocate.
    static std::shared_ptr<SampleBlock> Adopt(std::unique_ptr<int16_t[]> samples, int64_t count);

    /// The largest block: blocks are meant to be tens of thousands of
    /// samples, this only bounds what a caller may ask for.
    static constexpr int64_t kMaxSamples = int64_t(1) << 24;

    ~SampleBlock();
    SampleBlock(const SampleBlock&) = delete;
    SampleBlock& operator=(const SampleBlock&) = delete;

    const int16_t* Samples() const { return samples_.get(); }
    int16_t* MutableSamples() { return samples_.get(); }
    int64_t Count() const { return count_; }
    uint64_t Id() const { return id_; }

    /// The views' summary of the block, or null while none was made. Any
    /// thread may ask; the summary itself is immutable once set.
    std::shared_ptr<const BlockSummary> Summary() const;
    void SetSummary(std::shared_ptr<const BlockSummary> summary) const;

private:
    SampleBlock(std::unique_ptr<int16_t[]> samples, int64_t count);

    std::unique_ptr<int16_t[]> samples_;
    int64_t count_;
    uint64_t id_;
    mutable std::mutex summaryLock_;
    mutable std::shared_ptr<const BlockSummary> summary_;
};

using BlockRef = std::shared_ptr<const SampleBlock>;

/// Part of a block as a reader sees it: count samples from samples on, which
/// are the block's samples from offset on.
struct SampleSpan {
    const int16_t* samples = nullptr;
    int64_t count = 0;
    const SampleBlock* block = nullptr;
    int64_t offset = 0;
};

}  // namespace glimmet
