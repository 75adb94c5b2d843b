#include "edit/CompressorAction.h"

#include <memory>
#include <mutex>
#include <optional>

#include "edit/PeakDistortPass.h"
#include "edit/RangeTransformer.h"
#include "edit/effects/PeakDistortion.h"
#include "sound/ChannelManager.h"

namespace glimmet {

status_t CompressorAction::Go()
{
    if (InitCheck() != B_OK || Dialog() == nullptr)
        return B_ERROR;
    const std::optional<effects::SplineCurve> curve = HideAndReadCurve(*Dialog());
    // A run's gain depends on its peak alone, so one table serves every run
    // of every channel. Without a curve every run stays unscaled, but the
    // range still makes its round trip through the working buffer (a
    // channel whose copy fails gets the previous channel's range).
    std::shared_ptr<const effects::PeakGains> gains;
    if (curve) {
        const effects::SplineCurve& drawn = *curve;
        gains = std::make_shared<const effects::PeakGains>(drawn);
    }
    SliceTransform shape;
    shape.build = [gains](const SampleSlice& source, int64_t, SampleSlice* result) {
        if (gains == nullptr) {
            *result = source;
            return true;
        }
        return PeakDistortPass(*gains).Run(source, result);
    };
    std::lock_guard guard(Manager()->DocumentLock());
    RangeTransformer transformer(Manager(), RangeStart(), RangeEnd());
    transformer.TransformSelected(shape);
    return transformer.InitCheck();
}

const char* CompressorAction::Name()
{
    return "Peak Distort";
}

}  // namespace glimmet
