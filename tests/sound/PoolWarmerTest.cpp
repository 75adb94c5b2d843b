// The warmer faults in a pool's blocks ahead of a thread that allocates
// them, never more than are still to be needed.
#include <gtest/gtest.h>

#include <chrono>
#include <functional>
#include <thread>
#include <vector>

#include "sound/BlockPool.h"
#include "sound/PoolWarmer.h"

namespace glimmet {
namespace {

constexpr size_t kSlabBlocks = 16;

BlockPool::Limits SmallSlabs()
{
    BlockPool::Limits limits;
    limits.slabBytes = kSlabBlocks * BlockPool::kBlockBytes;
    limits.warmReserve = 0;
    limits.hugePages = false;
    return limits;
}

// Waits (at most a generous while, so a broken warmer fails instead of
// hanging) until condition holds.
bool Eventually(const std::function<bool()>& condition)
{
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    while (!condition()) {
        if (std::chrono::steady_clock::now() > deadline)
            return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    return true;
}

TEST(PoolWarmer, WarmsWhatWillBeNeededAndNoMore)
{
    BlockPool pool(SmallSlabs());
    {
        PoolWarmer warmer(pool, 40, 1000);
        ASSERT_TRUE(Eventually([&] { return pool.WarmBlocks() >= 40; }));
        // Give it time to overshoot if it were going to.
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    // Whole slabs are mapped, so up to one more than 40 blocks need.
    EXPECT_LE(pool.SlabsMapped(), (40 + kSlabBlocks - 1) / kSlabBlocks);
    EXPECT_EQ(pool.BlocksInUse(), 0u);
}

TEST(PoolWarmer, StaysAheadOfTheAllocatingThreadByWhatItWasAsked)
{
    BlockPool pool(SmallSlabs());
    std::vector<void*> taken;
    {
        PoolWarmer warmer(pool, 10 * kSlabBlocks, 3 * kSlabBlocks);
        for (int round = 0; round < 3; ++round) {
            ASSERT_TRUE(Eventually([&] { return pool.WarmBlocks() >= 3 * kSlabBlocks; })) << round;
            EXPECT_LE(pool.WarmBlocks(), 4 * kSlabBlocks) << round;
            for (size_t i = 0; i < 2 * kSlabBlocks; ++i)
                taken.push_back(pool.Allocate());
        }
    }
    EXPECT_LE(pool.SlabsMapped(), 10u);
    for (void* block : taken)
        pool.Free(block);
}

TEST(PoolWarmer, StopsWhenAllThatWasNeededIsTaken)
{
    BlockPool pool(SmallSlabs());
    std::vector<void*> taken;
    PoolWarmer warmer(pool, 4 * kSlabBlocks, 16 * kSlabBlocks);
    for (size_t i = 0; i < 4 * kSlabBlocks; ++i)
        taken.push_back(pool.Allocate());
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
    // Nothing more is to come, so nothing more is made warm: at most a batch
    // the warmer began as the last blocks went, and one the allocating
    // thread made at the same moment.
    EXPECT_LE(pool.SlabsMapped(), 6u);
    for (void* block : taken)
        pool.Free(block);
}

TEST(PoolWarmer, NothingNeededStartsNothing)
{
    BlockPool pool(SmallSlabs());
    {
        PoolWarmer warmer(pool, 0, 100);
    }
    EXPECT_EQ(pool.SlabsMapped(), 0u);
}

}  // namespace
}  // namespace glimmet
