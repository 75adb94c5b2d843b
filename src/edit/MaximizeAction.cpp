#include "edit/MaximizeAction.h"

#include <cstdlib>
#include <mutex>

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
    // Both passes form one step for the playback thread.
    std::lock_guard guard(Manager()->DocumentLock());
    int16_t peak = 0;
    status_t status = TransformSelectedRanges(
        [&peak](int16_t* samples, int64_t count) { peak = SampleTransform::Peak(samples, count, peak); },
        false);
    if (status != B_OK || std::abs(int32_t(peak)) > kLargestScalablePeak)
        return status;
    const float factor = SampleTransform::MaximizeFactor(peak);
    return TransformSelectedRanges(
        [factor](int16_t* samples, int64_t count) { SampleTransform::Scale(samples, count, factor); });
}

const char* MaximizeAction::Name()
{
    return "Maximize";
}

}  // namespace glimmet
