#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <vector>

#include "sound/SampleBlock.h"

namespace glimmet {

/// Counts how many samples of one pixel column fall into each row, from the
/// samples themselves or, for whole chunks of a block that has a summary for
/// this row table, from the summary.
///
/// Where a column starts or ends inside a chunk it takes whichever is fewer
/// samples to read: the part of the chunk inside the column (added), or the
/// part outside it (subtracted from the whole chunk's counts). Counts wrap
/// at 16 bits like the view's counters; everything here is computed modulo
/// 2^32 and only the low 16 bits are handed out, which is the same.
///
/// A block without a fitting summary gets one when a column reads at least
/// half of it: then making the summary costs no more than twice reading that
/// part, and every later render of the block is cheap. Columns reading less
/// leave the block alone, so zoomed-in views never pay for summaries.
class RowCounter {
public:
    /// rowTable has 8192 entries; slots is the number of counters handed
    /// out, rows at or past the last slot are counted in the last slot.
    RowCounter(const int16_t* rowTable, uint32_t slots);

    /// Forgets the counts of the previous column.
    void Clear();
    /// Counts the span's samples from..to - 1 (offsets inside the span).
    void Add(const SampleSpan& span, int64_t from, int64_t to);
    /// Asks the memory that counting the span's samples from..to - 1 would
    /// read to come into the cache, without waiting for it.
    void Prefetch(const SampleSpan& span, int64_t from, int64_t to);
    /// The counts so far, modulo 2^16, into slots counters.
    void Finish(uint16_t* counters) const;

    /// From now on a missing summary is not made during the count: the
    /// block is listed in wanted (once per run of columns reading it) and its
    /// samples are read, so whoever renders can have it made later.
    void DeferSummaries(std::vector<const SampleBlock*>* wanted) { wanted_ = wanted; }

    /// Summaries made by this counter, for tests and measurements.
    int64_t SummariesMade() const { return summariesMade_; }

private:
    static constexpr uint32_t kIncrement = 1;
    static constexpr uint32_t kDecrement = ~uint32_t(0);

    struct KnownSummary {
        const SampleBlock* block = nullptr;
        std::shared_ptr<const BlockSummary> summary;
    };

    static constexpr int kRowTableSize = 8192;

    static bool InBlock(const SampleSpan& span);
    std::shared_ptr<const BlockSummary> FittingSummary(const SampleBlock& block);
    void Remember(const SampleBlock& block, std::shared_ptr<const BlockSummary> summary);
    void Count(const int16_t* samples, int64_t count, uint32_t step);
    void AddFromBlock(const SampleBlock& block, int64_t from, int64_t to);
    std::shared_ptr<const BlockSummary> SummaryFor(const SampleBlock& block, int64_t reading);
    uint64_t TableKey();

    const int16_t* rowTable_;
    uint32_t slots_;
    uint32_t lastSlot_;
    // The counter each table entry lands in, clamped once here rather than
    // for every sample: this halves the time of counting.
    std::vector<uint16_t> slotTable_;
    uint64_t tableKey_ = 0;
    bool tableKeyKnown_ = false;
    int64_t summariesMade_ = 0;
    std::vector<const SampleBlock*>* wanted_ = nullptr;
    // Blocks asked lately and their summary for this row table (or null).
    std::array<KnownSummary, 8> known_;
    size_t nextKnown_ = 0;
    // Four interleaved sets of counters keep consecutive samples of the
    // same row from waiting on each other.
    std::vector<uint32_t> partials_;
};

}  // namespace glimmet
