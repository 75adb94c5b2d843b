#include "edit/RevertAction.h"

#include "edit/SampleTransform.h"

namespace glimmet {

status_t RevertAction::Go()
{
    if (InitCheck() != B_OK)
        return B_ERROR;
    return TransformSelectedRanges(SampleTransform::Revert);
}

const char* RevertAction::Name()
{
    return "Revert";
}

}  // namespace glimmet
