#include "edit/dialogs/CurveDialogLink.h"

#include "edit/dialogs/CurveParameterWindow.h"
#include "views/SplineControl.h"

namespace glimmet {

CurveDialogLink::CurveDialogLink(CurveParameterWindow* dialog) : dialog_(dialog) {}

CurveDialogLink::~CurveDialogLink()
{
    Quit();
}

bool CurveDialogLink::Lock()
{
    // Dialogs live in the GUI thread with their actions: there is nothing to
    // wait for, only whether the dialog is still there.
    return !dialog_.isNull();
}

void CurveDialogLink::Unlock() {}

effects::SplineCurve CurveDialogLink::Curve()
{
    if (dialog_.isNull())
        return effects::SplineCurve();
    return dialog_->Control()->Curve();
}

int32_t CurveDialogLink::NumPasses()
{
    return dialog_.isNull() ? 0 : dialog_->NumPasses();
}

bool CurveDialogLink::IsHidden()
{
    return dialog_.isNull() || dialog_->isHidden();
}

void CurveDialogLink::Hide()
{
    if (!dialog_.isNull())
        dialog_->hide();
}

void CurveDialogLink::Quit()
{
    if (!dialog_.isNull())
        dialog_->QuitLater();
    dialog_.clear();
}

}  // namespace glimmet
