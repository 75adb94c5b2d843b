#include "sound/PoolWarmer.h"

#include <algorithm>
#include <chrono>

#include "sound/BlockPool.h"

namespace glimmet {

PoolWarmer::PoolWarmer(BlockPool& pool, size_t blocksNeeded, size_t blocksAhead)
    : pool_(pool), needed_(blocksNeeded), ahead_(blocksAhead), inUseAtStart_(pool.BlocksInUse())
{
    if (needed_ > 0 && ahead_ > 0)
        thread_ = std::thread([this] { Run(); });
}

PoolWarmer::~PoolWarmer()
{
    {
        std::lock_guard guard(mutex_);
        stop_ = true;
    }
    wake_.notify_all();
    if (thread_.joinable())
        thread_.join();
}

void PoolWarmer::Run()
{
    std::unique_lock lock(mutex_);
    while (!stop_) {
        const size_t inUse = pool_.BlocksInUse();
        const size_t taken = inUse > inUseAtStart_ ? inUse - inUseAtStart_ : 0;
        if (taken >= needed_)
            return;
        // A batch at a time, looking again at what was taken in between, so
        // that no more is made warm than is still to come.
        if (pool_.WarmBlocks() < std::min(ahead_, needed_ - taken)) {
            lock.unlock();
            const bool ok = pool_.WarmBatch();
            lock.lock();
            if (!ok)
                return;
            continue;
        }
        // The allocating thread gives no signal; a short nap costs nothing
        // next to the time it takes to use up a slab.
        wake_.wait_for(lock, std::chrono::microseconds(200));
    }
}

}  // namespace glimmet
