#include "views/BlockSummary.h"

#include <algorithm>
#include <cstring>
#include <utility>
#include <new>

namespace glimmet {

namespace {

constexpr int64_t kLargestBlock = int64_t(1) << 24;
constexpr int32_t kLargestChunkShift = 24;

inline int32_t IndexOf(int16_t sample)
{
    return (int32_t(sample) + 32768) >> 3;
}

// Eight lanes of running extremes in one vector register: one sample at a
// time, the compiler makes a chain of compares that costs more than counting
// the whole block. Eight, not sixteen: without AVX a wider vector does not
// fit one register and goes through the stack at every step.
std::pair<int16_t, int16_t> Extremes(const int16_t* samples, int64_t count)
{
    using Lanes = int16_t __attribute__((vector_size(16)));
    constexpr int64_t kLanes = int64_t(sizeof(Lanes) / sizeof(int16_t));
    int16_t smallest = samples[0];
    int16_t largest = samples[0];
    int64_t i = 0;
    if (count >= kLanes) {
        Lanes low;
        std::memcpy(&low, samples, sizeof(Lanes));
        Lanes high = low;
        for (i = kLanes; i + kLanes <= count; i += kLanes) {
            Lanes next;
            std::memcpy(&next, samples + i, sizeof(Lanes));
            low = next < low ? next : low;
            high = next > high ? next : high;
        }
        for (int64_t k = 0; k < kLanes; ++k) {
            smallest = std::min(smallest, low[k]);
            largest = std::max(largest, high[k]);
        }
    }
    for (; i < count; ++i) {
        smallest = std::min(smallest, samples[i]);
        largest = std::max(largest, samples[i]);
    }
    return {smallest, largest};
}

}  // namespace

uint64_t BlockSummary::KeyOf(const int16_t* rowTable)
{
    // FNV-1a over the table's values.
    uint64_t key = 1469598103934665603ull;
    for (int i = 0; i < kRowTableSize; ++i) {
        key ^= uint16_t(rowTable[i]);
        key *= 1099511628211ull;
    }
    return key;
}

std::shared_ptr<const BlockSummary> BlockSummary::Make(const int16_t* samples, int64_t count, const int16_t* rowTable,
                                                       uint64_t tableKey)
{
    if (samples == nullptr || rowTable == nullptr || count < 1 || count > kLargestBlock)
        return nullptr;
    std::shared_ptr<BlockSummary> summary(new (std::nothrow) BlockSummary());
    if (summary == nullptr)
        return nullptr;
    summary->tableKey_ = tableKey;

    // The rows the block reaches: those of the table entries between its
    // smallest and largest sample (the table need not be monotonic).
    const auto [smallest, largest] = Extremes(samples, count);
    // The same for the table's entries: a loud block reaches thousands.
    const auto [lowest, highest] = Extremes(rowTable + IndexOf(smallest), IndexOf(largest) - IndexOf(smallest) + 1);
    const int32_t low = lowest;
    const int32_t high = highest;
    // A row table of negative rows is not one a view builds; nothing to keep.
    if (low < 0)
        return nullptr;
    summary->lowRow_ = low;
    summary->rowSpan_ = high - low + 1;

    // Coarser chunks until the running counts fit in a quarter of the block.
    const int64_t budget = std::max<int64_t>(count / 4, 1);
    int32_t shift = kSmallestChunkShift;
    while (shift < kLargestChunkShift && ((count >> shift) + 1) * summary->rowSpan_ > budget)
        ++shift;
    summary->chunkShift_ = shift;
    summary->chunks_ = count >> shift;
    if (summary->chunks_ == 0)
        return summary;
    // At most a quarter of the block's samples, which are bounded above.
    summary->running_.assign(size_t(summary->chunks_ + 1) * size_t(summary->rowSpan_), uint16_t(0));
    summary->CountChunks(samples, rowTable);
    return summary;
}

// Boundary 0 stays all zero; boundary j + 1 is boundary j plus chunk j.
// Four interleaved sets of running counts keep consecutive samples of the
// same row from waiting on each other; a boundary holds their sum.
void BlockSummary::CountChunks(const int16_t* samples, const int16_t* rowTable)
{
    const int64_t chunkSize = ChunkSize();
    const size_t low = size_t(lowRow_);
    const size_t span = size_t(rowSpan_);
    // Counters for rows 0 .. lowRow_ + rowSpan_ - 1, of which only the
    // block's own rows are touched: the table's row is the counter, with
    // nothing to build or subtract per sample.
    const size_t rows = low + span;
    std::vector<uint32_t> running(4 * rows, 0);
    uint32_t* first = running.data();
    uint32_t* second = first + rows;
    uint32_t* third = second + rows;
    uint32_t* fourth = third + rows;
    // Four samples per load, each table index cut out of the word.
    const auto rowAt = [rowTable](uint64_t word, int shift) {
        return size_t(uint16_t(rowTable[(word >> shift) & 0x1fff]));
    };
    for (int64_t chunk = 0; chunk < chunks_; ++chunk) {
        const int16_t* sample = samples + chunk * chunkSize;
        // Chunks hold a multiple of four samples.
        for (int64_t i = 0; i < chunkSize; i += 4) {
            uint64_t word;
            std::memcpy(&word, sample + i, sizeof(word));
            word ^= 0x8000800080008000ull;
            ++first[rowAt(word, 3)];
            ++second[rowAt(word, 19)];
            ++third[rowAt(word, 35)];
            ++fourth[rowAt(word, 51)];
        }
        uint16_t* boundary = running_.data() + size_t(chunk + 1) * span;
        for (size_t row = 0; row < span; ++row)
            boundary[row] = uint16_t(first[low + row] + second[low + row] + third[low + row] + fourth[low + row]);
    }
}

void BlockSummary::Prefetch(int64_t firstChunk, int64_t endChunk) const
{
    if (firstChunk >= endChunk || firstChunk < 0 || endChunk > chunks_)
        return;
    const size_t span = size_t(rowSpan_);
    const size_t bytes = span * sizeof(uint16_t);
    for (int64_t boundary : {firstChunk, endChunk}) {
        if (boundary == 0)
            continue;
        const char* row = reinterpret_cast<const char*>(running_.data() + size_t(boundary) * span);
        for (size_t offset = 0; offset < bytes; offset += 64)
            __builtin_prefetch(row + offset);
    }
}

void BlockSummary::AddChunks(uint32_t* counts, uint32_t lastSlot, int64_t firstChunk, int64_t endChunk) const
{
    if (firstChunk >= endChunk || firstChunk < 0 || endChunk > chunks_)
        return;
    const size_t span = size_t(rowSpan_);
    const uint16_t* __restrict to = running_.data() + size_t(endChunk) * span;
    uint32_t* __restrict rows = counts + lowRow_;
    // Rows past lastSlot all land in the last slot, as counting would put
    // them; only that stretch needs the clamp.
    const size_t direct = std::min<size_t>(span, lastSlot >= uint32_t(lowRow_) ? lastSlot - uint32_t(lowRow_) : 0);
    // The first boundary is all zeros: a run from a block's start, which
    // every column reading a whole block takes, needs only its end.
    if (firstChunk == 0) {
        for (size_t i = 0; i < direct; ++i)
            rows[i] += to[i];
        for (size_t i = direct; i < span; ++i)
            counts[lastSlot] += to[i];
        return;
    }
    const uint16_t* __restrict from = running_.data() + size_t(firstChunk) * span;
    for (size_t i = 0; i < direct; ++i)
        rows[i] += uint16_t(to[i] - from[i]);
    for (size_t i = direct; i < span; ++i)
        counts[lastSlot] += uint16_t(to[i] - from[i]);
}

}  // namespace glimmet
