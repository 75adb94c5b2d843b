#pragma once

#include <memory>

#include "edit/Action.h"
#include "edit/CurveDialog.h"

namespace glimmet {

/// "Distortion": maps every selected sample's magnitude through the curve
/// drawn in its "Distort" dialog (a static transfer function, sign kept).
/// The dialog is hidden, not closed, by the first run, and every redo reads
/// its curve again. Undo and redo are the base ones.
class DistortAction : public Action {
public:
    /// dialog is the open "Distort" dialog, answering window; owned.
    DistortAction(MessageTarget* window, std::unique_ptr<CurveDialog> dialog);
    ~DistortAction() override;

    /// B_ERROR without touching anything when the action is not bound or has
    /// no dialog. A dialog that cannot be read turns every sample into 0.
    status_t Go() override;
    const char* Name() override;
    bool SupportsConfiguration() override;

    CurveDialog* Dialog() const { return dialog_.get(); }

private:
    std::unique_ptr<CurveDialog> dialog_;
};

}  // namespace glimmet
