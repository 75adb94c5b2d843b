#include "sound/SampleSlice.h"

#include <algorithm>
#include <cstring>

namespace glimmet {

void SampleSlice::CopyTo(int16_t* destination) const
{
    blocks.MakeResident();
    std::memset(destination, 0, size_t(leading) * sizeof(int16_t));
    blocks.CopyOut(0, blocks.Count(), destination + leading);
    std::memset(destination + leading + blocks.Count(), 0, size_t(trailing) * sizeof(int16_t));
}

bool SampleSlice::SameSamples(const SampleSlice& other) const
{
    if (leading != other.leading || trailing != other.trailing || blocks.Count() != other.blocks.Count())
        return false;
    // Walks both block lists side by side, one common run at a time.
    int64_t index = 0;
    const int64_t count = blocks.Count();
    while (index < count) {
        const size_t mine = blocks.Find(index);
        const size_t theirs = other.blocks.Find(index);
        const int64_t myOffset = index - blocks.StartOf(mine);
        const int64_t theirOffset = index - other.blocks.StartOf(theirs);
        const SampleBlock* a = blocks.BlockAt(mine).get();
        const SampleBlock* b = other.blocks.BlockAt(theirs).get();
        const int64_t run = std::min(a->Count() - myOffset, b->Count() - theirOffset);
        if (!(a == b && myOffset == theirOffset) &&
            std::memcmp(a->Samples() + myOffset, b->Samples() + theirOffset, size_t(run) * sizeof(int16_t)) != 0)
            return false;
        index += run;
    }
    return true;
}

}  // namespace glimmet
