#pragma once

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>

#include "playback/MediaKit.h"

namespace glimmet {

/// The producer's timed events on their way from the window thread to the
/// audio thread: a fixed ring with one writer and one reader, so neither
/// side allocates or waits on the other.
class ProducerEventQueue {
public:
    static constexpr size_t kCapacity = 32;

    /// Window thread: queues the event; false when the ring is full.
    bool Push(const MediaEvent& event);

    /// Audio thread: hands every event due before periodEnd to handle, in
    /// the order they were queued. A future event holds back those behind
    /// it. Only the events queued when the call began are looked at, so a
    /// period runs a bounded amount of work.
    template <typename Handle>
    void RunDue(int64_t periodEnd, Handle&& handle)
    {
        size_t tail = tail_.load(std::memory_order_relaxed);
        const size_t head = head_.load(std::memory_order_acquire);
        while (tail != head && events_[tail % kCapacity].eventTime < periodEnd) {
            const MediaEvent event = events_[tail % kCapacity];
            ++tail;
            // Freed before it runs: the handler may take as long as it likes
            // without keeping the window thread from queueing.
            tail_.store(tail, std::memory_order_release);
            handle(event);
        }
    }

private:
    std::array<MediaEvent, kCapacity> events_{};
    std::atomic<size_t> head_{0};  // written by the window thread
    std::atomic<size_t> tail_{0};  // written by the audio thread
};

}  // namespace glimmet
