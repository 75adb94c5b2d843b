#include "edit/RevertPhasesAction.h"

#include "edit/SampleTransform.h"

namespace glimmet {

status_t RevertPhasesAction::Go()
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    return TransformSelectedRanges(SampleTransform::RevertPhases);
}

const char* RevertPhasesAction::Name()
{
    return "Revert Phases";
}

}  // namespace glimmet
