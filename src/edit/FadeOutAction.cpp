#include "edit/FadeOutAction.h"

#include "edit/SampleTransform.h"

namespace glimmet {

status_t FadeOutAction::Go()
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    return TransformSelectedRanges(SampleTransform::FadeOut);
}

const char* FadeOutAction::Name()
{
    return "Fade Out";
}

}  // namespace glimmet
