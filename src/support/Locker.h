#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>
#include <thread>

namespace glimmet {

/// A recursive lock that may be tried with a time-out.
///
/// Unlock() by a thread that does not hold the lock does nothing: one edit
/// ends with an unlock it never took, and that must not release a lock that
/// another thread holds.
class Locker {
public:
    Locker() = default;
    Locker(const Locker&) = delete;
    Locker& operator=(const Locker&) = delete;

    void Lock();
    /// Tries for at most timeoutMicros microseconds; true when the lock is held.
    bool LockWithTimeout(int64_t timeoutMicros);
    void Unlock();
    bool IsLockedByCurrentThread() const;
    /// How many times the calling thread holds the lock (0 if it does not).
    int32_t CountLocksHeldByCurrentThread() const;

    // For std::lock_guard and friends.
    void lock() { Lock(); }
    void unlock() { Unlock(); }

private:
    void NoteAcquired();

    std::recursive_mutex mutex_;
    std::atomic<std::thread::id> owner_{};
    int32_t depth_ = 0;  // written only by the owner while it holds mutex_
};

}  // namespace glimmet
