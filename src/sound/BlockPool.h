#pragma once

#include <cstddef>
#include <cstdint>
#include <mutex>
#include <vector>

namespace glimmet {

/// Hands out the memory of full-size sample blocks (kBlockBytes each) from
/// slabs of several MiB mapped at once.
///
/// Why: an hour of stereo is about 19,000 such blocks. From the ordinary heap
/// each one faults in page by page as it is first written, and freed chunks
/// of this size stay with the heap instead of going back to the system, so a
/// history that moved its blocks to a file still looked as big as before. A
/// slab is faulted in with one call (much cheaper than a fault per page), a
/// freed block is reused without faulting at all, and the memory of free
/// blocks beyond a small reserve is handed back to the system (the address
/// space stays, the pages go).
///
/// Free blocks are kept in two stacks: warm ones still hold their pages and
/// are handed out first; cold ones were handed back and are faulted in again,
/// a batch at a time, when no warm one is left.
///
/// Thread safety: any thread may allocate and free (edits on the GUI thread,
/// the loader, the history's spill worker, whoever drops a block's last
/// reference). The audio thread reads blocks under a channel's lock but never
/// holds a reference, so it never frees one. mutex_ is a leaf lock held only
/// to push or pop a few pointers; mapping, faulting in and handing back are
/// done outside it.
class BlockPool {
public:
    static constexpr size_t kBlockBytes = size_t(64) << 10;

    struct Limits {
        /// Bytes mapped at once; a whole number of blocks.
        size_t slabBytes = size_t(4) << 20;
        /// Warm free blocks kept beyond which freed blocks are handed back.
        size_t warmReserve = 64;
        /// Ask for transparent huge pages on slabs while the system has free
        /// ones (never making it compact memory to find them). On a virtual
        /// machine each small page costs a fault when first written, even
        /// when populated beforehand; one huge page replaces 512 of them.
        bool hugePages = true;
    };

    BlockPool();
    explicit BlockPool(const Limits& limits);
    /// Unmaps every slab. Blocks it handed out must be gone by then.
    ~BlockPool();
    BlockPool(const BlockPool&) = delete;
    BlockPool& operator=(const BlockPool&) = delete;

    /// The pool sample blocks use. Never destroyed, so blocks freed during
    /// static destruction still find it.
    static BlockPool& Shared();

    /// kBlockBytes of uninitialised, faulted-in memory aligned to a page, or
    /// null when the memory cannot be had.
    void* Allocate();
    /// Gives back a block from Allocate (null is ignored).
    void Free(void* block);

    /// Hands back the pages of every warm free block now.
    void ReleaseFree();
    /// Faults in one more batch of free blocks, cold ones or a new slab;
    /// false when the memory cannot be had.
    bool WarmBatch() { return Refill(); }

    /// Blocks handed out and not freed.
    size_t BlocksInUse();
    size_t WarmBlocks();
    size_t ColdBlocks();
    size_t SlabsMapped();

private:
    /// Picks the warm blocks to hand back once too many are free: whole
    /// huge pages first (handing back part of one splits it for good), and
    /// beyond a margin the longest free. Called with mutex_ held.
    std::vector<void*> TakeSurplus();
    /// Adds blocks just handed back to cold_, keeping it sorted. Called with
    /// mutex_ held.
    void ReturnCold(std::vector<void*>& blocks);
    /// Fills warm_ from cold_ or a new slab; false when no memory.
    bool Refill();
    bool MapSlab();
    /// Faults in the blocks (sorted, so neighbours go in one call).
    static bool Populate(std::vector<void*>& blocks);
    /// Hands the pages of the blocks back to the system.
    static void Release(std::vector<void*>& blocks);

    const Limits limits_;
    std::mutex mutex_;
    // Guarded by mutex_.
    std::vector<void*> warm_;
    std::vector<void*> cold_;  // sorted by address, so refills take whole huge pages
    std::vector<void*> slabs_;
    size_t inUse_ = 0;
};

}  // namespace glimmet
