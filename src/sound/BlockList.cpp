#include "sound/BlockList.h"

#include <cstring>

namespace glimmet {

const BlockRef& BlockList::BlockAt(size_t position) const
{
    const size_t run = RunOfPosition(position);
    return runs_[run]->blocks[position - runFirsts_[run]];
}

int64_t BlockList::StartOf(size_t position) const
{
    const size_t run = RunOfPosition(position);
    return runStarts_[run] + runs_[run]->starts[position - runFirsts_[run]];
}

size_t BlockList::RunOfPosition(size_t position) const
{
    return size_t(std::upper_bound(runFirsts_.begin(), runFirsts_.end(), position) - runFirsts_.begin()) - 1;
}

BlockList::Run* BlockList::OpenTail()
{
    // A run only this list holds cannot be read by anyone else, so adding to
    // it changes no other list.
    if (runs_.empty() || runs_.back().use_count() != 1 || runs_.back()->blocks.size() >= kRunBlocks)
        return nullptr;
    return runs_.back().get();
}

void BlockList::Append(BlockRef block)
{
    if (block == nullptr || block->Count() < 1)
        return;
    Run* tail = OpenTail();
    if (tail == nullptr) {
        runs_.push_back(std::make_shared<Run>());
        runStarts_.push_back(count_);
        runFirsts_.push_back(blockCount_);
        tail = runs_.back().get();
    }
    tail->starts.push_back(tail->count);
    tail->count += block->Count();
    tail->blocks.push_back(std::move(block));
    count_ += tail->blocks.back()->Count();
    ++blockCount_;
}

void BlockList::AppendRun(const std::shared_ptr<Run>& run)
{
    Run* tail = OpenTail();
    if (tail != nullptr && tail->blocks.size() + run->blocks.size() <= kRunBlocks) {
        // Small pieces left at seams are gathered rather than kept as runs
        // of their own, so edits do not leave the list ever more scattered.
        for (const BlockRef& block : run->blocks)
            Append(block);
        return;
    }
    runs_.push_back(run);
    runStarts_.push_back(count_);
    runFirsts_.push_back(blockCount_);
    count_ += run->count;
    blockCount_ += run->blocks.size();
}

void BlockList::AppendBlocks(const BlockList& other, size_t first, size_t count)
{
    const size_t stop = std::min(first + count, other.blockCount_);
    while (first < stop) {
        const size_t run = other.RunOfPosition(first);
        const std::shared_ptr<Run>& source = other.runs_[run];
        const size_t inRun = first - other.runFirsts_[run];
        const size_t take = std::min(source->blocks.size() - inRun, stop - first);
        if (inRun == 0 && take == source->blocks.size()) {
            AppendRun(source);
        } else {
            for (size_t i = inRun; i < inRun + take; ++i)
                Append(source->blocks[i]);
        }
        first += take;
    }
}

void BlockList::Clear()
{
    runs_.clear();
    runStarts_.clear();
    runFirsts_.clear();
    blockCount_ = 0;
    count_ = 0;
}

size_t BlockList::BlocksBefore(int64_t stop) const
{
    if (stop >= count_)
        return blockCount_;
    if (stop <= 0)
        return 0;
    // The block holding stop starts at or before it, so it is not whole.
    return Find(stop);
}

size_t BlockList::Find(int64_t index) const
{
    const size_t run = RunHolding(index);
    return runFirsts_[run] + runs_[run]->Find(index - runStarts_[run]);
}

bool BlockList::MakeResident() const
{
    std::vector<const SampleBlock*> dropped;
    ForEachBlock([&dropped](const BlockRef& block) {
        if (!block->IsResident())
            dropped.push_back(block.get());
    });
    // All at once: the reads then go in order of place in the file.
    return dropped.empty() || SampleBlock::MakeResident(dropped);
}

void BlockList::CopyOut(int64_t index, int64_t count, int16_t* destination) const
{
    ForEachSpan(index, count, [&destination](const SampleSpan& span) {
        std::memcpy(destination, span.samples, size_t(span.count) * sizeof(int16_t));
        destination += span.count;
    });
}

}  // namespace glimmet
