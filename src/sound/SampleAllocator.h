#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <vector>

namespace glimmet {

/// Hands out uninitialised sample arrays. Small arrays come from the ordinary
/// heap; big ones are mapped directly, and a few of them are kept mapped for a
/// while after they are freed.
///
/// Why the cache: an edit of a long channel builds a new array of nearly the
/// size of the old one and frees the old one. Copying into freshly mapped
/// memory costs several times the copy itself (every page faults and is
/// zeroed by the kernel), while copying into the block the previous edit just
/// gave back costs little more than the copy. A fresh mapping is faulted in
/// with one call, which is cheaper than page by page. Huge pages are not asked
/// for: their first faults stalled for up to tens of times the copy, and a
/// reused block does not fault at all.
///
/// What it may hold: at most Limits::cachedBlocks blocks of at most
/// Limits::cachedBytes in all (by default two blocks and 1 GiB, as much as
/// the two channels of a stereo recording of about an hour and forty minutes
/// at 44.1 kHz). Someone editing such a recording already holds that much in
/// the channels, and each edit needs the old and the new array side by side
/// anyway; the cache keeps that peak for a while instead of returning it at
/// once. A block that has waited Limits::idle (10 s) is unmapped at the
/// allocator's next call, and ReleaseCached() drops everything at once. A
/// block larger than Limits::cachedBytes is never kept.
///
/// Thread safety: Allocate and the deleter are called from the GUI thread
/// (edits), from loading and from whichever thread drops the last reference
/// to an array; the cache is guarded by mutex_, and no system call is made
/// while it is held. mutex_ is a leaf lock: channels free arrays while holding
/// their own lock, and nothing else is locked while mutex_ is held.
class SampleAllocator {
public:
    struct Limits {
        /// Arrays of at least this many bytes are mapped; smaller ones use new[].
        size_t mappedFrom = size_t(4) << 20;
        size_t cachedBlocks = 2;
        size_t cachedBytes = size_t(1) << 30;
        std::chrono::steady_clock::duration idle = std::chrono::seconds(10);
    };

    /// Frees an array where it came from: delete[] without an allocator (an
    /// array from new[], as Channel::SetTo adopts), otherwise back to the
    /// allocator, which knows the mapping's size from capacity.
    struct Deleter {
        SampleAllocator* owner = nullptr;
        size_t capacity = 0;
        void operator()(int16_t* samples) const;
    };
    using Array = std::unique_ptr<int16_t[], Deleter>;

    SampleAllocator();
    explicit SampleAllocator(const Limits& limits);
    /// Unmaps the cached blocks. Arrays it handed out must be gone by then.
    ~SampleAllocator();
    SampleAllocator(const SampleAllocator&) = delete;
    SampleAllocator& operator=(const SampleAllocator&) = delete;

    /// The allocator channels use. Never destroyed, so arrays freed during
    /// static destruction still find it.
    static SampleAllocator& Shared();

    /// An uninitialised array of count samples, or null when the memory cannot
    /// be had. A count of 0 gives a valid, empty array.
    Array Allocate(size_t count);

    /// Unmaps every cached block now.
    void ReleaseCached();

    size_t CachedBlocks();
    size_t CachedBytes();
    /// Mappings made since construction (a reused block is not a new one).
    size_t MappingsMade();

private:
    struct Block {
        void* start = nullptr;
        size_t capacity = 0;
        std::chrono::steady_clock::time_point freedAt;
    };

    Array AllocateMapped(size_t bytes);
    /// The cached block that fits bytes closely, taken out of the cache, or an
    /// empty block.
    Block TakeCached(size_t bytes);
    void GiveBack(int16_t* samples, size_t capacity);
    /// Moves the blocks that must go (too old, too many, too big in all) out
    /// of the cache into doomed, to be unmapped once mutex_ is released.
    void EvictLocked(std::chrono::steady_clock::time_point now, std::vector<Block>* doomed);
    static bool FitsClosely(size_t capacity, size_t bytes);
    static size_t CapacityFor(size_t bytes);
    /// A new mapping of capacity bytes whose first bytes are faulted in, or
    /// null.
    static void* Map(size_t capacity, size_t bytes);
    static void Unmap(const Block& block);
    static void Unmap(const std::vector<Block>& blocks);

    const Limits limits_;
    std::mutex mutex_;
    // Guarded by mutex_: the cache, oldest first, and its statistics.
    std::vector<Block> cache_;
    size_t cachedBytes_ = 0;
    size_t mappingsMade_ = 0;
};

}  // namespace glimmet
