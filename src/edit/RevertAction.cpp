#include "edit/RevertAction.h"

#include "edit/RangeTransformer.h"
#include "edit/SampleTransform.h"

namespace glimmet {

status_t RevertAction::Go()
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    // Each output piece is the mirrored input piece reversed.
    return TransformSelectedRanges(PieceTransform{
        [](int16_t* samples, int64_t count, int64_t, int64_t) { SampleTransform::Revert(samples, count); },
        int16_t(0), true});
}

const char* RevertAction::Name()
{
    return "Revert";
}

}  // namespace glimmet
