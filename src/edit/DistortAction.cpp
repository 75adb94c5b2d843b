#include "edit/DistortAction.h"

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

status_t DistortAction::Go()
{
    return ShapeSelectedRanges([](std::span<int16_t> samples, const effects::SplineCurve* curve) {
        if (curve != nullptr)
            effects::Distort(samples, *curve);
        else
            effects::Distort(samples, Silence);
    });
}

const char* DistortAction::Name()
{
    return "Distortion";
}

}  // namespace glimmet
