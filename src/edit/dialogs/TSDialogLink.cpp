#include "edit/dialogs/TSDialogLink.h"

#include "edit/dialogs/TSParameterWindow.h"

namespace glimmet {

TSDialogLink::TSDialogLink(TSParameterWindow* dialog) : dialog_(dialog) {}

TSDialogLink::~TSDialogLink()
{
    Quit();
}

bool TSDialogLink::Lock()
{
    // The dialog lives in the GUI thread with its action: there is nothing
    // to wait for, only whether it is still there.
    return !dialog_.isNull();
}

void TSDialogLink::Unlock() {}

StretchParameters TSDialogLink::GetParameters()
{
    return dialog_.isNull() ? StretchParameters() : dialog_->Parameters();
}

void TSDialogLink::Quit()
{
    if (!dialog_.isNull())
        dialog_->QuitLater();
    dialog_.clear();
}

}  // namespace glimmet
