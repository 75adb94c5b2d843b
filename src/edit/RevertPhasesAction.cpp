#include "edit/RevertPhasesAction.h"

#include "edit/RangeTransformer.h"
#include "edit/SampleTransform.h"

namespace glimmet {

status_t RevertPhasesAction::Go()
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    // -0 is 0: silence stays silence.
    return TransformSelectedRanges(PieceTransform{
        [](int16_t* samples, int64_t count, int64_t, int64_t) { SampleTransform::RevertPhases(samples, count); },
        int16_t(0)});
}

const char* RevertPhasesAction::Name()
{
    return "Revert Phases";
}

}  // namespace glimmet
