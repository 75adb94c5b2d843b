#include "sound/BlockList.h"

#include <cstring>

namespace glimmet {

void BlockList::Append(BlockRef block)
{
    if (block == nullptr || block->Count() < 1)
        return;
    starts_.push_back(count_);
    count_ += block->Count();
    blocks_.push_back(std::move(block));
}

void BlockList::Clear()
{
    blocks_.clear();
    starts_.clear();
    count_ = 0;
}

size_t BlockList::Find(int64_t index) const
{
    const auto after = std::upper_bound(starts_.begin(), starts_.end(), index);
    return size_t(after - starts_.begin()) - 1;
}

bool BlockList::MakeResident() const
{
    std::vector<const SampleBlock*> dropped;
    for (const BlockRef& block : blocks_) {
        if (!block->IsResident())
            dropped.push_back(block.get());
    }
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
