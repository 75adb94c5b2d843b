#include "support/Handler.h"

#include <QCoreApplication>

#include "support/MessageEvent.h"

namespace glimmet {

Handler::Handler(QObject* parent) : QObject(parent) {}

status_t Handler::PostMessage(const Message& message)
{
    QCoreApplication::postEvent(this, new MessageEvent(message));
    return B_OK;
}

void Handler::MessageReceived(const Message&) {}

void Handler::customEvent(QEvent* event)
{
    if (event->type() == MessageEvent::EventType())
        MessageReceived(static_cast<MessageEvent*>(event)->message());
    else
        QObject::customEvent(event);
}

}  // namespace glimmet
