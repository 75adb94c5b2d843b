#include "support/MessageEvent.h"

#include <QCoreApplication>
#include <QThread>

#include <atomic>

namespace glimmet {

namespace {

std::atomic<int64_t> gPendingFromMainThread{0};

bool InMainThread()
{
    const QCoreApplication* application = QCoreApplication::instance();
    return application != nullptr && QThread::currentThread() == application->thread();
}

}  // namespace

MessageEvent::MessageEvent(Message message)
    : QEvent(EventType()), message_(std::move(message)), fromMainThread_(InMainThread())
{
    if (fromMainThread_)
        gPendingFromMainThread.fetch_add(1, std::memory_order_relaxed);
}

MessageEvent::~MessageEvent()
{
    if (fromMainThread_)
        gPendingFromMainThread.fetch_sub(1, std::memory_order_relaxed);
}

QEvent::Type MessageEvent::EventType()
{
    static const QEvent::Type type = QEvent::Type(QEvent::registerEventType());
    return type;
}

int64_t MessageEvent::CountPendingFromMainThread()
{
    return gPendingFromMainThread.load(std::memory_order_relaxed);
}

}  // namespace glimmet
