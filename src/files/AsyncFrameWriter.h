#pragma once

#include <condition_variable>
#include <cstdint>
#include <deque>
#include <mutex>
#include <thread>
#include <vector>

#include "files/FrameWriter.h"
#include "support/Status.h"

namespace glimmet {

/// Hands frames to another FrameWriter on a thread of its own, so that
/// mixing the next frames and writing the last ones overlap.
///
/// Frames are gathered into chunks and queued (a few chunks at most, so
/// memory stays bounded); the target sees the same bytes in the same order,
/// in larger pieces. The target is used only by the worker thread from the
/// first frame until Close returns.
class AsyncFrameWriter : public FrameWriter {
public:
    /// Interleaved stereo frames per chunk handed to the worker.
    static constexpr int64_t kChunkFrames = 64 * 1024;
    /// Chunks that may wait for the worker before WriteFrames waits too.
    static constexpr size_t kMaxQueuedChunks = 4;

    explicit AsyncFrameWriter(FrameWriter& target);
    ~AsyncFrameWriter() override;
    AsyncFrameWriter(const AsyncFrameWriter&) = delete;
    AsyncFrameWriter& operator=(const AsyncFrameWriter&) = delete;

    /// Copies the frames for writing. Returns the first failure the target
    /// reported so far (the frames are then dropped), else B_OK.
    status_t WriteFrames(const int16_t* frames, int64_t count) override;

    /// Writes what is still gathered, waits for the worker to finish and
    /// returns the target's first failure, or B_OK. Later calls only return
    /// that status.
    status_t Close();

private:
    using Chunk = std::vector<int16_t>;

    void QueueChunk();
    void Run();
    status_t Failure();

    FrameWriter& target_;
    Chunk filling_;  // used by the producing thread only

    std::mutex mutex_;
    std::condition_variable changed_;
    // Guarded by mutex_.
    std::deque<Chunk> queue_;
    std::vector<Chunk> spare_;
    status_t failure_ = B_OK;
    bool closing_ = false;

    std::thread worker_;
};

}  // namespace glimmet
