#pragma once

#include <cstdint>
#include <memory>
#include <vector>

namespace glimmet {

/// How the samples of one SampleBlock fall into the pixel rows of a view,
/// kept so that a column of many thousands of frames can be shaded without
/// reading its samples again.
///
/// The block is cut into chunks of ChunkSize() samples (a power of two); the
/// summary holds, at every chunk boundary, the running number of samples per
/// row from the block's start. The samples of any run of whole chunks per row
/// are then one subtraction per row. Only rows between the block's lowest and
/// highest row are kept, and the chunk size grows until the summary stays
/// within a quarter of the block's own size, so a quiet block gets fine
/// chunks and a loud one coarser chunks.
///
/// Counts are kept modulo 2^16, as the views' row counters are: the view
/// shades by 16-bit counters that wrap, and the summary must give the same
/// counters as counting the samples one by one.
///
/// A summary is made for one row table; TableKey() tells which, and a view
/// with another table (another height) makes a new one. Immutable once made,
/// so any thread may read it.
class BlockSummary {
public:
    /// The summary of count samples for rowTable (8192 entries, indexed by
    /// (sample + 32768) >> 3), tagged with tableKey. Null when count is not
    /// between 1 and 2^24 or the memory cannot be had.
    static std::shared_ptr<const BlockSummary> Make(const int16_t* samples, int64_t count, const int16_t* rowTable,
                                                    uint64_t tableKey);

    /// A key for a row table: equal tables give equal keys.
    static uint64_t KeyOf(const int16_t* rowTable);

    uint64_t TableKey() const { return tableKey_; }
    int64_t ChunkSize() const { return int64_t(1) << chunkShift_; }
    /// The number of whole chunks; samples after the last whole chunk are
    /// not summarised.
    int64_t CountChunks() const { return chunks_; }

    /// Adds the row counts of chunks [firstChunk, endChunk) to counts,
    /// each row r into counts[min(r, lastSlot)] (wrapping), as counting the
    /// samples into a table of lastSlot + 1 counters would. Requires
    /// 0 <= firstChunk <= endChunk <= CountChunks().
    void AddChunks(uint32_t* counts, uint32_t lastSlot, int64_t firstChunk, int64_t endChunk) const;

    /// Asks for the running counts AddChunks(firstChunk, endChunk) reads to
    /// come into the cache.
    void Prefetch(int64_t firstChunk, int64_t endChunk) const;

    /// Bytes held, for the memory budget test.
    size_t Bytes() const { return running_.size() * sizeof(uint16_t); }

private:
    BlockSummary() = default;

    static constexpr int kRowTableSize = 8192;
    static constexpr int kSmallestChunkShift = 8;

    /// Every sample's row lies in lowRow_ .. lowRow_ + rowSpan_ - 1.
    void CountChunks(const int16_t* samples, const int16_t* rowTable);

    uint64_t tableKey_ = 0;
    int32_t lowRow_ = 0;
    int32_t rowSpan_ = 0;  // rows kept: lowRow_ .. lowRow_ + rowSpan_ - 1
    int32_t chunkShift_ = kSmallestChunkShift;
    int64_t chunks_ = 0;
    // (chunks_ + 1) boundaries of rowSpan_ running counts each.
    std::vector<uint16_t> running_;
};

}  // namespace glimmet
