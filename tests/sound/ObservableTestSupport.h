#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "sound/Observable.h"
#include "support/Handler.h"
#include "support/MessageCodes.h"
#include "support/MessageTarget.h"

namespace glimmet::test {

inline constexpr uint32_t kTemplateCode = FourCharCode("tmpl");

struct Call {
    std::string who;
    Observable* source;
    uint32_t mask;
    const Message* data;
};

/// Writes every call into a log shared with other observers, so that the
/// order between observers shows, and then runs an optional reaction.
class LoggingObserver : public Observer {
public:
    LoggingObserver(std::string name, std::vector<Call>* log) : name_(std::move(name)), log_(log) {}

    void ObserverNotified(Observable* source, uint32_t mask, const Message* data) override
    {
        log_->push_back(Call{name_, source, mask, data});
        if (reaction)
            reaction();
    }

    std::function<void()> reaction;

private:
    std::string name_;
    std::vector<Call>* log_;
};

/// A message target that keeps what it is sent.
class RecordingTarget : public MessageTarget {
public:
    using MessageTarget::PostMessage;
    status_t PostMessage(const Message& message) override
    {
        received.push_back(message);
        return B_OK;
    }

    std::vector<Message> received;
};

class RecordingHandler : public Handler {
public:
    void MessageReceived(const Message& message) override { received.push_back(message); }

    std::vector<Message> received;
};

inline std::vector<std::string> Names(const std::vector<Call>& log)
{
    std::vector<std::string> names;
    for (const Call& call : log)
        names.push_back(call.who);
    return names;
}

inline int32_t MaskOf(const Message& message)
{
    int32_t mask = 0;
    EXPECT_EQ(message.FindInt32("mask", &mask), B_OK);
    return mask;
}

}  // namespace glimmet::test
