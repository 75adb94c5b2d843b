#include "edit/FadeInAction.h"

#include "edit/SampleTransform.h"

namespace glimmet {

status_t FadeInAction::Go()
{
    if (InitCheck() != B_OK)
        return B_NO_INIT;
    return TransformSelectedRanges(SampleTransform::FadeIn);
}

const char* FadeInAction::Name()
{
    return "Fade In";
}

}  // namespace glimmet
