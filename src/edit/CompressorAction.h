#pragma once

#include <memory>

#include "edit/Action.h"
#include "edit/CurveDialog.h"

namespace glimmet {

/// "Peak Distort": scales each run of same-signed samples of every selected channel so that its local peak follows the curve drawn in its "Peak Distort" dialog.
/// The dialog is hidden, not closed, by the first run, and every redo reads
/// its curve again. Undo and redo are the base ones.
class CompressorAction : public Action {
public:
    /// dialog is the open "Peak Distort" dialog, answering window; owned.
    CompressorAction(MessageTarget* window, std::unique_ptr<CurveDialog> dialog);
    ~CompressorAction() override;

    /// B_ERROR without touching anything when the action is not bound or has
    /// no dialog. A dialog that cannot be read leaves every run as it is.
    status_t Go() override;
    const char* Name() override;
    bool SupportsConfiguration() override;

    CurveDialog* Dialog() const { return dialog_.get(); }

private:
    std::unique_ptr<CurveDialog> dialog_;
};

}  // namespace glimmet
