#include "edit/FilterAction.h"

#include <cstring>
#include <mutex>
#include <span>

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

status_t FilterAction::FilterSelected()
{
    std::lock_guard guard(Manager()->DocumentLock());
    const int64_t count = FrameCount();
    if (count < 1)
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
