#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>

class QSocketNotifier;

namespace glimmet {

class MessageTarget;

/// Carries the producer's messages from the audio thread to the window
/// without allocating or locking on the audio thread: the play-position
/// updates and the stop at the end of a range that does not loop.
///
/// The audio thread stores each one in a fixed ring and, when the ring was
/// empty, wakes the thread that made the relay through an eventfd. That
/// thread then turns every stored entry, in order, into an 'udpm' message
/// with "current frame" and "time", or a bare 'stop', and posts it to the
/// window. Sharing one ring keeps the stop in its place among the updates.
///
/// Every entry carries the run it was posted in ("playback run"). The window
/// begins a new run when it stops playback, so entries that were still on
/// their way (in the ring or in the window's queue) can be told apart from
/// those of the next playback and passed over: a stop puts the play mark
/// back at the beginning and keeps it there.
///
/// Thread use: constructed, destroyed and drained on one thread with a Qt
/// event loop (the window's); Post is called by one other thread at a time
/// (the audio thread).
class PlaymarkRelay {
public:
    /// Entries that may wait for the window (about 24 seconds of buffers);
    /// more are dropped, and counted. The last slot is kept for a stop.
    static constexpr size_t kCapacity = 4096;

    explicit PlaymarkRelay(MessageTarget* window);
    ~PlaymarkRelay();
    PlaymarkRelay(const PlaymarkRelay&) = delete;
    PlaymarkRelay& operator=(const PlaymarkRelay&) = delete;

    /// Audio thread: queues one update. Never blocks, never allocates.
    void Post(int64_t currentFrame, int64_t time);
    /// Audio thread: queues a stop behind the updates posted so far. Never
    /// blocks, never allocates.
    void PostStop();

    /// Window thread: posts every queued update now. Also run by the wake-up.
    void Drain();

    /// Window thread, once the producer has stopped: what is posted from
    /// now on belongs to a new run.
    void BeginNewRun() { run_.fetch_add(1, std::memory_order_relaxed); }
    /// The run that entries posted now belong to.
    int32_t CurrentRun() const { return run_.load(std::memory_order_relaxed); }

    /// Entries lost because the window did not drain in time.
    int64_t DroppedUpdates() const { return dropped_.load(std::memory_order_relaxed); }

private:
    struct Update {
        bool stop;
        int32_t run;
        int64_t currentFrame;
        int64_t time;
    };

    /// Stores the entry if fewer than limit entries wait.
    void Store(const Update& update, size_t limit);
    void Wake();
    void Deliver(const Update& update);

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
    std::atomic<int32_t> run_{0};
};

}  // namespace glimmet
