#pragma once

#include <atomic>
#include <cstdint>

namespace glimmet {

/// How far a load running on a worker thread has read its file, and the
/// request to give it up. The worker installs it with a Scope around the
/// loader call; the demuxer reports every packet it reads to the progress of
/// its thread, and stops reading (as at the end of the file) once the load
/// is cancelled, so every decoding pass ends quickly without knowing why.
///
/// Written by the loading thread, read by any (the GUI thread's progress
/// line); all members are atomics.
class LoadProgress {
public:
    /// Makes progress the one the current thread reports to, until the
    /// scope ends.
    class Scope {
    public:
        explicit Scope(LoadProgress& progress);
        ~Scope();
        Scope(const Scope&) = delete;
        Scope& operator=(const Scope&) = delete;

    private:
        LoadProgress* previous_;
    };

    /// Asks the load to stop; any thread.
    void Cancel() { cancelled_.store(true, std::memory_order_relaxed); }
    bool IsCancelled() const { return cancelled_.load(std::memory_order_relaxed); }
    /// Share of the file the current reading pass has got through, 0 to 1;
    /// 0 while the file's size is unknown.
    double Fraction() const;
    /// Reading passes started so far (a length that is not in the file's
    /// header costs a pass of its own before the samples are read).
    int32_t Passes() const { return passes_.load(std::memory_order_relaxed); }

    /// The demuxer's report of one packet: the file position reached and
    /// the file's size (<= 0 when unknown). False when the load is cancelled
    /// and reading should stop. Without a progress on this thread, true.
    static bool Report(int64_t position, int64_t size);
    /// A new pass over the file starts on this thread.
    static void PassStarted();

private:
    std::atomic<bool> cancelled_{false};
    std::atomic<int64_t> position_{0};
    std::atomic<int64_t> size_{0};
    std::atomic<int32_t> passes_{0};
};

}  // namespace glimmet
