#pragma once

#include <cstdint>

namespace glimmet {

class Message;
class Observable;

/// Something told directly, in the notifying thread, when an Observable it
/// subscribed to notifies with a mask that overlaps its own.
class Observer {
public:
    virtual ~Observer() = default;

    /// mask is the overlap of the notified mask and the subscription's mask
    /// (never 0); data is what the notifier passed, possibly null, and lives
    /// only for the call. The observer may subscribe or unsubscribe (itself
    /// or others) from here.
    virtual void ObserverNotified(Observable* source, uint32_t mask, const Message* data) = 0;
};

}  // namespace glimmet
