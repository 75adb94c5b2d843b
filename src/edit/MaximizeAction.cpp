#include "edit/MaximizeAction.h"

#include <cstdlib>
#include <mutex>

#include "edit/RangeTransformer.h"
#include "edit/SampleTransform.h"
#include "sound/ChannelManager.h"

namespace glimmet {

namespace {

// Ranges whose peak is already at full scale, or that hold -32768, are left
// as they are.
constexpr int32_t kLargestScalablePeak = 32766;

}  // namespace

status_t MaximizeAction::Go()
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    // Both passes are one step for the playback thread, and share one
    // working buffer.
    std::lock_guard guard(Manager()->DocumentLock());
    const bool recorded = RecordGoInput();
    RangeTransformer transformer(Manager(), RangeStart(), RangeEnd());
    int16_t peak = 0;
    // Silence never raises the peak.
    transformer.InspectSelected(
        [&peak](const int16_t* samples, int64_t count) { peak = SampleTransform::Peak(samples, count, peak); }, true);
    if (std::abs(int32_t(peak)) <= kLargestScalablePeak) {
        const float factor = SampleTransform::MaximizeFactor(peak);
        // 0 times any factor, infinity included, stores 0.
        transformer.TransformSelected(PieceTransform{
            [factor](int16_t* samples, int64_t count, int64_t, int64_t) {
                SampleTransform::Scale(samples, count, factor);
            },
            int16_t(0)});
    }
    // A range left as it was is a result too: a redo then puts back the
    // very blocks the range holds.
    RecordGoOutput(recorded && transformer.InitCheck() == B_OK);
    return transformer.InitCheck();
}

const char* MaximizeAction::Name()
{
    return "Maximize";
}

}  // namespace glimmet
