#include "support/Locker.h"

#include <chrono>

namespace glimmet {

void Locker::Lock()
{
    mutex_.lock();
    NoteAcquired();
}

bool Locker::LockWithTimeout(int64_t timeoutMicros)
{
    if (!mutex_.try_lock_for(std::chrono::microseconds(timeoutMicros)))
        return false;
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
