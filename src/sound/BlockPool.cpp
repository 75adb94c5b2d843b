#include "sound/BlockPool.h"

#include <sys/mman.h>

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <fstream>
#include <sstream>
#include <string>

#ifndef MADV_POPULATE_WRITE
#define MADV_POPULATE_WRITE 23
#endif

#include "sound/SanitizerPoison.h"

namespace glimmet {

using sanitizer::Poison;
using sanitizer::Unpoison;

namespace {

constexpr size_t kPage = 4096;
// Slabs start on a huge-page boundary so that huge pages can back them.
constexpr size_t kSlabAlign = size_t(2) << 20;
constexpr size_t kHugePage = size_t(2) << 20;
constexpr size_t kBlocksPerHugePage = kHugePage / BlockPool::kBlockBytes;
// Huge pages are asked for only while this much more is free in huge runs,
// so that the system keeps some for whoever else wants them.
constexpr size_t kHugePagesSpare = size_t(256) << 20;

/// Whether the system has at least bytes free in runs a huge page can take,
/// so that asking for huge pages makes nobody wait for memory to be
/// compacted (/proc/buddyinfo: free runs of 2^order pages per zone).
bool HugePagesFree(size_t bytes)
{
    std::ifstream buddies("/proc/buddyinfo");
    std::string line;
    size_t free = 0;
    while (std::getline(buddies, line)) {
        std::istringstream fields(line);
        std::string word;
        // "Node 0, zone Normal c0 c1 ... c10"
        for (int i = 0; i < 4 && fields >> word; ++i) {
        }
        size_t runs = 0;
        for (int order = 0; fields >> runs; ++order) {
            if (order >= 9)
                free += runs * (size_t(4096) << order);
        }
    }
    return free >= bytes;
}

uintptr_t HugePageOf(const void* block)
{
    return reinterpret_cast<uintptr_t>(block) & ~uintptr_t(kHugePage - 1);
}

/// Calls f(start, bytes) for each run of adjacent blocks, so that a system
/// call covers as much as it can.
template <typename F>
void ForEachRun(std::vector<void*>& blocks, F&& f)
{
    std::sort(blocks.begin(), blocks.end());
    size_t first = 0;
    while (first < blocks.size()) {
        size_t last = first;
        while (last + 1 < blocks.size()
               && static_cast<char*>(blocks[last]) + BlockPool::kBlockBytes == static_cast<char*>(blocks[last + 1]))
            ++last;
        f(static_cast<char*>(blocks[first]), (last - first + 1) * BlockPool::kBlockBytes);
        first = last + 1;
    }
}

/// A mapping of bytes starting on a kSlabAlign boundary, or null.
void* MapAligned(size_t bytes)
{
    const size_t padded = bytes + kSlabAlign;
    void* raw = mmap(nullptr, padded, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (raw == MAP_FAILED)
        return nullptr;
    const uintptr_t address = reinterpret_cast<uintptr_t>(raw);
    const uintptr_t start = (address + kSlabAlign - 1) & ~uintptr_t(kSlabAlign - 1);
    const size_t head = start - address;
    if (head > 0)
        munmap(raw, head);
    const size_t tail = padded - head - bytes;
    if (tail > 0)
        munmap(reinterpret_cast<void*>(start + bytes), tail);
    return reinterpret_cast<void*>(start);
}

}  // namespace

BlockPool::BlockPool() : BlockPool(Limits()) {}

BlockPool::BlockPool(const Limits& limits) : limits_(limits) {}

BlockPool::~BlockPool()
{
    for (void* slab : slabs_) {
        Unpoison(slab, limits_.slabBytes);
        munmap(slab, limits_.slabBytes);
    }
}

BlockPool& BlockPool::Shared()
{
    static BlockPool* shared = new BlockPool();
    return *shared;
}

void* BlockPool::Allocate()
{
    // Two tries: another thread may take the blocks a refill just made.
    for (int attempt = 0; attempt < 2; ++attempt) {
        {
            std::lock_guard guard(mutex_);
            if (!warm_.empty()) {
                void* block = warm_.back();
                warm_.pop_back();
                inUse_++;
                Unpoison(block, kBlockBytes);
                return block;
            }
        }
        if (!Refill())
            return nullptr;
    }
    return nullptr;
}

void BlockPool::Free(void* block)
{
    if (block == nullptr)
        return;
    Poison(block, kBlockBytes);
    const size_t batch = std::max<size_t>(1, limits_.slabBytes / kBlockBytes);
    std::vector<void*> surplus;
    {
        std::lock_guard guard(mutex_);
        warm_.push_back(block);
        inUse_--;
        // Looked at every sixteenth free past the reserve: a huge page of
        // blocks takes 32 frees to come together.
        if (warm_.size() < limits_.warmReserve + batch || (warm_.size() - limits_.warmReserve - batch) % 16 != 0)
            return;
        surplus = TakeSurplus();
    }
    if (surplus.empty())
        return;
    Release(surplus);
    std::lock_guard guard(mutex_);
    ReturnCold(surplus);
}

std::vector<void*> BlockPool::TakeSurplus()
{
    const size_t batch = std::max<size_t>(1, limits_.slabBytes / kBlockBytes);
    std::vector<void*> surplus;
    // Whole huge pages among the warm blocks, found by sorting a copy.
    std::vector<void*> sorted = warm_;
    std::sort(sorted.begin(), sorted.end());
    for (size_t first = 0; first + kBlocksPerHugePage <= sorted.size();) {
        const size_t last = first + kBlocksPerHugePage - 1;
        if (HugePageOf(sorted[first]) == reinterpret_cast<uintptr_t>(sorted[first])
            && static_cast<char*>(sorted[first]) + (kHugePage - kBlockBytes) == static_cast<char*>(sorted[last])) {
            surplus.insert(surplus.end(), sorted.begin() + ptrdiff_t(first), sorted.begin() + ptrdiff_t(last + 1));
            first = last + 1;
        } else {
            ++first;
        }
    }
    if (!surplus.empty()) {
        const auto handedBack = [&](void* block) { return std::binary_search(surplus.begin(), surplus.end(), block); };
        warm_.erase(std::remove_if(warm_.begin(), warm_.end(), handedBack), warm_.end());
    }
    // Blocks scattered over huge pages still partly in use stay warm up to
    // a margin; beyond it the longest free go back one by one.
    if (warm_.size() >= limits_.warmReserve + 2 * batch) {
        const size_t count = warm_.size() - limits_.warmReserve;
        surplus.insert(surplus.end(), warm_.begin(), warm_.begin() + ptrdiff_t(count));
        warm_.erase(warm_.begin(), warm_.begin() + ptrdiff_t(count));
    }
    return surplus;
}

void BlockPool::ReturnCold(std::vector<void*>& blocks)
{
    std::sort(blocks.begin(), blocks.end());
    const size_t middle = cold_.size();
    cold_.insert(cold_.end(), blocks.begin(), blocks.end());
    std::inplace_merge(cold_.begin(), cold_.begin() + ptrdiff_t(middle), cold_.end());
}

void BlockPool::ReleaseFree()
{
    std::vector<void*> blocks;
    {
        std::lock_guard guard(mutex_);
        blocks.swap(warm_);
    }
    Release(blocks);
    std::lock_guard guard(mutex_);
    ReturnCold(blocks);
}

bool BlockPool::Refill()
{
    const size_t batch = std::max<size_t>(1, limits_.slabBytes / kBlockBytes);
    std::vector<void*> blocks;
    {
        std::lock_guard guard(mutex_);
        const size_t count = std::min(batch, cold_.size());
        blocks.assign(cold_.end() - ptrdiff_t(count), cold_.end());
        cold_.resize(cold_.size() - count);
    }
    if (blocks.empty())
        return MapSlab();
    const bool populated = Populate(blocks);
    std::lock_guard guard(mutex_);
    if (populated)
        warm_.insert(warm_.end(), blocks.rbegin(), blocks.rend());  // lowest address handed out first
    else
        ReturnCold(blocks);
    return populated;
}

bool BlockPool::MapSlab()
{
    const size_t bytes = limits_.slabBytes / kBlockBytes * kBlockBytes;
    if (bytes == 0)
        return false;
    char* slab = static_cast<char*>(MapAligned(bytes));
    if (slab == nullptr)
        return false;
    if (limits_.hugePages && HugePagesFree(bytes + kHugePagesSpare))
        madvise(slab, bytes, MADV_HUGEPAGE);
    std::vector<void*> blocks;
    blocks.reserve(bytes / kBlockBytes);
    for (size_t offset = 0; offset < bytes; offset += kBlockBytes)
        blocks.push_back(slab + offset);
    Poison(slab, bytes);
    if (!Populate(blocks)) {
        Unpoison(slab, bytes);
        munmap(slab, bytes);
        return false;
    }
    // Handed out from the top of the stack: the slab's first block first,
    // so that blocks allocated in a row lie in a row.
    std::reverse(blocks.begin(), blocks.end());
    std::lock_guard guard(mutex_);
    slabs_.push_back(slab);
    warm_.insert(warm_.end(), blocks.begin(), blocks.end());
    return true;
}

bool BlockPool::Populate(std::vector<void*>& blocks)
{
    bool ok = true;
    ForEachRun(blocks, [&](char* start, size_t bytes) {
        if (!ok || madvise(start, bytes, MADV_POPULATE_WRITE) == 0)
            return;
        // A kernel without MADV_POPULATE_WRITE refuses it with EINVAL and the
        // pages are touched one by one instead; any other refusal means the
        // memory is not there to be had.
        if (errno != EINVAL) {
            ok = false;
            return;
        }
        Unpoison(start, bytes);
        for (size_t offset = 0; offset < bytes; offset += kPage)
            static_cast<volatile char*>(start)[offset] = 0;
        Poison(start, bytes);
    });
    return ok;
}

void BlockPool::Release(std::vector<void*>& blocks)
{
    ForEachRun(blocks, [](char* start, size_t bytes) { madvise(start, bytes, MADV_DONTNEED); });
}

size_t BlockPool::BlocksInUse()
{
    std::lock_guard guard(mutex_);
    return inUse_;
}

size_t BlockPool::WarmBlocks()
{
    std::lock_guard guard(mutex_);
    return warm_.size();
}

size_t BlockPool::ColdBlocks()
{
    std::lock_guard guard(mutex_);
    return cold_.size();
}

size_t BlockPool::SlabsMapped()
{
    std::lock_guard guard(mutex_);
    return slabs_.size();
}

}  // namespace glimmet
