#include "edit/CompressorAction.h"

#include <span>

#include "edit/effects/PeakDistortion.h"

namespace glimmet {

CompressorAction::CompressorAction(MessageTarget* window, std::unique_ptr<CurveDialog> dialog)
    : Action(window), dialog_(std::move(dialog))
{
}

CompressorAction::~CompressorAction()
{
    if (dialog_)
        dialog_->Quit();
}

status_t CompressorAction::Go()
{
    if (InitCheck() != B_OK || !dialog_)
        return B_ERROR;
    const std::optional<effects::SplineCurve> curve = HideAndReadCurve(*dialog_);
    // Without a curve every run stays unscaled, but the range still makes
    // its round trip through the working buffer.
    return TransformSelectedRanges([&curve](int16_t* samples, int64_t count) {
        if (curve)
            effects::PeakDistort(std::span<int16_t>(samples, size_t(count)), *curve);
    });
}

const char* CompressorAction::Name()
{
    return "Peak Distort";
}

bool CompressorAction::SupportsConfiguration()
{
    return true;
}

}  // namespace glimmet
