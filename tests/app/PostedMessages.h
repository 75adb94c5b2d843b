#pragma once

#include <cstdint>
#include <vector>

#include "support/Message.h"
#include "support/MessageTarget.h"

namespace glimmet::test {

/// Keeps the codes of what is posted to it instead of delivering it.
class PostedMessages : public MessageTarget {
public:
    using MessageTarget::PostMessage;
    status_t PostMessage(const Message& message) override
    {
        codes.push_back(message.what);
        return B_OK;
    }

    std::vector<uint32_t> codes;
};

}  // namespace glimmet::test
