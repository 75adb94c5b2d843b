#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <new>
#include <thread>
#include <vector>

#include "sound/SampleAllocator.h"

// This test program frees arrays through these, so that a test can see
// whether the heap was given back an array it made with new[].
namespace {

std::atomic<const void*> gWatchedArray{nullptr};
std::atomic<int> gWatchedArrayDeletes{0};

}  // namespace

void* operator new[](std::size_t size)
{
    if (void* memory = std::malloc(size == 0 ? 1 : size))
        return memory;
    throw std::bad_alloc();
}

void operator delete[](void* memory) noexcept
{
    if (memory != nullptr && memory == gWatchedArray.load())
        gWatchedArrayDeletes++;
    std::free(memory);
}

void operator delete[](void* memory, std::size_t) noexcept
{
    operator delete[](memory);
}

// The nothrow pair too, so that every array form meets its own kind of
// free (AddressSanitizer checks that they match).
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept
{
    return std::malloc(size == 0 ? 1 : size);
}

void operator delete[](void* memory, const std::nothrow_t&) noexcept
{
    operator delete[](memory);
}

namespace glimmet {
namespace {

/// Counts the delete[] calls that free one address while it lives.
class ArrayDeleteWatch {
public:
    explicit ArrayDeleteWatch(const void* address)
    {
        gWatchedArrayDeletes = 0;
        gWatchedArray = address;
    }
    ~ArrayDeleteWatch() { gWatchedArray = nullptr; }
    ArrayDeleteWatch(const ArrayDeleteWatch&) = delete;
    ArrayDeleteWatch& operator=(const ArrayDeleteWatch&) = delete;

