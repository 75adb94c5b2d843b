#pragma once

#include "support/Message.h"
#include "support/Status.h"

namespace glimmet {

/// Something that accepts messages for later delivery in its own thread.
/// PostMessage may be called from any thread and never blocks; messages
/// posted by one thread arrive in the order they were posted.
class MessageTarget {
public:
    virtual ~MessageTarget() = default;

    virtual status_t PostMessage(const Message& message) = 0;

    status_t PostMessage(uint32_t what) { return PostMessage(Message(what)); }
};

}  // namespace glimmet
