#pragma once

#include <mutex>
#include <vector>

#include "sound/DocumentWindow.h"
#include "support/Locker.h"

namespace glimmet {

/// A document window that records what the engine posts to it and shows a
/// fixed stretch of frames; its lock can be held by a test thread.
class FakeDocumentWindow : public DocumentWindow {
public:
    using DocumentWindow::PostMessage;

    status_t PostMessage(const Message& message) override
    {
        std::lock_guard guard(mutex_);
        messages_.push_back(message);
        return B_OK;
    }

    bool LockWithTimeout(int64_t timeoutMicros) override
    {
        lockTimeouts_.push_back(timeoutMicros);
        return windowLock.LockWithTimeout(timeoutMicros);
    }

    void UnlockWindow() override { windowLock.Unlock(); }

    void GetVisibleFrames(int64_t* first, int64_t* last) override
    {
        *first = visibleFirst;
        *last = visibleLast;
    }

    std::vector<Message> TakeMessages()
    {
        std::lock_guard guard(mutex_);
        return std::exchange(messages_, {});
    }

    const std::vector<int64_t>& LockTimeouts() const { return lockTimeouts_; }

    Locker windowLock;
    int64_t visibleFirst = 0;
    int64_t visibleLast = 0;

private:
    std::mutex mutex_;
    std::vector<Message> messages_;
    std::vector<int64_t> lockTimeouts_;
};

}  // namespace glimmet
