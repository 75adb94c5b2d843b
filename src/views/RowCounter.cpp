#include "views/RowCounter.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>

#include "views/BlockSummary.h"

namespace glimmet {

namespace {

struct ChunkRun {
    int64_t first;
    int64_t end;
};

// The whole chunks nearest to from..to: either start at the chunk before from
// and take off what lies before from, or start at the chunk after and read
// up to it, whichever reads fewer samples; the same at the end. Both choices
// stay inside the block's whole chunks.
ChunkRun NearestChunks(const BlockSummary& summary, int64_t from, int64_t to)
{
    const int64_t size = summary.ChunkSize();
    const int64_t chunks = summary.CountChunks();
    const int64_t below = from / size;
    const int64_t above = (from + size - 1) / size;
    int64_t firstChunk = above;
    if (below < chunks && from - below * size < above * size - from)
        firstChunk = below;
    const int64_t endBelow = std::min(to / size, chunks);
    const int64_t endAbove = (to + size - 1) / size;
    int64_t endChunk = endBelow;
    if (endAbove <= chunks && endAbove * size - to < to - endBelow * size)
        endChunk = endAbove;
    return {firstChunk, endChunk};
}

void PrefetchSamples(const int16_t* samples, int64_t count)
{
    constexpr int64_t kLine = 64 / sizeof(int16_t);
    for (int64_t i = 0; i < count; i += kLine)
        __builtin_prefetch(samples + i);
}

}  // namespace

RowCounter::RowCounter(const int16_t* rowTable, uint32_t slots)
    : rowTable_(rowTable), slots_(std::clamp<uint32_t>(slots, 1, 65536)), lastSlot_(slots_ - 1),
      slotTable_(kRowTableSize), partials_(4 * size_t(slots_), 0)
{
    // A negative table entry converts to a huge slot and is clamped like
    // any other row past the last.
    for (int i = 0; i < kRowTableSize; ++i)
        slotTable_[size_t(i)] = uint16_t(std::min(size_t(rowTable_[i]), size_t(lastSlot_)));
}

void RowCounter::Clear()
{
    std::fill(partials_.begin(), partials_.end(), 0u);
}

void RowCounter::Finish(uint16_t* counters) const
{
    const uint32_t* partial = partials_.data();
    for (uint32_t row = 0; row < slots_; ++row)
        counters[row] = uint16_t(partial[row] + partial[slots_ + row] + partial[2 * slots_ + row] + partial[3 * slots_ + row]);
}

void RowCounter::Count(const int16_t* samples, int64_t count, uint32_t step)
{
    uint32_t* partial = partials_.data();
    const size_t slots = slots_;
    const uint16_t* slotTable = slotTable_.data();
    const auto slotOf = [slotTable](int16_t value) { return size_t(slotTable[uint16_t(value ^ 0x8000) >> 3]); };
    // Four samples per load, each table index cut out of the word: fewer
    // loads than one per sample, and the counts do not care which set of
    // counters a sample lands in.
    const auto indexAt = [](uint64_t word, int shift) { return size_t((word >> shift) & 0x1fff); };
    int64_t i = 0;
    for (; i + 4 <= count; i += 4) {
        uint64_t word;
        std::memcpy(&word, samples + i, sizeof(word));
        word ^= 0x8000800080008000ull;
        partial[slotTable[indexAt(word, 3)]] += step;
        partial[slots + slotTable[indexAt(word, 19)]] += step;
        partial[2 * slots + slotTable[indexAt(word, 35)]] += step;
        partial[3 * slots + slotTable[indexAt(word, 51)]] += step;
    }
    for (; i < count; ++i)
        partial[slotOf(samples[i])] += step;
}

void RowCounter::Add(const SampleSpan& span, int64_t from, int64_t to)
{
    from = std::max<int64_t>(from, 0);
    to = std::min(to, span.count);
    if (from >= to || span.samples == nullptr)
        return;
    // A span that does not lie inside its block is read as plain samples.
    if (InBlock(span))
        AddFromBlock(*span.block, span.offset + from, span.offset + to);
    else
        Count(span.samples + from, to - from, kIncrement);
}

bool RowCounter::InBlock(const SampleSpan& span)
{
    const SampleBlock* block = span.block;
    return block != nullptr && span.offset >= 0 && span.offset <= block->Count() &&
           span.count <= block->Count() - span.offset && block->Samples() + span.offset == span.samples;
}

// Counting is bound by memory latency, not arithmetic: the summary rows and
// the samples at a column's two ends are rarely in the cache. Asking for
// them one column ahead lets them arrive while the current column is shaded.
void RowCounter::Prefetch(const SampleSpan& span, int64_t from, int64_t to)
{
    from = std::max<int64_t>(from, 0);
    to = std::min(to, span.count);
    if (from >= to || span.samples == nullptr || !InBlock(span))
        return;
    const SampleBlock& block = *span.block;
    from += span.offset;
    to += span.offset;
    const std::shared_ptr<const BlockSummary> summary = FittingSummary(block);
    if (summary == nullptr || to - from < summary->ChunkSize())
        return;
    const auto [firstChunk, endChunk] = NearestChunks(*summary, from, to);
    summary->Prefetch(firstChunk, endChunk);
    const int64_t chunkStart = firstChunk * summary->ChunkSize();
    const int64_t chunkEnd = endChunk * summary->ChunkSize();
    PrefetchSamples(block.Samples() + std::min(from, chunkStart), std::abs(from - chunkStart));
    PrefetchSamples(block.Samples() + std::min(to, chunkEnd), std::abs(to - chunkEnd));
}

// A column reads up to three or four blocks and its neighbour starts in the
// last of them; a few remembered summaries spare asking each block (a lock
// and two atomic counts) over and over. A summary set by another thread
// meanwhile is seen by the next render.
std::shared_ptr<const BlockSummary> RowCounter::FittingSummary(const SampleBlock& block)
{
    for (const KnownSummary& known : known_) {
        if (known.block == &block)
            return known.summary;
    }
    std::shared_ptr<const BlockSummary> summary = block.Summary();
    if (summary != nullptr && summary->TableKey() != TableKey())
        summary = nullptr;
    Remember(block, summary);
    return summary;
}

void RowCounter::Remember(const SampleBlock& block, std::shared_ptr<const BlockSummary> summary)
{
    for (KnownSummary& known : known_) {
        if (known.block == &block) {
            known.summary = std::move(summary);
            return;
        }
    }
    known_[nextKnown_] = KnownSummary{&block, std::move(summary)};
    nextKnown_ = (nextKnown_ + 1) % known_.size();
}

// from and to are offsets inside the block.
void RowCounter::AddFromBlock(const SampleBlock& block, int64_t from, int64_t to)
{
    const int16_t* samples = block.Samples();
    const std::shared_ptr<const BlockSummary> summary = SummaryFor(block, to - from);
    if (summary == nullptr || to - from < summary->ChunkSize()) {
        Count(samples + from, to - from, kIncrement);
        return;
    }
    const auto [firstChunk, endChunk] = NearestChunks(*summary, from, to);
    const int64_t size = summary->ChunkSize();
    summary->AddChunks(partials_.data(), lastSlot_, firstChunk, endChunk);
    const int64_t chunkStart = firstChunk * size;
    if (chunkStart < from)
        Count(samples + chunkStart, from - chunkStart, kDecrement);
    else
        Count(samples + from, chunkStart - from, kIncrement);
    const int64_t chunkEnd = endChunk * size;
    if (chunkEnd > to)
        Count(samples + to, chunkEnd - to, kDecrement);
    else
        Count(samples + chunkEnd, to - chunkEnd, kIncrement);
}

std::shared_ptr<const BlockSummary> RowCounter::SummaryFor(const SampleBlock& block, int64_t reading)
{
    std::shared_ptr<const BlockSummary> summary = FittingSummary(block);
    if (summary != nullptr)
        return summary;
    if (2 * reading < block.Count())
        return nullptr;
    if (wanted_ != nullptr) {
        if (wanted_->empty() || wanted_->back() != &block)
            wanted_->push_back(&block);
        return nullptr;
    }
    summary = BlockSummary::Make(block.Samples(), block.Count(), rowTable_, TableKey());
    if (summary != nullptr) {
        block.SetSummary(summary);
        Remember(block, summary);
        ++summariesMade_;
    }
    return summary;
}

uint64_t RowCounter::TableKey()
{
    if (!tableKeyKnown_) {
        tableKey_ = BlockSummary::KeyOf(rowTable_);
        tableKeyKnown_ = true;
    }
    return tableKey_;
}

}  // namespace glimmet
