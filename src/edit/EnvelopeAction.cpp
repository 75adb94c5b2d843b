#include "edit/EnvelopeAction.h"

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
    return ShapeSelectedRanges([](std::span<int16_t> samples, const effects::SplineCurve* curve) {
        if (curve != nullptr)
            effects::ApplyEnvelope(samples, *curve);
        else
            effects::ApplyEnvelope(samples, Silence);
    });
}

const char* EnvelopeAction::Name()
{
    return "Envelope";
}

}  // namespace glimmet
