#pragma once

#include <cstdint>
#include <functional>
#include <unordered_map>

#include "support/Message.h"

namespace glimmet {

/// Which handler a command's four-character code goes to. A new command is
/// one Add, so the window's dispatch never grows a switch.
class CommandTable {
public:
    using Handler = std::function<void(const Message& message)>;

    /// Makes handler the one for what, replacing any earlier one.
    void Add(uint32_t what, Handler handler);
    /// Adds a handler that needs nothing from the message.
    void Add(uint32_t what, std::function<void()> handler);

    /// Runs the handler of message.what; false, doing nothing, for a code
    /// without one.
    bool Dispatch(const Message& message) const;
    bool Handles(uint32_t what) const { return handlers_.count(what) != 0; }

private:
    std::unordered_map<uint32_t, Handler> handlers_;
};

}  // namespace glimmet
