#pragma once

#include <cstdint>
#include <memory>

#include "sound/BlockList.h"

namespace glimmet {

/// Builds a new BlockList piece by piece: whole blocks of an existing list
/// are shared, everything else (new samples, silence, parts of blocks) is
/// copied into fresh blocks of kBlockSamples.
///
/// Parts copied at a seam are gathered in one pending block, so a cut or an
/// insert makes at most a block or two of new samples around each seam. A
/// pending part shorter than a block goes out as a short block of its own
/// before the next shared block, unless the two fit one block together.
class BlockBuilder {
public:
    /// 32768 samples (64 KiB): small enough that the copies at a seam cost
    /// next to nothing and that blocks stay below the heap's mapping
    /// threshold, so freed blocks are reused without page faults; large
    /// enough that an hour of a channel is under 5,000 references and a mix
    /// buffer rarely straddles two blocks.
    static constexpr int64_t kBlockSamples = 32768;

    BlockBuilder();
    ~BlockBuilder();
    BlockBuilder(const BlockBuilder&) = delete;
    BlockBuilder& operator=(const BlockBuilder&) = delete;

    void AppendSamples(const int16_t* samples, int64_t count);
    void AppendZeros(int64_t count);
    /// count copies of sample; whole blocks of them are all one shared
    /// block, so a long constant run costs references. repeated, when given,
    /// must be a full block of that sample (it is what gets shared).
    void AppendRepeated(int16_t sample, int64_t count, const BlockRef& repeated);
    /// A block made for this list alone (its samples are not copied again);
    /// when a short piece is pending it is copied behind it instead.
    void AppendFresh(std::shared_ptr<SampleBlock> block);
    /// The samples index .. index + count - 1 of list, clipped to it.
    void AppendRange(const BlockList& list, int64_t index, int64_t count);

    /// The one all-zero block of kBlockSamples that every run of silence
    /// shares; null only when it could not be had at all.
    static const BlockRef& Silence();
    /// True for the shared silence block: a reader may treat its samples as
    /// zeros without looking at them.
    static bool IsSilence(const SampleBlock* block) { return block != nullptr && block == Silence().get(); }
    /// A full block of value (the shared silence block for 0), or null when
    /// it cannot be had.
    static BlockRef RepeatedBlock(int16_t value);

    /// False once a block could not be had; the result is then incomplete.
    bool Ok() const { return ok_; }
    /// Bytes of the blocks made here (shared blocks and shared silence are
    /// not counted).
    int64_t NewBytes() const { return newBytes_; }
    /// The list built so far; the builder starts over.
    BlockList Finish();

private:
    void AppendBlock(const BlockRef& block);
    void AddFresh(BlockRef block);
    /// Room for more samples in the pending block; false when none can be had.
    bool EnsurePending();
    void FlushPending();

    BlockList list_;
    std::shared_ptr<SampleBlock> pending_;
    int64_t pendingCount_ = 0;
    int64_t newBytes_ = 0;
    bool ok_ = true;
};

}  // namespace glimmet
