#pragma once

#include "edit/CurveEffectAction.h"

namespace glimmet {

/// "Peak Distort": scales each run of same-signed samples of every selected channel so that its local peak follows the curve drawn in its "Peak Distort" dialog.
/// The dialog is hidden, not closed, by the first run, and every redo reads
/// its curve again. Undo and redo are the base ones.
class CompressorAction : public CurveEffectAction {
public:
    using CurveEffectAction::CurveEffectAction;

    /// B_ERROR without touching anything when the action is not bound or has
    /// no dialog. A dialog that cannot be read leaves every run as it is.
    status_t Go() override;
    const char* Name() override;
};

}  // namespace glimmet
