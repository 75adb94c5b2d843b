#pragma once

#include <memory>

#include "edit/Action.h"
#include "edit/CurveDialog.h"

namespace glimmet {

/// "Envelope": multiplies the range of every selected channel by a gain that follows the curve drawn in its "Envelope" dialog, 0 to 400 % over the selection.
/// The dialog is hidden, not closed, by the first run, and every redo reads
/// its curve again. Undo and redo are the base ones.
class EnvelopeAction : public Action {
public:
    /// dialog is the open "Envelope" dialog, answering window; owned.
    EnvelopeAction(MessageTarget* window, std::unique_ptr<CurveDialog> dialog);
    ~EnvelopeAction() override;

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
