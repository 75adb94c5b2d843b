#include "views/LayoutScheduler.h"

#include <utility>

#include <QCoreApplication>
#include <QEvent>

namespace glimmet {

LayoutScheduler::LayoutScheduler(std::function<void()> layout) : layout_(std::move(layout)) {}

// An event still queued for this object is dropped by Qt with it.
LayoutScheduler::~LayoutScheduler() = default;

int LayoutScheduler::EventType()
{
    static const int type = QEvent::registerEventType();
    return type;
}

void LayoutScheduler::Schedule()
{
    scheduled_++;
    pending_ = true;
    if (posted_)
        return;
    posted_ = true;
    QCoreApplication::postEvent(this, new QEvent(QEvent::Type(EventType())), Qt::HighEventPriority);
}

bool LayoutScheduler::Flush()
{
    if (!pending_)
        return false;
    // Cleared first: the layout may ask for another one, which then runs
    // from the next event.
    pending_ = false;
    run_++;
    layout_();
    return true;
}

void LayoutScheduler::customEvent(QEvent* event)
{
    if (event->type() != QEvent::Type(EventType())) {
        QObject::customEvent(event);
        return;
    }
    posted_ = false;
    Flush();
}

}  // namespace glimmet
