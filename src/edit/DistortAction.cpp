#include "edit/DistortAction.h"

#include <span>

#include "edit/effects/Distortion.h"

namespace glimmet {

namespace {

// What a sample becomes when the dialog cannot be read: a curve at 1 maps
// every magnitude to 0.
double Silence(double)
{
    return 1.0;
}

}  // namespace

DistortAction::DistortAction(MessageTarget* window, std::unique_ptr<CurveDialog> dialog)
    : Action(window), dialog_(std::move(dialog))
{
}

DistortAction::~DistortAction()
{
    if (dialog_)
        dialog_->Quit();
}

status_t DistortAction::Go()
{
    if (InitCheck() != B_OK || !dialog_)
        return B_ERROR;
    const std::optional<effects::SplineCurve> curve = HideAndReadCurve(*dialog_);
    return TransformSelectedRanges([&curve](int16_t* samples, int64_t count) {
        const std::span<int16_t> range(samples, size_t(count));
        if (curve)
            effects::Distort(range, *curve);
        else
            effects::Distort(range, Silence);
    });
}

const char* DistortAction::Name()
{
    return "Distortion";
}

bool DistortAction::SupportsConfiguration()
{
    return true;
}

}  // namespace glimmet
