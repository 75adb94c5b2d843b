#include "edit/FadeOutAction.h"

#include "edit/RangeTransformer.h"
#include "edit/SampleTransform.h"

namespace glimmet {

status_t FadeOutAction::Go()
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    // Silence faded stays silence.
    return TransformSelectedRanges(PieceTransform{SampleTransform::FadeOutPiece, int16_t(0)});
}

const char* FadeOutAction::Name()
{
    return "Fade Out";
}

}  // namespace glimmet
