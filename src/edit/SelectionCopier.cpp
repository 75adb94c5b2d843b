#include "edit/SelectionCopier.h"

#include <algorithm>
#include <vector>

#include "edit/Action.h"
#include "edit/CopyBuffer.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

namespace {

std::vector<Channel*> SelectedChannels(ChannelManager& manager)
{
    std::vector<Channel*> selected;
    for (int32_t index = 0; Channel* channel = manager.ChannelAt(index); ++index) {
        if (channel->IsSelected())
            selected.push_back(channel);
    }
    return selected;
}

/// One array per channel with its frames from start on; empty as soon as
/// one array cannot be had, so that a copy is whole or nothing.
std::vector<CopyBuffer::Samples> CopyRanges(const std::vector<Channel*>& channels, int64_t start, int64_t frames)
{
    std::vector<CopyBuffer::Samples> copies;
    for (Channel* channel : channels) {
        CopyBuffer::Samples samples = Action::AllocateSamples(frames);
        if (!samples)
            return {};
        // A channel that refuses the read (a range starting exactly at its
        // end) leaves the array untouched: its part of the copy is silence,
        // never whatever the memory held before.
        if (!channel->FillBuffer(samples.get(), start, frames))
            std::fill_n(samples.get(), frames, int16_t(0));
        copies.push_back(std::move(samples));
    }
    return copies;
}

}  // namespace

bool SelectionCopier::CopySelection(ChannelManager& manager, CopyBuffer& buffer)
{
    manager.Lock();
    bool copied = false;
    const std::vector<Channel*> selected = SelectedChannels(manager);
    if (!selected.empty()) {
        const int64_t start = manager.RangeStart();
        const int64_t frames = manager.RangeEnd() - start + 1;
        // The buffer refuses an empty set of channels, which keeps the old
        // copy when the range was too long for any array.
        copied = buffer.SetCopyBuffer(CopyRanges(selected, start, frames), frames);
    }
    manager.Unlock();
    return copied;
}

}  // namespace glimmet
