#include "sound/SampleAllocator.h"

#include <sys/mman.h>

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <new>

#ifndef MADV_POPULATE_WRITE
#define MADV_POPULATE_WRITE 23
#endif

#include "sound/SanitizerPoison.h"

namespace glimmet {

using sanitizer::Poison;
using sanitizer::Unpoison;

namespace {

// Capacities are whole multiples of this, so that arrays of nearly the same
// length get blocks of the same size.
constexpr size_t kGranule = size_t(2) << 20;
constexpr size_t kPage = 4096;

size_t RoundUp(size_t bytes, size_t unit)
{
    return (bytes + unit - 1) & ~(unit - 1);
}

size_t RoundUpToPage(size_t bytes)
{
    return RoundUp(bytes, kPage);
}

}  // namespace

void SampleAllocator::Deleter::operator()(int16_t* samples) const
{
    if (owner == nullptr)
        delete[] samples;
    else
        owner->GiveBack(samples, capacity);
}

SampleAllocator::SampleAllocator() : SampleAllocator(Limits()) {}

SampleAllocator::SampleAllocator(const Limits& limits) : limits_(limits) {}

SampleAllocator::~SampleAllocator()
{
    ReleaseCached();
}

SampleAllocator& SampleAllocator::Shared()
{
    static SampleAllocator* shared = new SampleAllocator();
    return *shared;
}

SampleAllocator::Array SampleAllocator::Allocate(size_t count)
{
    if (count > SIZE_MAX / (2 * sizeof(int16_t)))
        return nullptr;
    const size_t bytes = count * sizeof(int16_t);
    if (bytes < limits_.mappedFrom)
        return Array(new (std::nothrow) int16_t[count], Deleter());
    return AllocateMapped(bytes);
}

SampleAllocator::Array SampleAllocator::AllocateMapped(size_t bytes)
{
    std::vector<Block> doomed;
    Block block;
    {
        std::lock_guard guard(mutex_);
        EvictLocked(std::chrono::steady_clock::now(), &doomed);
        block = TakeCached(bytes);
    }
    Unmap(doomed);
    if (block.start != nullptr) {
        // Pages beyond what a fresh block would have are handed back, so a
        // reused block keeps no more resident than a new one would.
        const size_t wanted = CapacityFor(bytes);
        if (block.capacity > wanted)
            madvise(static_cast<char*>(block.start) + wanted, block.capacity - wanted, MADV_DONTNEED);
        Unpoison(block.start, bytes);
        return Array(static_cast<int16_t*>(block.start), Deleter{this, block.capacity});
    }
    const size_t capacity = CapacityFor(bytes);
    void* start = Map(capacity, bytes);
    if (start == nullptr)
        return nullptr;
    {
        std::lock_guard guard(mutex_);
        mappingsMade_++;
    }
    Poison(static_cast<char*>(start) + bytes, capacity - bytes);
    return Array(static_cast<int16_t*>(start), Deleter{this, capacity});
}

SampleAllocator::Block SampleAllocator::TakeCached(size_t bytes)
{
    auto best = cache_.end();
    for (auto block = cache_.begin(); block != cache_.end(); ++block) {
        if (FitsClosely(block->capacity, bytes) && (best == cache_.end() || block->capacity < best->capacity))
            best = block;
    }
    if (best == cache_.end())
        return Block();
    const Block taken = *best;
    cache_.erase(best);
    cachedBytes_ -= taken.capacity;
    return taken;
}

void SampleAllocator::GiveBack(int16_t* samples, size_t capacity)
{
    const Block block{samples, capacity, std::chrono::steady_clock::now()};
    if (limits_.cachedBlocks == 0 || capacity > limits_.cachedBytes) {
        Unmap(block);
        return;
    }
    Poison(samples, capacity);
    std::vector<Block> doomed;
    {
        std::lock_guard guard(mutex_);
        cache_.push_back(block);
        cachedBytes_ += capacity;
        EvictLocked(block.freedAt, &doomed);
    }
    Unmap(doomed);
}

void SampleAllocator::EvictLocked(std::chrono::steady_clock::time_point now, std::vector<Block>* doomed)
{
    // Oldest first: the blocks that waited too long, then as many as it takes
    // to get within the bounds.
    auto block = cache_.begin();
    while (block != cache_.end()) {
        const bool tooOld = now - block->freedAt >= limits_.idle;
        const bool overBounds = cache_.size() > limits_.cachedBlocks || cachedBytes_ > limits_.cachedBytes;
        if (!tooOld && !overBounds)
            break;
        doomed->push_back(*block);
        cachedBytes_ -= block->capacity;
        block = cache_.erase(block);
    }
}

bool SampleAllocator::FitsClosely(size_t capacity, size_t bytes)
{
    // Edits of a long channel change its length by a little; a block up to an
    // eighth (plus two granules) larger than needed still serves.
    return capacity >= bytes && capacity - bytes <= bytes / 8 + 2 * kGranule;
}

size_t SampleAllocator::CapacityFor(size_t bytes)
{
    // The headroom is address space only until written: it lets a block
    // serve an edit that lengthens the array by up to about 3%.
    return RoundUp(bytes + bytes / 32, kGranule);
}

void* SampleAllocator::Map(size_t capacity, size_t bytes)
{
    void* start = mmap(nullptr, capacity, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (start == MAP_FAILED)
        return nullptr;
    // Faulting the pages in with one call costs about two thirds of taking
    // the faults one page at a time while copying. The headroom is left to
    // fault when used. A kernel without MADV_POPULATE_WRITE refuses it with
    // EINVAL and the pages fault as usual; any other refusal means the memory
    // is not there to be had.
    if (madvise(start, RoundUpToPage(bytes), MADV_POPULATE_WRITE) != 0 && errno != EINVAL) {
        munmap(start, capacity);
        return nullptr;
    }
    return start;
}

void SampleAllocator::Unmap(const Block& block)
{
    // Mapped memory that comes back later must not arrive poisoned.
    Unpoison(block.start, block.capacity);
    munmap(block.start, block.capacity);
}

void SampleAllocator::Unmap(const std::vector<Block>& blocks)
{
    for (const Block& block : blocks)
        Unmap(block);
}

void SampleAllocator::ReleaseCached()
{
    std::vector<Block> doomed;
    {
        std::lock_guard guard(mutex_);
        doomed.swap(cache_);
        cachedBytes_ = 0;
    }
    Unmap(doomed);
}

size_t SampleAllocator::CachedBlocks()
{
    std::lock_guard guard(mutex_);
    return cache_.size();
}

size_t SampleAllocator::CachedBytes()
{
    std::lock_guard guard(mutex_);
    return cachedBytes_;
}

size_t SampleAllocator::MappingsMade()
{
    std::lock_guard guard(mutex_);
    return mappingsMade_;
}

}  // namespace glimmet
