#pragma once

#include <QObject>

#include "support/MessageTarget.h"

namespace glimmet {

/// A QObject that receives Messages in the thread it lives in. Posting goes
/// through Qt's event queue: any thread may post, the poster never waits, and
/// delivery keeps the posting order.
class Handler : public QObject, public MessageTarget {
    Q_OBJECT

public:
    explicit Handler(QObject* parent = nullptr);

    using MessageTarget::PostMessage;
    status_t PostMessage(const Message& message) override;

    /// Called in the handler's thread for every message posted to it.
    virtual void MessageReceived(const Message& message);

protected:
    void customEvent(QEvent* event) override;
};

}  // namespace glimmet
