#include "playback/PlaymarkRelay.h"

#include <sys/eventfd.h>
#include <unistd.h>

#include <QSocketNotifier>

#include "support/Message.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"
#include "support/MessageTarget.h"

namespace glimmet {

PlaymarkRelay::PlaymarkRelay(MessageTarget* window) : window_(window)
{
    wakeFd_ = eventfd(0, EFD_NONBLOCK | EFD_CLOEXEC);
    if (wakeFd_ >= 0) {
        notifier_ = std::make_unique<QSocketNotifier>(wakeFd_, QSocketNotifier::Read);
        QObject::connect(notifier_.get(), &QSocketNotifier::activated, [this] { Drain(); });
    }
}

PlaymarkRelay::~PlaymarkRelay()
{
    notifier_.reset();
    if (wakeFd_ >= 0)
        close(wakeFd_);
}

// An update leaves the last slot free, so that a stop (which the window
// must hear, or playback would go round again) still fits when updates
// have filled the rest.
void PlaymarkRelay::Post(int64_t currentFrame, int64_t time)
{
    Store(Update{false, CurrentRun(), currentFrame, time}, kCapacity - 1);
}

void PlaymarkRelay::PostStop()
{
    Store(Update{true, CurrentRun(), 0, 0}, kCapacity);
}

void PlaymarkRelay::Store(const Update& update, size_t limit)
{
    const size_t head = head_.load(std::memory_order_relaxed);
    const size_t tail = tail_.load(std::memory_order_acquire);
    if (head - tail >= limit) {
        dropped_.fetch_add(1, std::memory_order_relaxed);
        return;
    }
    ring_[head % kCapacity] = update;
    head_.store(head + 1);
    // Only the first entry after a drain needs to wake the window.
    if (!wakePending_.exchange(true))
        Wake();
}

void PlaymarkRelay::Wake()
{
    if (wakeFd_ < 0)
        return;
    const uint64_t one = 1;
    // A full counter already means "wake up"; nothing to do on failure.
    [[maybe_unused]] ssize_t written = write(wakeFd_, &one, sizeof one);
}

void PlaymarkRelay::Drain()
{
    if (wakeFd_ >= 0) {
        uint64_t count = 0;
        [[maybe_unused]] ssize_t got = read(wakeFd_, &count, sizeof count);
    }
    // Cleared before reading the ring: an update stored after this point
    // either is read below or wakes us again.
    // Sequentially consistent on both sides, so that this store and the
    // producer's head store cannot both be missed.
    wakePending_.store(false);
    size_t tail = tail_.load(std::memory_order_relaxed);
    const size_t head = head_.load();
    while (tail != head) {
        const Update update = ring_[tail % kCapacity];
        ++tail;
        tail_.store(tail, std::memory_order_release);
        Deliver(update);
    }
}

void PlaymarkRelay::Deliver(const Update& update)
{
    if (window_ == nullptr)
        return;
    if (update.stop) {
        Message stop(kMsgStop);
        stop.AddInt32(kFieldPlaybackRun, update.run);
        window_->PostMessage(stop);
        return;
    }
    Message message(kMsgUpdatePlaymark);
    message.AddInt64(kFieldCurrentFrame, update.currentFrame);
    message.AddInt64(kFieldTime, update.time);
    message.AddInt32(kFieldPlaybackRun, update.run);
    window_->PostMessage(message);
}

}  // namespace glimmet
