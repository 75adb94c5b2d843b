#include "support/Locker.h"

#include <chrono>

namespace glimmet {

void Locker::Lock()
{
    mutex_.lock();
    NoteAcquired();
}

// Polls try_lock instead of using a timed mutex: the timed wait of the C
// library is invisible to ThreadSanitizer, and the time-outs used here are
// short (the audio thread tries for 100 microseconds).
bool Locker::LockWithTimeout(int64_t timeoutMicros)
{
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::microseconds(timeoutMicros);
    while (!mutex_.try_lock()) {
        const auto now = std::chrono::steady_clock::now();
        if (now >= deadline)
            return false;
        if (deadline - now > std::chrono::milliseconds(1))
            std::this_thread::sleep_for(std::chrono::microseconds(200));
        else
            std::this_thread::yield();
    }
    NoteAcquired();
    return true;
}

void Locker::NoteAcquired()
{
    if (depth_++ == 0)
        owner_.store(std::this_thread::get_id(), std::memory_order_relaxed);
}

void Locker::Unlock()
{
    if (!IsLockedByCurrentThread())
        return;
    if (--depth_ == 0)
        owner_.store(std::thread::id(), std::memory_order_relaxed);
    mutex_.unlock();
}

bool Locker::IsLockedByCurrentThread() const
{
    return owner_.load(std::memory_order_relaxed) == std::this_thread::get_id();
}

int32_t Locker::CountLocksHeldByCurrentThread() const
{
    return IsLockedByCurrentThread() ? depth_ : 0;
}

}  // namespace glimmet
