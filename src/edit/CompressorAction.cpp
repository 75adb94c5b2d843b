#include "edit/CompressorAction.h"

#include "edit/effects/PeakDistortion.h"

namespace glimmet {

status_t CompressorAction::Go()
{
    // Without a curve every run stays unscaled, but the range still makes
    // its round trip through the working buffer.
    return ShapeSelectedRanges([](std::span<int16_t> samples, const effects::SplineCurve* curve) {
        if (curve != nullptr)
            effects::PeakDistort(samples, *curve);
    });
}

const char* CompressorAction::Name()
{
    return "Peak Distort";
}

}  // namespace glimmet
