#include "edit/FilterAction.h"

#include <algorithm>
#include <vector>
#include <mutex>
#include <span>

#include "edit/PieceTransformWriter.h"
#include "edit/RangeTransformer.h"
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
    const int64_t taps = int64_t(kernel_.size());
    // Every output frame is the same function of the taps input frames
    // before it and itself, so a frame whose inputs are all silence comes
    // out as this one value (0 unless a coefficient is not finite).
    std::vector<int16_t> zeros(size_t(taps) + 1, 0);
    int16_t silenceBecomes = 0;
    effects::FirFilter(zeros, kernel_, std::span<int16_t>(&silenceBecomes, 1));
    // The filter reads the taps frames before the range as history; a
    // channel whose copy fails filters what the previous channel read, or
    // silence for the first.
    SliceTransform filter;
    filter.lookBehind = taps;
    filter.keepsSource = true;
    filter.build = [this, taps, silenceBecomes](const SampleSlice& source, int64_t count, SampleSlice* result) {
        return FilterSlice(source, count, taps, silenceBecomes, result);
    };
    RangeTransformer transformer(Manager(), RangeStart(), RangeEnd());
    transformer.TransformSelected(filter);
    return transformer.InitCheck();
}

bool FilterAction::FilterSlice(const SampleSlice& source, int64_t count, int64_t taps, int16_t silenceBecomes,
    SampleSlice* result) const
{
    constexpr int64_t kPiece = BlockBuilder::kBlockSamples;
    // One piece of output and the frames it reads: its history, then itself.
    std::vector<int16_t> input(size_t(taps + kPiece));
    std::vector<int16_t> output(static_cast<size_t>(kPiece));
    PieceTransformWriter writer;
    for (int64_t first = 0; first < count && writer.Ok(); first += kPiece) {
        const int64_t n = std::min(kPiece, count - first);
        if (RangeTransformer::PieceIsSilent(source, first, taps + n)) {
            writer.PutRepeated(silenceBecomes, n);
            continue;
        }
        RangeTransformer::CopyPiece(source, first, taps + n, input.data());
        effects::FirFilter(std::span<const int16_t>(input.data(), size_t(taps + n)), kernel_,
            std::span<int16_t>(output.data(), size_t(n)));
        for (int64_t j = 0; j < n; j++)
            writer.Put(output[size_t(j)]);
    }
    if (!writer.Ok())
        return false;
    *result = SampleSlice();
    result->blocks = writer.Finish();
    return writer.Ok();
}

const char* FilterAction::Name()
{
    return "FIR Filter";
}

}  // namespace glimmet
