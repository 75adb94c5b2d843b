#include "edit/DistortAction.h"

#include <memory>
#include <optional>
#include <span>

#include "edit/RangeTransformer.h"
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
    if (InitCheck() != B_OK || Dialog() == nullptr)
        return B_ERROR;
    const std::optional<effects::SplineCurve> curve = HideAndReadCurve(*Dialog());
    // A sample's result depends on its value alone, so one table serves the
    // whole range, piece by piece; silence becomes whatever 0 maps to.
    std::shared_ptr<const effects::DistortionTable> table;
    if (curve) {
        const effects::SplineCurve& drawn = *curve;
        table = std::make_shared<const effects::DistortionTable>(drawn);
    } else {
        double (*silence)(double) = Silence;
        table = std::make_shared<const effects::DistortionTable>(silence);
    }
    int16_t zero = 0;
    table->Apply(std::span<int16_t>(&zero, 1));
    return TransformSelectedRanges(PieceTransform{
        [table](int16_t* samples, int64_t count, int64_t, int64_t) {
            table->Apply(std::span<int16_t>(samples, size_t(count)));
        },
        zero});
}

const char* DistortAction::Name()
{
    return "Distortion";
}

}  // namespace glimmet
