#pragma once

#include <QEvent>

#include "support/Message.h"

namespace glimmet {

/// A Message travelling through Qt's event queue to a Handler.
class MessageEvent : public QEvent {
public:
    explicit MessageEvent(Message message);

    /// The event type registered for messages, the same for every handler.
    static QEvent::Type EventType();

    const Message& message() const { return message_; }

private:
    Message message_;
};

}  // namespace glimmet
