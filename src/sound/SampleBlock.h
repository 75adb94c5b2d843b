#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <vector>

namespace glimmet {

/// What the views keep about one block's samples (its waveform summary).
/// Defined by the views; the engine only carries it along with the block.
class BlockSummary;
class SpillFile;

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
///
/// A block that only the history holds may give up its samples to a
/// SpillFile and take them back when needed: WriteCopy stores them (any
/// thread), DropSamples lets go of the memory once a copy is stored, and
/// MakeResident reads them back. The owner of the history decides when a
/// drop is safe (no channel and no reader can see the block); anything that
/// puts a block where the audio thread can read it makes it resident first.
/// Samples() reads a dropped block back as a last resort.
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

    const int16_t* Samples() const
    {
        const int16_t* samples = samples_.load(std::memory_order_acquire);
        return samples != nullptr ? samples : LoadSamples();
    }
    int16_t* MutableSamples() { return samples_.load(std::memory_order_relaxed); }
    int64_t Count() const { return count_; }
    uint64_t Id() const { return id_; }

    /// The views' summary of the block, or null while none was made. Any
    /// thread may ask; the summary itself is immutable once set.
    std::shared_ptr<const BlockSummary> Summary() const;
    void SetSummary(std::shared_ptr<const BlockSummary> summary) const;

    int64_t Bytes() const { return count_ * int64_t(sizeof(int16_t)); }
    /// True while the samples are in memory.
    bool IsResident() const { return samples_.load(std::memory_order_acquire) != nullptr; }
    /// True once a copy of the samples is stored in a file.
    bool HasFileCopy() const;
    /// Brings the samples back into memory when they were dropped; false
    /// when they could be neither allocated nor read.
    bool MakeResident() const;
    /// MakeResident for many blocks at once: what they need from their
    /// files is read in order of place in the file, runs that lie end to
    /// end in one call, instead of a read per block. An undo brings back
    /// thousands of blocks that were written out one after another. True
    /// when every block is resident afterwards.
    static bool MakeResident(const std::vector<const SampleBlock*>& blocks);
    /// Stores a copy of the samples in file unless one is stored already;
    /// false when the write failed. The samples must be resident: only
    /// DropSamples takes them away, and not before a copy exists.
    bool WriteCopy(const std::shared_ptr<SpillFile>& file) const;
    /// Frees the samples of a block whose copy is stored; true when memory
    /// was freed. The caller guarantees that nobody reads the block.
    bool DropSamples() const;

    /// Bytes of samples of all blocks in memory right now.
    static int64_t ResidentBytes();

private:
    SampleBlock(int16_t* samples, bool pooled, int64_t count);
    const int16_t* LoadSamples() const;
    struct ReadBack;
    /// Reads one batch of blocks back; see MakeResident.
    static bool ReadBatch(std::vector<ReadBack>& batch);
    /// Puts samples read from file at offset in place of the dropped
    /// ones; false, changing nothing, unless the block is still dropped as
    /// it was on its drops-th drop. Caller holds residencyLock_.
    bool InstallLocked(int16_t* samples, bool pooled, uint64_t drops) const;
    /// Reads the block back on its own, under its lock throughout.
    bool SlowMakeResident() const;
    /// Memory for count samples: full-size blocks come from the BlockPool,
    /// other sizes from new[]; null when none can be had.
    static int16_t* NewSamples(int64_t count, bool* pooled);
    static void FreeSamples(int16_t* samples, bool pooled);

    // Owned; null while the samples live only in the file.
    mutable std::atomic<int16_t*> samples_;
    // Whether samples_ came from the BlockPool (otherwise from new[]); changes
    // with samples_, under residencyLock_ after construction.
    mutable bool pooled_;
    int64_t count_;
    uint64_t id_;
    // Guards the file copy and every change of samples_ after construction.
    mutable std::mutex residencyLock_;
    mutable std::shared_ptr<SpillFile> file_;
    mutable int64_t fileOffset_ = -1;
    // How often the samples were dropped: a read that began before the
    // block came back and went again must not install what it read.
    mutable uint64_t drops_ = 0;
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
