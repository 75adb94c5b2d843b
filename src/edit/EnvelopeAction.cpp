#include "edit/EnvelopeAction.h"

#include <span>

#include "edit/effects/EnvelopeShape.h"

namespace glimmet {

namespace {

// The gain when the dialog cannot be read: a curve at 1 is a gain of 0.
double Silence(double)
{
    return 1.0;
}

}  // namespace

EnvelopeAction::EnvelopeAction(MessageTarget* window, std::unique_ptr<CurveDialog> dialog)
    : Action(window), dialog_(std::move(dialog))
{
}

EnvelopeAction::~EnvelopeAction()
{
    if (dialog_)
        dialog_->Quit();
}

status_t EnvelopeAction::Go()
{
    if (InitCheck() != B_OK || !dialog_)
        return B_ERROR;
    const std::optional<effects::SplineCurve> curve = HideAndReadCurve(*dialog_);
    return TransformSelectedRanges([&curve](int16_t* samples, int64_t count) {
        const std::span<int16_t> range(samples, size_t(count));
        if (curve)
            effects::ApplySplineEnvelope(range, *curve);
        else
            effects::ApplyEnvelope(range, Silence);
    });
}

const char* EnvelopeAction::Name()
{
    return "Envelope";
}

bool EnvelopeAction::SupportsConfiguration()
{
    return true;
}

}  // namespace glimmet
