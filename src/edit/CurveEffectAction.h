#pragma once

#include <functional>
#include <memory>
#include <span>

#include "edit/Action.h"
#include "edit/CurveDialog.h"

namespace glimmet {

/// What the effects drawn as a curve share: an action created with its
/// parameter dialog open, owning it until the dialog is closed for good
/// (by the action's end, or by an effect that needs it only once). The
/// window waits for the dialog's answer before it records and runs the
/// action. Undo and redo are the base ones.
class CurveEffectAction : public Action {
public:
    /// dialog is the effect's open dialog, answering window; owned.
    CurveEffectAction(MessageTarget* window, std::unique_ptr<CurveDialog> dialog);
    /// Closes the dialog if the action still has it.
    ~CurveEffectAction() override;

    bool SupportsConfiguration() override;

    CurveDialog* Dialog() const { return dialog_.get(); }

protected:
    /// Rewrites one range in place; curve is null when the dialog could not
    /// be read.
    using Shape = std::function<void(std::span<int16_t> samples, const effects::SplineCurve* curve)>;

    /// For the effects that read their curve at every run: hides the dialog
    /// (kept for the redos), reads its curve and runs shape over the range of
    /// every selected channel. B_ERROR, touching nothing, when the action is
    /// not bound or has no dialog.
    status_t ShapeSelectedRanges(const Shape& shape);

    /// Closes the dialog for good.
    void CloseDialog();

private:
    std::unique_ptr<CurveDialog> dialog_;
};

}  // namespace glimmet
