#include <gtest/gtest.h>

#include <atomic>
#include <thread>

#include "support/Locker.h"
#include "support/SystemTime.h"

namespace glimmet {
namespace {

TEST(LockerTest, IsRecursive)
{
    Locker lock;
    lock.Lock();
    lock.Lock();
    EXPECT_EQ(lock.CountLocksHeldByCurrentThread(), 2);
    lock.Unlock();
    EXPECT_TRUE(lock.IsLockedByCurrentThread());
    lock.Unlock();
    EXPECT_FALSE(lock.IsLockedByCurrentThread());
}

TEST(LockerTest, UnlockWithoutHoldingDoesNothing)
{
    Locker lock;
    lock.Unlock();
    EXPECT_FALSE(lock.IsLockedByCurrentThread());
    lock.Lock();
    std::thread other([&] { lock.Unlock(); });
    other.join();
    EXPECT_TRUE(lock.IsLockedByCurrentThread());
    std::atomic<bool> got{true};
    std::thread tryer([&] { got = lock.LockWithTimeout(1000); });
    tryer.join();
    EXPECT_FALSE(got.load());
    lock.Unlock();
}

TEST(LockerTest, TimeoutGivesUpWhileAnotherThreadHoldsIt)
{
    Locker lock;
    std::atomic<bool> held{false};
    std::atomic<bool> release{false};
    std::thread holder([&] {
        lock.Lock();
        held = true;
        while (!release)
            std::this_thread::yield();
        lock.Unlock();
    });
    while (!held)
        std::this_thread::yield();
    const int64_t before = system_time();
    EXPECT_FALSE(lock.LockWithTimeout(100));
    EXPECT_GE(system_time() - before, 100);
    release = true;
    holder.join();
    EXPECT_TRUE(lock.LockWithTimeout(100));
    lock.Unlock();
}

TEST(SystemTimeTest, CountsMicroseconds)
{
    const int64_t before = system_time();
    snooze(2000);
    const int64_t elapsed = system_time() - before;
    EXPECT_GE(elapsed, 2000);
    EXPECT_LT(elapsed, 2000000);
}

}  // namespace
}  // namespace glimmet
