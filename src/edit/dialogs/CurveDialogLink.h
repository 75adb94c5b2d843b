#pragma once

#include <QPointer>

#include "edit/CurveDialog.h"

namespace glimmet {

class CurveParameterWindow;

/// An effect action's hold on its parameter dialog. The dialog is a child of
/// its document window, so the window may take it away first when it
/// closes; the link then finds nothing to read, as a dialog that can no
/// longer be locked. Otherwise the link closes the dialog when it ends.
class CurveDialogLink : public CurveDialog {
public:
    explicit CurveDialogLink(CurveParameterWindow* dialog);
    ~CurveDialogLink() override;
    CurveDialogLink(const CurveDialogLink&) = delete;
    CurveDialogLink& operator=(const CurveDialogLink&) = delete;

    bool Lock() override;
    void Unlock() override;
    effects::SplineCurve Curve() override;
    int32_t NumPasses() override;
    bool IsHidden() override;
    void Hide() override;
    void Quit() override;

    CurveParameterWindow* Dialog() const { return dialog_; }

private:
    QPointer<CurveParameterWindow> dialog_;
};

}  // namespace glimmet
