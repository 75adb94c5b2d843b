#pragma once

#include "edit/CurveEffectAction.h"

namespace glimmet {

/// "Distortion": maps every selected sample's magnitude through the curve
/// drawn in its "Distort" dialog (a static transfer function, sign kept).
/// The dialog is hidden, not closed, by the first run, and every redo reads
/// its curve again. Undo and redo are the base ones.
class DistortAction : public CurveEffectAction {
public:
    using CurveEffectAction::CurveEffectAction;

    /// B_ERROR without touching anything when the action is not bound or has
    /// no dialog. A dialog that cannot be read turns every sample into 0.
    status_t Go() override;
    const char* Name() override;
};

}  // namespace glimmet
