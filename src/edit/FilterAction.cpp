#include "edit/FilterAction.h"

#include <cstring>
#include <mutex>
#include <span>
#include <vector>

#include "edit/effects/FirFilter.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/Diagnostics.h"

namespace glimmet {

status_t FilterAction::Go()
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    ReadDialog();
    if (kernel_.empty())
        return B_OK;
    return FilterSelected();
}

void FilterAction::ReadDialog()
{
    CurveDialog* dialog = Dialog();
    if (dialog == nullptr || !dialog->Lock())
        return;
    const int32_t taps = dialog->NumPasses();
    const effects::SplineCurve curve = dialog->Curve();
    dialog->Unlock();
    CloseDialog();
    if (taps > kMaxTaps) {
        Diagnostics::Print("FIR Filter: %d passes are more than the %d a filter may have; nothing was filtered.\n",
            int(taps), int(kMaxTaps));
        return;
    }
    kernel_ = effects::FirKernel(curve, taps);
}

namespace {

// Where the range lies inside the channel's data, the copy in through
// FillBuffer cannot fail and the write back through ReplaceFrames only
// replaces the range's samples, so filtering them where they are gives the
// same channel. Left out: a range of one frame at the channel's first frame,
// which FillBuffer reads as silence, and a range before frame 0, which
// ReplaceFrames refuses.
bool FiltersInPlace(Channel* channel, int64_t start, int64_t end, int64_t count)
{
    const int64_t first = channel->FirstFrame();
    return channel->Data() != nullptr && start >= 0 && start >= first
        && end < first + channel->FrameCount() && (count > 1 || start > first);
}

// The taps frames before start as FillBuffer gives them: silence before
// the channel's first frame.
std::vector<int16_t> HistoryOf(Channel* channel, int64_t start, int64_t taps)
{
    std::vector<int16_t> history(size_t(taps), 0);
    const int64_t first = channel->FirstFrame();
    for (int64_t j = 0; j < taps; j++) {
        const int64_t frame = start - taps + j;
        if (frame >= first)
            history[size_t(j)] = channel->Data()[frame - first];
    }
    return history;
}

// The filter over channels that hold the whole range, without the working
// buffers; false, changing nothing, when a selected channel does not.
bool FilterInPlace(ChannelManager* manager, int64_t start, int64_t end, const std::vector<double>& kernel)
{
    const int64_t count = end - start + 1;
    for (int32_t i = 0; Channel* channel = manager->ChannelAt(i); i++) {
        if (channel->IsSelected() && !FiltersInPlace(channel, start, end, count))
            return false;
    }
    const int64_t taps = int64_t(kernel.size());
    for (int32_t i = 0; Channel* channel = manager->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        const std::vector<int16_t> history = HistoryOf(channel, start, taps);
        int16_t* range = channel->Data() + (start - channel->FirstFrame());
        effects::FirFilterInPlace(history, kernel, std::span<int16_t>(range, size_t(count)));
    }
    return true;
}

}  // namespace

status_t FilterAction::FilterSelected()
{
    std::lock_guard guard(Manager()->DocumentLock());
    const int64_t count = FrameCount();
    if (count < 1)
        return B_OK;
    if (count == RangeEnd() - RangeStart() + 1 && FilterInPlace(Manager(), RangeStart(), RangeEnd(), kernel_))
        return B_OK;
    const int64_t taps = int64_t(kernel_.size());
    // The input holds the taps frames before the range as history, then the
    // range; both buffers serve every channel in turn.
    SampleAllocator::Array input = AllocateSamples(count + taps);
    SampleAllocator::Array output = AllocateSamples(count);
    if (input == nullptr || output == nullptr)
        return B_NO_MEMORY;
    // A channel whose copy fails filters what the buffer held before: the
    // previous channel's input, or silence for the first.
    std::memset(input.get(), 0, size_t(count + taps) * sizeof(int16_t));
    const std::span<const int16_t> history(input.get(), size_t(count + taps));
    const std::span<int16_t> filtered(output.get(), size_t(count));
    for (int32_t i = 0; Channel* channel = Manager()->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        channel->FillBuffer(input.get(), RangeStart() - taps, count + taps);
        effects::FirFilter(history, kernel_, filtered);
        channel->ReplaceFrames(output.get(), count, RangeStart(), RangeEnd());
    }
    return B_OK;
}

const char* FilterAction::Name()
{
    return "FIR Filter";
}

}  // namespace glimmet
