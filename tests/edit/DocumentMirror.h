#pragma once

#include <cstdint>
#include <vector>

#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/DocumentChange.h"
#include "sound/Observable.h"
#include "sound/Observer.h"
#include "support/Message.h"
#include "support/MessageFields.h"

namespace glimmet::test {

/// Follows a document only through what it announces, as a view would: a
/// list of channels kept up to date by the added and removed notifications,
/// and a count of the data notifications per position. A test compares the
/// list with the document to show that every change was announced.
class DocumentMirror : public Observer {
public:
    explicit DocumentMirror(ChannelManager& document) : document_(document)
    {
        for (int32_t i = 0; Channel* channel = document.ChannelAt(i); i++)
            shown.push_back(channel);
        updates.resize(shown.size());
        document.Listeners().Subscribe(this, DocumentChange::kAll);
    }
    ~DocumentMirror() override { document_.Listeners().Unsubscribe(this); }
    DocumentMirror(const DocumentMirror&) = delete;
    DocumentMirror& operator=(const DocumentMirror&) = delete;

    void ObserverNotified(Observable*, uint32_t mask, const Message* data) override
    {
        int32_t index = -1;
        if (data != nullptr)
            data->FindInt32(kFieldIndex, &index);
        if (mask & DocumentChange::kChannelRemoved) {
            shown.erase(shown.begin() + index);
            updates.erase(updates.begin() + index);
        }
        if (mask & DocumentChange::kChannelAdded) {
            shown.insert(shown.begin() + index, document_.ChannelAt(index));
            updates.insert(updates.begin() + index, 0);
        }
        if (mask & DocumentChange::kChannelData) {
            if (index >= 0)
                updates[size_t(index)]++;
            else
                allUpdates++;
        }
    }

    /// The document's channels, in order, as it holds them now.
    std::vector<Channel*> DocumentChannels() const
    {
        std::vector<Channel*> channels;
        for (int32_t i = 0; Channel* channel = document_.ChannelAt(i); i++)
            channels.push_back(channel);
        return channels;
    }

    int32_t Count() const { return int32_t(shown.size()); }

    std::vector<Channel*> shown;
    /// Data notifications per shown channel, and for every channel at once.
    std::vector<int> updates;
    int allUpdates = 0;

private:
    ChannelManager& document_;
};

}  // namespace glimmet::test
