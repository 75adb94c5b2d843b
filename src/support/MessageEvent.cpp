#include "support/MessageEvent.h"

namespace glimmet {

MessageEvent::MessageEvent(Message message)
    : QEvent(EventType()), message_(std::move(message))
{
}

QEvent::Type MessageEvent::EventType()
{
    static const QEvent::Type type = QEvent::Type(QEvent::registerEventType());
    return type;
}

}  // namespace glimmet
