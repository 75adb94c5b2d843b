#include "app/CommandTable.h"

#include <utility>

namespace glimmet {

void CommandTable::Add(uint32_t what, Handler handler)
{
    handlers_[what] = std::move(handler);
}

void CommandTable::Add(uint32_t what, std::function<void()> handler)
{
    handlers_[what] = [handler = std::move(handler)](const Message&) { handler(); };
}

bool CommandTable::Dispatch(const Message& message) const
{
    const auto found = handlers_.find(message.what);
    if (found == handlers_.end())
        return false;
    // A copy: the handler may replace its own row while it runs.
    const Handler handler = found->second;
    handler(message);
    return true;
}

}  // namespace glimmet
