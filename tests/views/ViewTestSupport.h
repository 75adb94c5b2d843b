#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include <QCoreApplication>

#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/DocumentWindow.h"
#include "support/Message.h"

namespace glimmet::test {

/// A document window that records what the views post to it.
class RecordingWindow : public DocumentWindow {
public:
    status_t PostMessage(const Message& message) override
    {
        messages.push_back(message);
        return B_OK;
    }
    bool LockWithTimeout(int64_t) override { return true; }
    void UnlockWindow() override {}
    void GetVisibleFrames(int64_t* first, int64_t* last) override
    {
        *first = 0;
        *last = 0;
    }

    /// The messages with the code, in posting order.
    std::vector<Message> With(uint32_t what) const
    {
        std::vector<Message> found;
        for (const Message& message : messages) {
            if (message.what == what)
                found.push_back(message);
        }
        return found;
    }
    int64_t Int64(const Message& message, const char* name) const
    {
        int64_t value = 0;
        message.FindInt64(name, &value);
        return value;
    }

    std::vector<Message> messages;
};

/// A channel holding the samples, starting at first.
inline Channel* MakeChannel(const std::vector<int16_t>& samples, int64_t first = 0)
{
    auto* channel = new Channel();
    auto* data = new int16_t[samples.size()];
    std::copy(samples.begin(), samples.end(), data);
    channel->SetTo(data, int64_t(samples.size()));
    channel->SetStartFrameOffset(first);
    return channel;
}

/// Delivers everything posted so far.
inline void DeliverPosted()
{
    QCoreApplication::sendPostedEvents();
    QCoreApplication::processEvents();
}

}  // namespace glimmet::test
