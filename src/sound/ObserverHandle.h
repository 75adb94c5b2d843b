#pragma once

#include <cstdint>
#include <memory>

#include "support/Message.h"

namespace glimmet {

class Handler;
class MessageTarget;
class Observer;

/// One subscription to an Observable: an interest mask and exactly one
/// subscriber, either an Observer called directly, a Handler or another
/// message target that is sent a message. The subscriber is not owned; the
/// message template is a copy owned by the handle.
///
/// Handles are made and deleted by their Observable only; the pointer it
/// hands out is what its owner gives back to unsubscribe.
class ObserverHandle {
public:
    static std::unique_ptr<ObserverHandle> ForObserver(Observer* observer, uint32_t mask);
    static std::unique_ptr<ObserverHandle> ForHandler(Handler* handler, uint32_t mask, const Message* templateMessage);
    static std::unique_ptr<ObserverHandle> ForTarget(MessageTarget* target, uint32_t mask,
                                                     const Message* templateMessage);

    ObserverHandle(const ObserverHandle&) = delete;
    ObserverHandle& operator=(const ObserverHandle&) = delete;

    uint32_t Mask() const { return mask_; }
    Observer* ObserverOf() const { return observer_; }
    Handler* HandlerOf() const { return handler_; }
    MessageTarget* TargetOf() const { return target_; }
    /// The message notifications start from, or null for a bare 'obup'.
    const Message* Template() const { return template_.get(); }

private:
    ObserverHandle(uint32_t mask, const Message* templateMessage);

    uint32_t mask_;
    Observer* observer_ = nullptr;
    Handler* handler_ = nullptr;
    MessageTarget* target_ = nullptr;
    std::unique_ptr<Message> template_;
};

}  // namespace glimmet
