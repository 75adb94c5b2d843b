#include "edit/FadeInAction.h"

#include "edit/RangeTransformer.h"
#include "edit/SampleTransform.h"

namespace glimmet {

status_t FadeInAction::Go()
{
    if (InitCheck() != B_OK)
        return B_NO_INIT;
    // Silence faded stays silence.
    return TransformSelectedRanges(PieceTransform{SampleTransform::FadeInPiece, int16_t(0)});
}

const char* FadeInAction::Name()
{
    return "Fade In";
}

}  // namespace glimmet
