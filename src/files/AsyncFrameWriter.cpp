#include "files/AsyncFrameWriter.h"

#include <algorithm>

namespace glimmet {

namespace {

constexpr size_t kSamplesPerFrame = 2;

}  // namespace

AsyncFrameWriter::AsyncFrameWriter(FrameWriter& target) : target_(target), worker_([this] { Run(); }) {}

AsyncFrameWriter::~AsyncFrameWriter()
{
    Close();
}

status_t AsyncFrameWriter::Failure()
{
    std::lock_guard guard(mutex_);
    return failure_;
}

status_t AsyncFrameWriter::WriteFrames(const int16_t* frames, int64_t count)
{
    if (frames == nullptr || count <= 0)
        return B_BAD_VALUE;
    const status_t failure = Failure();
    if (failure != B_OK)
        return failure;
    filling_.insert(filling_.end(), frames, frames + size_t(count) * kSamplesPerFrame);
    if (filling_.size() >= size_t(kChunkFrames) * kSamplesPerFrame)
        QueueChunk();
    return B_OK;
}

void AsyncFrameWriter::QueueChunk()
{
    std::unique_lock lock(mutex_);
    changed_.wait(lock, [this] { return queue_.size() < kMaxQueuedChunks || failure_ != B_OK; });
    if (failure_ == B_OK)
        queue_.push_back(std::move(filling_));
    filling_.clear();
    if (!spare_.empty()) {
        filling_ = std::move(spare_.back());
        spare_.pop_back();
        filling_.clear();
    }
    lock.unlock();
    changed_.notify_all();
}

void AsyncFrameWriter::Run()
{
    std::unique_lock lock(mutex_);
    for (;;) {
        changed_.wait(lock, [this] { return !queue_.empty() || closing_; });
        if (queue_.empty())
            return;
        Chunk chunk = std::move(queue_.front());
        queue_.pop_front();
        const bool writing = failure_ == B_OK;
        lock.unlock();
        changed_.notify_all();
        const status_t status =
            writing ? target_.WriteFrames(chunk.data(), int64_t(chunk.size() / kSamplesPerFrame)) : B_OK;
        lock.lock();
        if (failure_ == B_OK)
            failure_ = status;
        spare_.push_back(std::move(chunk));
        changed_.notify_all();
    }
}

status_t AsyncFrameWriter::Close()
{
    if (worker_.joinable()) {
        if (!filling_.empty())
            QueueChunk();
        {
            std::lock_guard guard(mutex_);
            closing_ = true;
        }
        changed_.notify_all();
        worker_.join();
    }
    return Failure();
}

}  // namespace glimmet
