#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "sound/Observer.h"
#include "sound/ObserverHandle.h"
#include "support/Message.h"
#include "support/Status.h"

namespace glimmet {

class Handler;
class MessageTarget;

/// A list of subscriptions, each with a 32-bit interest mask. Notify(mask)
/// tells every subscription whose mask overlaps, in the order they were
/// made: an Observer is called at once; a Handler or another message target
/// is sent an 'obup' message (or a copy of the subscription's template)
/// carrying the notifier's data, "mask" (int32, the overlap) and
/// "observable" (pointer, this object).
///
/// Subscribers are not owned and must unsubscribe before they go away.
/// Subscribing and unsubscribing are allowed from inside a notification: a
/// subscription removed meanwhile is not told any more, one added meanwhile
/// only from the next Notify on. Destroying the Observable from inside its
/// own notification is not.
///
/// Not thread-safe: one thread subscribes, unsubscribes and notifies.
/// Messages reach handlers and targets in their own threads, as posting
/// always does.
class Observable {
public:
    Observable();
    /// Deletes every subscription with its template.
    ~Observable();
    Observable(const Observable&) = delete;
    Observable& operator=(const Observable&) = delete;

    /// Null for a null observer; nothing is added then.
    ObserverHandle* Subscribe(Observer* observer, uint32_t mask);
    /// The target is sent messages with PostMessage. A null target is still
    /// subscribed (as an invalid address would be) and simply gets nothing.
    /// templateMessage, when given, is copied.
    ObserverHandle* Subscribe(MessageTarget* target, uint32_t mask, const Message* templateMessage = nullptr);
    /// Null for a null handler. A handler is posted to only while it belongs
    /// to a thread (a Handler moved to no thread gets nothing).
    /// templateMessage, when given, is copied.
    ObserverHandle* Subscribe(Handler* handler, uint32_t mask, const Message* templateMessage = nullptr);

    /// Removes and deletes handle if it is one of this object's; a handle of
    /// another Observable, or null, is left alone.
    void Unsubscribe(ObserverHandle* handle);
    /// Removes and deletes every subscription of observer.
    void Unsubscribe(Observer* observer);

    /// Tells every subscription whose mask overlaps mask. data, when given,
    /// is passed to observers as it is and copied into the messages.
    void Notify(uint32_t mask, const Message* data = nullptr);

    /// Subscriptions currently held, for diagnostics and tests.
    int32_t CountSubscriptions() const;

private:
    ObserverHandle* Append(std::unique_ptr<ObserverHandle> handle);
    void NotifyOne(const ObserverHandle& handle, uint32_t mask, const Message* data);
    Message NotificationFor(const ObserverHandle& handle, uint32_t mask, const Message* data);
    /// Removes the slot at index: at once, or, while a notification walks
    /// the list, by emptying it until the walk is over.
    void RemoveAt(size_t index);
    void DropEmptySlots();

    // In subscription order. A slot is empty only while notifying_ > 0.
    std::vector<std::unique_ptr<ObserverHandle>> handles_;
    int32_t notifying_ = 0;  // nesting depth of Notify
};

/// Copies every field of from into to, value by value in order, except the
/// fields that to already holds under the same name and type. Returns the
/// code that ended the walk over from's fields (B_BAD_INDEX once all were
/// seen).
status_t add_data_to_message(Message* to, const Message* from);

}  // namespace glimmet
