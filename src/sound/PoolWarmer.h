#pragma once

#include <condition_variable>
#include <cstddef>
#include <mutex>
#include <thread>

namespace glimmet {

class BlockPool;

/// Faults in a pool's blocks on a thread of its own, a batch ahead of a
/// thread about to allocate a known number of them in a row (a long
/// read-back of blocks the history moved to its file), so that the kernel's
/// work of providing the pages runs on another core while the reading goes
/// on.
///
/// It never makes more blocks warm than are still to be needed, so the
/// work holds no more memory with it than without it.
class PoolWarmer {
public:
    PoolWarmer(BlockPool& pool, size_t blocksNeeded, size_t blocksAhead);
    /// Stops and waits for the thread.
    ~PoolWarmer();
    PoolWarmer(const PoolWarmer&) = delete;
    PoolWarmer& operator=(const PoolWarmer&) = delete;

private:
    void Run();

    BlockPool& pool_;
    const size_t needed_;
    const size_t ahead_;
    // Counted before the thread starts: the allocating thread may be well
    // on its way by the time it runs.
    const size_t inUseAtStart_;
    std::mutex mutex_;
    std::condition_variable wake_;
    bool stop_ = false;  // guarded by mutex_
    std::thread thread_;
};

}  // namespace glimmet
