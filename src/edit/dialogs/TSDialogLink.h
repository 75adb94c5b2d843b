#pragma once

#include <QPointer>

#include "edit/StretchDialog.h"

namespace glimmet {

class TSParameterWindow;

/// A time stretch action's hold on its dialog. The dialog is a child of its
/// document window, which may take it away first when it closes; the link
/// then finds nothing to read. Otherwise the link closes the dialog when it
/// ends.
class TSDialogLink : public StretchDialog {
public:
    explicit TSDialogLink(TSParameterWindow* dialog);
    ~TSDialogLink() override;
    TSDialogLink(const TSDialogLink&) = delete;
    TSDialogLink& operator=(const TSDialogLink&) = delete;

    bool Lock() override;
    void Unlock() override;
    StretchParameters GetParameters() override;
    void Quit() override;

    TSParameterWindow* Dialog() const { return dialog_; }

private:
    QPointer<TSParameterWindow> dialog_;
};

}  // namespace glimmet
