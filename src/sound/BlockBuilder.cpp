#include "sound/BlockBuilder.h"

#include <algorithm>
#include <cstring>

namespace glimmet {

BlockBuilder::BlockBuilder() = default;
BlockBuilder::~BlockBuilder() = default;

const BlockRef& BlockBuilder::Silence()
{
    // Silence is shared like any other block: a channel pushed far along
    // the timeline by an insert costs references, not zeroed memory.
    static const BlockRef zeros = [] {
        std::shared_ptr<SampleBlock> block = SampleBlock::Allocate(kBlockSamples);
        if (block != nullptr)
            std::memset(block->MutableSamples(), 0, size_t(kBlockSamples) * sizeof(int16_t));
        return BlockRef(std::move(block));
    }();
    return zeros;
}

void BlockBuilder::AddFresh(BlockRef block)
{
    if (block == nullptr) {
        ok_ = false;
        return;
    }
    newBytes_ += block->Count() * int64_t(sizeof(int16_t));
    list_.Append(std::move(block));
}

bool BlockBuilder::EnsurePending()
{
    if (pending_ != nullptr && pendingCount_ < kBlockSamples)
        return true;
    if (pending_ != nullptr)
        FlushPending();
    pending_ = SampleBlock::Allocate(kBlockSamples);
    pendingCount_ = 0;
    if (pending_ == nullptr)
        ok_ = false;
    return pending_ != nullptr;
}

void BlockBuilder::FlushPending()
{
    if (pending_ == nullptr || pendingCount_ == 0)
        return;
    if (pendingCount_ == kBlockSamples) {
        AddFresh(std::move(pending_));
        pending_.reset();
    } else {
        // A short block gets a block of its own size; the pending block is
        // kept for the next seam.
        AddFresh(SampleBlock::CopyOf(pending_->Samples(), pendingCount_));
    }
    pendingCount_ = 0;
}

void BlockBuilder::AppendSamples(const int16_t* samples, int64_t count)
{
    while (ok_ && count > 0) {
        if (pendingCount_ == 0 && count >= kBlockSamples) {
            // Whole blocks go straight from the source into their block.
            AddFresh(SampleBlock::CopyOf(samples, kBlockSamples));
            samples += kBlockSamples;
            count -= kBlockSamples;
            continue;
        }
        if (!EnsurePending())
            return;
        const int64_t part = std::min(count, kBlockSamples - pendingCount_);
        std::memcpy(pending_->MutableSamples() + pendingCount_, samples, size_t(part) * sizeof(int16_t));
        pendingCount_ += part;
        samples += part;
        count -= part;
    }
}

void BlockBuilder::AppendZeros(int64_t count)
{
    AppendRepeated(0, count, Silence());
}

BlockRef BlockBuilder::RepeatedBlock(int16_t value)
{
    if (value == 0)
        return Silence();
    std::shared_ptr<SampleBlock> block = SampleBlock::Allocate(kBlockSamples);
    if (block != nullptr)
        std::fill_n(block->MutableSamples(), kBlockSamples, value);
    return block;
}

void BlockBuilder::AppendRepeated(int16_t sample, int64_t count, const BlockRef& repeated)
{
    const bool shareable = repeated != nullptr && repeated->Count() == kBlockSamples;
    while (ok_ && count > 0) {
        // Once the block at the seam is full it goes, so that the rest of
        // the run shares the repeated block again instead of filling fresh
        // blocks all the way (billions of zeros would take gigabytes).
        if (pendingCount_ == kBlockSamples)
            FlushPending();
        if (pendingCount_ == 0 && count >= kBlockSamples && shareable) {
            list_.Append(repeated);
            count -= kBlockSamples;
            continue;
        }
        if (!EnsurePending())
            return;
        const int64_t part = std::min(count, kBlockSamples - pendingCount_);
        std::fill_n(pending_->MutableSamples() + pendingCount_, part, sample);
        pendingCount_ += part;
        count -= part;
    }
}

void BlockBuilder::AppendFresh(std::shared_ptr<SampleBlock> block)
{
    if (block == nullptr) {
        ok_ = false;
        return;
    }
    if (pendingCount_ > 0) {
        AppendSamples(block->Samples(), block->Count());
        return;
    }
    AddFresh(std::move(block));
}

void BlockBuilder::AppendBlock(const BlockRef& block)
{
    if (pendingCount_ > 0 && pendingCount_ + block->Count() <= kBlockSamples) {
        // Two short pieces that fit one block become one.
        AppendSamples(block->Samples(), block->Count());
        return;
    }
    FlushPending();
    list_.Append(block);
}

void BlockBuilder::AppendRange(const BlockList& list, int64_t index, int64_t count)
{
    const int64_t stop = std::min(index + count, list.Count());
    index = std::max<int64_t>(index, 0);
    if (index >= stop)
        return;
    const size_t wholeEnd = list.BlocksBefore(stop);
    for (size_t position = list.Find(index); ok_ && index < stop; ++position) {
        int64_t start = list.StartOf(position);
        if (pendingCount_ == 0 && index == start && position < wholeEnd) {
            // Whole blocks with nothing pending go in as they are, whole
            // runs of references shared.
            list_.AppendBlocks(list, position, wholeEnd - position);
            position = wholeEnd;
            if (position == list.BlockCount())
                break;
            index = start = list.StartOf(position);
            if (index >= stop)
                break;
        }
        const BlockRef& block = list.BlockAt(position);
        const int64_t offset = index - start;
        const int64_t part = std::min(block->Count() - offset, stop - index);
        if (offset == 0 && part == block->Count())
            AppendBlock(block);
        else
            AppendSamples(block->Samples() + offset, part);
        index += part;
    }
}

BlockList BlockBuilder::Finish()
{
    FlushPending();
    BlockList result = std::move(list_);
    list_.Clear();
    pending_.reset();
    pendingCount_ = 0;
    return result;
}

}  // namespace glimmet
