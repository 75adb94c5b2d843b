#include "edit/SelectionCopier.h"

#include <algorithm>
#include <vector>

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

/// One slice per channel with its frames from start on, sharing the
/// channel's blocks; empty as soon as one cannot be had, so that a copy is
/// whole or nothing. A copy that FillBuffer would refuse is silence.
std::vector<SampleSlice> CopyRanges(const std::vector<Channel*>& channels, int64_t start, int64_t frames)
{
    std::vector<SampleSlice> copies;
    if (frames < 1)
        return {};
    for (Channel* channel : channels) {
        SampleSlice slice;
        if (channel->ReadSlice(start, frames, &slice) == B_NO_MEMORY)
            return {};
        // A channel that refuses the read (a range starting exactly at its
        // end) gives a slice of silence, never whatever came before.
        copies.push_back(std::move(slice));
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
        copied = buffer.SetSlices(CopyRanges(selected, start, frames), frames);
    }
    manager.Unlock();
    return copied;
}

}  // namespace glimmet