    int Count() const { return gWatchedArrayDeletes.load(); }
};

using namespace std::chrono_literals;

constexpr size_t kMiB = size_t(1) << 20;

// Small thresholds so that the tests stay light: arrays of 64 KiB and more
// are mapped, at most two blocks and 64 MiB are cached.
SampleAllocator::Limits TestLimits()
{
    SampleAllocator::Limits limits;
    limits.mappedFrom = 64 * 1024;
    limits.cachedBlocks = 2;
    limits.cachedBytes = 64 * kMiB;
    limits.idle = 1h;
    return limits;
}

size_t Samples(size_t bytes)
{
    return bytes / sizeof(int16_t);
}

void Fill(int16_t* samples, size_t count, int16_t value)
{
    for (size_t i = 0; i < count; i++)
        samples[i] = value;
}

TEST(SampleAllocatorTest, SmallArraysComeFromTheHeap)
{
    SampleAllocator allocator(TestLimits());
    auto array = allocator.Allocate(100);
    ASSERT_NE(array, nullptr);
    EXPECT_EQ(array.get_deleter().owner, nullptr);
    Fill(array.get(), 100, 7);
    array.reset();
    EXPECT_EQ(allocator.CachedBlocks(), 0u);
    EXPECT_EQ(allocator.MappingsMade(), 0u);
}

TEST(SampleAllocatorTest, EmptyArrayIsValid)
{
    SampleAllocator allocator(TestLimits());
    EXPECT_NE(allocator.Allocate(0), nullptr);
}

TEST(SampleAllocatorTest, BigArraysAreMappedAndWritableToTheEnd)
{
    SampleAllocator allocator(TestLimits());
    const size_t count = Samples(3 * kMiB) + 3;
    auto array = allocator.Allocate(count);
    ASSERT_NE(array, nullptr);
    EXPECT_EQ(array.get_deleter().owner, &allocator);
    EXPECT_GE(array.get_deleter().capacity, count * sizeof(int16_t));
    Fill(array.get(), count, -5);
    EXPECT_EQ(array[0], -5);
    EXPECT_EQ(array[count - 1], -5);
    EXPECT_EQ(allocator.MappingsMade(), 1u);
}

TEST(SampleAllocatorTest, FreedBlockServesTheNextArrayOfAboutTheSameSize)
{
    SampleAllocator allocator(TestLimits());
    const size_t count = Samples(8 * kMiB);
    auto first = allocator.Allocate(count);
    ASSERT_NE(first, nullptr);
    int16_t* const address = first.get();
    first.reset();
    EXPECT_EQ(allocator.CachedBlocks(), 1u);

    // A little shorter, as after removing a second from a long channel.
    auto second = allocator.Allocate(count - 44100);
    ASSERT_NE(second, nullptr);
    EXPECT_EQ(second.get(), address);
    EXPECT_EQ(allocator.CachedBlocks(), 0u);
    EXPECT_EQ(allocator.MappingsMade(), 1u);
    Fill(second.get(), count - 44100, 3);
}

TEST(SampleAllocatorTest, BlockIsServedWhenTheArrayGrowsALittle)
{
    SampleAllocator allocator(TestLimits());
    const size_t count = Samples(32 * kMiB);
    allocator.Allocate(count).reset();
    // One percent longer, as after pasting a minute into an hour.
    auto longer = allocator.Allocate(count + count / 100);
    ASSERT_NE(longer, nullptr);
    Fill(longer.get(), count + count / 100, 1);
    EXPECT_EQ(allocator.MappingsMade(), 1u);
}

TEST(SampleAllocatorTest, BlockMuchLargerThanNeededIsNotReused)
{
    SampleAllocator allocator(TestLimits());
    allocator.Allocate(Samples(32 * kMiB)).reset();
    auto small = allocator.Allocate(Samples(4 * kMiB));
    ASSERT_NE(small, nullptr);
    EXPECT_EQ(allocator.MappingsMade(), 2u);
    EXPECT_EQ(allocator.CachedBlocks(), 1u);
}

TEST(SampleAllocatorTest, BlockTooSmallIsNotReused)
{
    SampleAllocator allocator(TestLimits());
    allocator.Allocate(Samples(4 * kMiB)).reset();
    auto big = allocator.Allocate(Samples(16 * kMiB));
    ASSERT_NE(big, nullptr);
    EXPECT_EQ(allocator.MappingsMade(), 2u);
}

TEST(SampleAllocatorTest, ClosestFittingBlockIsTaken)
{
    SampleAllocator allocator(TestLimits());
    auto larger = allocator.Allocate(Samples(10 * kMiB));
    auto exact = allocator.Allocate(Samples(9 * kMiB));
    int16_t* const exactAddress = exact.get();
    larger.reset();
    exact.reset();
    auto again = allocator.Allocate(Samples(9 * kMiB));
    EXPECT_EQ(again.get(), exactAddress);
}

TEST(SampleAllocatorTest, CacheHoldsAtMostTwoBlocks)
{
    SampleAllocator allocator(TestLimits());
    std::vector<SampleAllocator::Array> arrays;
    for (int i = 0; i < 4; i++)
        arrays.push_back(allocator.Allocate(Samples(2 * kMiB)));
    const int16_t* newest = arrays[3].get();
    arrays.clear();
    EXPECT_EQ(allocator.CachedBlocks(), 2u);
    EXPECT_LE(allocator.CachedBytes(), 64 * kMiB);
    // The oldest blocks went first; the newest is still there.
    auto again = allocator.Allocate(Samples(2 * kMiB));
    auto another = allocator.Allocate(Samples(2 * kMiB));
    EXPECT_TRUE(again.get() == newest || another.get() == newest);
    EXPECT_EQ(allocator.MappingsMade(), 4u);
}

TEST(SampleAllocatorTest, CacheStaysWithinItsByteBound)
{
    SampleAllocator allocator(TestLimits());
    auto first = allocator.Allocate(Samples(40 * kMiB));
    auto second = allocator.Allocate(Samples(40 * kMiB));
    first.reset();
    second.reset();
    EXPECT_EQ(allocator.CachedBlocks(), 1u);
    EXPECT_LE(allocator.CachedBytes(), 64 * kMiB);
}

TEST(SampleAllocatorTest, BlockLargerThanTheBoundIsNeverCached)
{
    SampleAllocator allocator(TestLimits());
    allocator.Allocate(Samples(100 * kMiB)).reset();
    EXPECT_EQ(allocator.CachedBlocks(), 0u);
    EXPECT_EQ(allocator.CachedBytes(), 0u);
}

TEST(SampleAllocatorTest, IdleBlocksAreReleasedAtTheNextCall)
{
    SampleAllocator::Limits limits = TestLimits();
    limits.idle = 20ms;
    SampleAllocator allocator(limits);
    allocator.Allocate(Samples(8 * kMiB)).reset();
    EXPECT_EQ(allocator.CachedBlocks(), 1u);
    std::this_thread::sleep_for(40ms);
    auto array = allocator.Allocate(Samples(8 * kMiB));
    ASSERT_NE(array, nullptr);
    EXPECT_EQ(allocator.MappingsMade(), 2u);
    EXPECT_EQ(allocator.CachedBlocks(), 0u);
}

TEST(SampleAllocatorTest, ReleaseCachedEmptiesTheCache)
{
    SampleAllocator allocator(TestLimits());
    allocator.Allocate(Samples(8 * kMiB)).reset();
    allocator.ReleaseCached();
    EXPECT_EQ(allocator.CachedBlocks(), 0u);
    EXPECT_EQ(allocator.CachedBytes(), 0u);
    allocator.Allocate(Samples(8 * kMiB)).reset();
    EXPECT_EQ(allocator.MappingsMade(), 2u);
}

TEST(SampleAllocatorTest, NoCacheWhenNoBlocksAreAllowed)
{
    SampleAllocator::Limits limits = TestLimits();
    limits.cachedBlocks = 0;
    SampleAllocator allocator(limits);
    allocator.Allocate(Samples(8 * kMiB)).reset();
    EXPECT_EQ(allocator.CachedBlocks(), 0u);
}

TEST(SampleAllocatorTest, RefusedAllocationGivesNullAndKeepsTheCache)
{
    SampleAllocator allocator(TestLimits());
    allocator.Allocate(Samples(8 * kMiB)).reset();
    // Beyond any address space, and beyond size_t once counted in bytes.
    EXPECT_EQ(allocator.Allocate(size_t(1) << 50), nullptr);
    EXPECT_EQ(allocator.Allocate(SIZE_MAX / 2), nullptr);
    EXPECT_EQ(allocator.Allocate(SIZE_MAX), nullptr);
    EXPECT_EQ(allocator.CachedBlocks(), 1u);
}

TEST(SampleAllocatorTest, ReusedBlockHoldsWhatIsWrittenNext)
{
    SampleAllocator allocator(TestLimits());
    const size_t count = Samples(6 * kMiB);
    auto first = allocator.Allocate(count);
    Fill(first.get(), count, 11);
    first.reset();
    auto second = allocator.Allocate(count);
    for (size_t i = 0; i < count; i++)
        second[i] = int16_t(i);
    bool same = true;
    for (size_t i = 0; i < count; i++)
        same = same && second[i] == int16_t(i);
    EXPECT_TRUE(same);
}

TEST(SampleAllocatorTest, HeapDeleterFreesAnArrayFromNew)
{
    // The deleter without an allocator is what adopted new[] arrays get.
    int16_t* const raw = new int16_t[10];
    ArrayDeleteWatch watch(raw);
    SampleAllocator::Array adopted(raw, SampleAllocator::Deleter());
    EXPECT_EQ(adopted.get_deleter().owner, nullptr);
    adopted[9] = 1;
    EXPECT_EQ(watch.Count(), 0);
    adopted.reset();
    EXPECT_EQ(watch.Count(), 1);
}

TEST(SampleAllocatorTest, MappedArrayIsNotFreedWithDelete)
{
    SampleAllocator allocator(TestLimits());
    auto array = allocator.Allocate(Samples(8 * kMiB));
    ASSERT_NE(array, nullptr);
    ArrayDeleteWatch watch(array.get());
    array.reset();
    EXPECT_EQ(watch.Count(), 0);
    EXPECT_EQ(allocator.CachedBlocks(), 1u);
}

#if defined(__SANITIZE_ADDRESS__)
constexpr bool kAddressSanitizer = true;
#else
constexpr bool kAddressSanitizer = false;
#endif

TEST(SampleAllocatorDeathTest, ReadingACachedBlockIsCaughtBySanitizer)
{
    if (!kAddressSanitizer)
        GTEST_SKIP() << "needs AddressSanitizer";
    SampleAllocator allocator(TestLimits());
    auto array = allocator.Allocate(Samples(8 * kMiB));
    volatile int16_t* stale = array.get();
    array.reset();
    ASSERT_EQ(allocator.CachedBlocks(), 1u);
    EXPECT_DEATH((void)stale[100], "use-after-poison");
}

TEST(SampleAllocatorDeathTest, WritingPastTheEndOfAMappedArrayIsCaughtBySanitizer)
{
    if (!kAddressSanitizer)
        GTEST_SKIP() << "needs AddressSanitizer";
    SampleAllocator allocator(TestLimits());
    const size_t count = Samples(8 * kMiB);
    auto array = allocator.Allocate(count);
    volatile int16_t* samples = array.get();
    EXPECT_DEATH(samples[count + 8] = 1, "use-after-poison");
}

TEST(SampleAllocatorTest, SharedAllocatorIsOneInstance)
{
    EXPECT_EQ(&SampleAllocator::Shared(), &SampleAllocator::Shared());
}

TEST(SampleAllocatorStressTest, ThreadsAllocatingAndFreeingKeepTheBounds)
{
    SampleAllocator allocator(TestLimits());
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; t++) {
        threads.emplace_back([&allocator, t] {
            for (int i = 0; i < 50; i++) {
                const size_t count = Samples(size_t(2 + (i + t) % 3) * kMiB);
                auto array = allocator.Allocate(count);
                ASSERT_NE(array, nullptr);
                array[0] = int16_t(t);
                array[count - 1] = int16_t(i);
                EXPECT_EQ(array[0], int16_t(t));
                EXPECT_EQ(array[count - 1], int16_t(i));
            }
        });
    }
    for (auto& thread : threads)
        thread.join();
    EXPECT_LE(allocator.CachedBlocks(), 2u);
    EXPECT_LE(allocator.CachedBytes(), 64 * kMiB);
}

}  // namespace
}  // namespace glimmet
