#pragma once

#include "edit/CurveEffectAction.h"

namespace glimmet {

/// "Envelope": multiplies the range of every selected channel by a gain that follows the curve drawn in its "Envelope" dialog, 0 to 400 % over the selection.
/// The dialog is hidden, not closed, by the first run, and every redo reads
/// its curve again. Undo and redo are the base ones.
class EnvelopeAction : public CurveEffectAction {
public:
    using CurveEffectAction::CurveEffectAction;

    /// B_ERROR without touching anything when the action is not bound or has
    /// no dialog. A dialog that cannot be read turns every sample into 0.
    status_t Go() override;
    const char* Name() override;
};

}  // namespace glimmet
