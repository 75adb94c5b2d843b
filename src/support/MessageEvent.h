#pragma once

#include <QEvent>

#include <cstdint>

#include "support/Message.h"

namespace glimmet {

/// A Message travelling through Qt's event queue to a Handler.
class MessageEvent : public QEvent {
public:
    explicit MessageEvent(Message message);
    ~MessageEvent() override;
    MessageEvent(const MessageEvent&) = delete;
    MessageEvent& operator=(const MessageEvent&) = delete;

    /// The event type registered for messages, the same for every handler.
    static QEvent::Type EventType();

    /// Messages made in the application's main thread that have not been
    /// delivered (or discarded) yet. Messages from other threads, such as
    /// the audio thread's steady play mark updates, are not counted, so a
    /// caller can wait for the commands it caused without waiting for
    /// playback to end.
    static int64_t CountPendingFromMainThread();

    const Message& message() const { return message_; }

private:
    Message message_;
    bool fromMainThread_;
};

}  // namespace glimmet
