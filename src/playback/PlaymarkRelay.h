#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>

class QSocketNotifier;

namespace glimmet {

class MessageTarget;

/// Carries the producer's play-position updates from the audio thread to the
/// window without allocating on the audio thread.
///
/// The audio thread stores each update in a fixed ring and, when the ring
/// was empty, wakes the thread that made the relay through an eventfd. That
/// thread then turns every stored update, in order, into an 'udpm' message
/// with "current frame" and "time" and posts it to the window.
///
/// Thread use: constructed, destroyed and drained on one thread with a Qt
/// event loop (the window's); Post is called by one other thread at a time
/// (the audio thread).
class PlaymarkRelay {
public:
    /// Updates that may wait for the window (about 24 seconds of buffers);
    /// more are dropped, and counted.
    static constexpr size_t kCapacity = 4096;

    explicit PlaymarkRelay(MessageTarget* window);
    ~PlaymarkRelay();
    PlaymarkRelay(const PlaymarkRelay&) = delete;
    PlaymarkRelay& operator=(const PlaymarkRelay&) = delete;

    /// Audio thread: queues one update. Never blocks, never allocates.
    void Post(int64_t currentFrame, int64_t time);

    /// Window thread: posts every queued update now. Also run by the wake-up.
    void Drain();

    /// Updates lost because the window did not drain in time.
    int64_t DroppedUpdates() const { return dropped_.load(std::memory_order_relaxed); }

private:
    struct Update {
        int64_t currentFrame;
        int64_t time;
    };

    void Wake();

    MessageTarget* window_;
    int wakeFd_ = -1;
    std::unique_ptr<QSocketNotifier> notifier_;

    // Single-producer single-consumer ring: head_ is written by the audio
    // thread only, tail_ by the window thread only.
    std::array<Update, kCapacity> ring_{};
    std::atomic<size_t> head_{0};
    std::atomic<size_t> tail_{0};
    std::atomic<bool> wakePending_{false};
    std::atomic<int64_t> dropped_{0};
};

}  // namespace glimmet
