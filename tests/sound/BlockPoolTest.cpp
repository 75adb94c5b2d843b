#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "sound/BlockBuilder.h"
#include "sound/BlockPool.h"
#include "sound/SampleBlock.h"

#if defined(__SANITIZE_ADDRESS__)
#define GLIMMET_TEST_ASAN 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define GLIMMET_TEST_ASAN 1
#endif
#endif

#ifdef GLIMMET_TEST_ASAN
constexpr bool kAddressSanitizer = true;
#else
constexpr bool kAddressSanitizer = false;
#endif

namespace glimmet {
namespace {

constexpr int64_t kMiB = int64_t(1) << 20;

int64_t ResidentBytes()
{
    std::ifstream status("/proc/self/status");
    std::string line;
    while (std::getline(status, line)) {
        if (line.rfind("VmRSS:", 0) == 0)
            return std::atoll(line.c_str() + 6) * 1024;
    }
    return -1;
}

void Fill(void* block, int value)
{
    std::memset(block, value, BlockPool::kBlockBytes);
}

TEST(BlockPool, HandsOutWholeWritableBlocksThatDoNotOverlap)
{
    BlockPool pool;
    std::vector<char*> blocks;
    for (int i = 0; i < 200; ++i) {
        auto* block = static_cast<char*>(pool.Allocate());
        ASSERT_NE(block, nullptr);
        Fill(block, i & 0xff);
        blocks.push_back(block);
    }
    for (size_t i = 0; i < blocks.size(); ++i) {
        EXPECT_EQ(blocks[i][0], char(i & 0xff));
        EXPECT_EQ(blocks[i][BlockPool::kBlockBytes - 1], char(i & 0xff));
    }
    std::sort(blocks.begin(), blocks.end());
    for (size_t i = 1; i < blocks.size(); ++i)
        EXPECT_GE(blocks[i] - blocks[i - 1], ptrdiff_t(BlockPool::kBlockBytes));
    EXPECT_EQ(pool.BlocksInUse(), 200u);
    for (char* block : blocks)
        pool.Free(block);
    EXPECT_EQ(pool.BlocksInUse(), 0u);
}

// Handing back part of a huge page splits it for good, so blocks freed
// scattered over pages still in use stay warm (up to a margin), while a
// huge page whose blocks are all free goes back whole.
TEST(BlockPool, HandsBackWholeHugePagesAndKeepsScatteredBlocksWarm)
{
    BlockPool::Limits limits;
    limits.warmReserve = 0;
    BlockPool pool(limits);
    const size_t perSlab = limits.slabBytes / BlockPool::kBlockBytes;
    std::vector<void*> blocks;
    for (size_t i = 0; i < 2 * perSlab; ++i)
        blocks.push_back(pool.Allocate());
    std::sort(blocks.begin(), blocks.end());
    // Every other block, as two channels taken in turn would free them.
    for (size_t i = 0; i < blocks.size(); i += 2)
        pool.Free(blocks[i]);
    EXPECT_EQ(pool.ColdBlocks(), 0u);
    EXPECT_EQ(pool.WarmBlocks(), perSlab);
    for (size_t i = 1; i < blocks.size(); i += 2)
        pool.Free(blocks[i]);
    const size_t perHugePage = (size_t(2) << 20) / BlockPool::kBlockBytes;
    EXPECT_GE(pool.ColdBlocks(), blocks.size() - perSlab);
    EXPECT_EQ(pool.ColdBlocks() % perHugePage, 0u);
    EXPECT_EQ(pool.ColdBlocks() + pool.WarmBlocks(), blocks.size());
}

TEST(BlockPool, ReusesAFreedBlockWithoutMappingMore)
{
    BlockPool pool;
    void* first = pool.Allocate();
    ASSERT_NE(first, nullptr);
    const size_t slabs = pool.SlabsMapped();
    pool.Free(first);
    void* again = pool.Allocate();
    EXPECT_EQ(again, first);
    EXPECT_EQ(pool.SlabsMapped(), slabs);
    pool.Free(again);
}

TEST(BlockPool, ReusesBlocksWhosePagesWereHandedBack)
{
    BlockPool pool;
    std::vector<void*> blocks;
    for (int i = 0; i < 256; ++i)
        blocks.push_back(pool.Allocate());
    const size_t slabs = pool.SlabsMapped();
    for (void* block : blocks)
        pool.Free(block);
    pool.ReleaseFree();
    EXPECT_EQ(pool.WarmBlocks(), 0u);
    blocks.clear();
    for (int i = 0; i < 256; ++i) {
        void* block = pool.Allocate();
        ASSERT_NE(block, nullptr);
        Fill(block, 7);
        blocks.push_back(block);
    }
    EXPECT_EQ(pool.SlabsMapped(), slabs);
    for (void* block : blocks)
        pool.Free(block);
}

TEST(BlockPool, ResidentMemoryDropsAfterFreeingManyBlocks)
{
    BlockPool pool;
    constexpr int kBlocks = 2048;  // 128 MiB
    std::vector<void*> blocks;
    for (int i = 0; i < kBlocks; ++i) {
        void* block = pool.Allocate();
        ASSERT_NE(block, nullptr);
        Fill(block, 1);
        blocks.push_back(block);
    }
    const int64_t full = ResidentBytes();
    for (void* block : blocks)
        pool.Free(block);
    const int64_t freed = ResidentBytes();
    // All but the warm reserve and one batch go back.
    EXPECT_GT(full - freed, 100 * kMiB) << "resident " << full / kMiB << " MiB, after freeing " << freed / kMiB;
}

TEST(BlockPool, ResidentMemoryDropsAfterSampleBlocksAreGone)
{
    BlockPool::Shared().ReleaseFree();
    std::vector<BlockRef> blocks;
    for (int i = 0; i < 2048; ++i) {
        std::shared_ptr<SampleBlock> block = SampleBlock::Allocate(BlockBuilder::kBlockSamples);
        ASSERT_NE(block, nullptr);
        std::fill_n(block->MutableSamples(), BlockBuilder::kBlockSamples, int16_t(i));
        blocks.push_back(std::move(block));
    }
    const int64_t full = ResidentBytes();
    blocks.clear();
    const int64_t freed = ResidentBytes();
    EXPECT_GT(full - freed, 100 * kMiB) << "resident " << full / kMiB << " MiB, after freeing " << freed / kMiB;
}

TEST(BlockPool, BlocksFreedOnOtherThreadsWhileOthersAllocate)
{
    BlockPool pool;
    constexpr int kPerThread = 3000;
    std::vector<void*> first(kPerThread), second(kPerThread);
    for (int i = 0; i < kPerThread; ++i) {
        first[size_t(i)] = pool.Allocate();
        second[size_t(i)] = pool.Allocate();
        ASSERT_NE(first[size_t(i)], nullptr);
        ASSERT_NE(second[size_t(i)], nullptr);
        Fill(first[size_t(i)], 1);
        Fill(second[size_t(i)], 2);
    }
    std::atomic<bool> clash{false};
    std::vector<void*> taken;
    std::thread freeing1([&] {
        for (void* block : first)
            pool.Free(block);
    });
    std::thread freeing2([&] {
        for (void* block : second)
            pool.Free(block);
    });
    std::thread allocating([&] {
        for (int i = 0; i < kPerThread; ++i) {
            void* block = pool.Allocate();
            if (block == nullptr) {
                clash = true;
                return;
            }
            Fill(block, 3);
            taken.push_back(block);
        }
    });
    freeing1.join();
    freeing2.join();
    allocating.join();
    EXPECT_FALSE(clash);
    // No block was handed out twice.
    EXPECT_EQ(std::set<void*>(taken.begin(), taken.end()).size(), taken.size());
    EXPECT_EQ(pool.BlocksInUse(), size_t(kPerThread));
    for (void* block : taken) {
        EXPECT_EQ(static_cast<char*>(block)[BlockPool::kBlockBytes / 2], 3);
        pool.Free(block);
    }
    EXPECT_EQ(pool.BlocksInUse(), 0u);
}

TEST(BlockPoolDeathTest, AddressSanitizerCatchesAUseAfterFree)
{
    if (!kAddressSanitizer)
        GTEST_SKIP() << "needs AddressSanitizer";
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    BlockPool pool;
    auto* block = static_cast<volatile char*>(pool.Allocate());
    ASSERT_NE(block, nullptr);
    block[100] = 1;
    pool.Free(const_cast<char*>(block));
    EXPECT_DEATH(block[100] = 2, "use-after-poison");
}

TEST(BlockPoolDeathTest, AddressSanitizerCatchesAUseOfAFreedSampleBlock)
{
    if (!kAddressSanitizer)
        GTEST_SKIP() << "needs AddressSanitizer";
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    std::shared_ptr<SampleBlock> block = SampleBlock::Allocate(BlockBuilder::kBlockSamples);
    ASSERT_NE(block, nullptr);
    volatile int16_t* samples = block->MutableSamples();
    samples[5] = 1;
    block.reset();
    EXPECT_DEATH(samples[5] = 2, "use-after-poison");
}

}  // namespace
}  // namespace glimmet
