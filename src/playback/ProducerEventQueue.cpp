#include "playback/ProducerEventQueue.h"

namespace glimmet {

bool ProducerEventQueue::Push(const MediaEvent& event)
{
    const size_t head = head_.load(std::memory_order_relaxed);
    if (head - tail_.load(std::memory_order_acquire) >= kCapacity)
        return false;
    events_[head % kCapacity] = event;
    head_.store(head + 1, std::memory_order_release);
    return true;
}

}  // namespace glimmet
