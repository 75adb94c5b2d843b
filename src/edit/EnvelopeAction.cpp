#include "edit/EnvelopeAction.h"

#include <optional>
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

status_t EnvelopeAction::Go()
{
    if (InitCheck() != B_OK || Dialog() == nullptr)
        return B_ERROR;
    const std::optional<effects::SplineCurve> curve = HideAndReadCurve(*Dialog());
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

}  // namespace glimmet
