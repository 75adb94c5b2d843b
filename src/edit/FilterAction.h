#pragma once

#include <cstdint>
#include <vector>

#include "edit/CurveEffectAction.h"

namespace glimmet {

/// "FIR Filter": runs a finite impulse response filter over the range of
/// every selected channel, with coefficients drawn as a curve in its dialog
/// and a tap count typed beside it.
///
/// The first run reads the dialog, builds the kernel and closes the dialog;
/// every redo filters again with that kernel. Undo and redo are the base
/// ones.
class FilterAction : public CurveEffectAction {
public:
    /// More taps than this are refused with a message, leaving the channels
    /// as they are: each tap costs one multiplication per frame, so a count
    /// typed by mistake could otherwise keep the editor busy for days.
    static constexpr int32_t kMaxTaps = 8192;

    using CurveEffectAction::CurveEffectAction;

    /// B_ERROR when the action is not bound. No kernel (a tap count of 0 or
    /// less, too many taps, or a first run whose dialog could not be read)
    /// leaves the channels unchanged. B_NO_MEMORY, changing nothing, when
    /// the working buffers cannot be had.
    status_t Go() override;
    const char* Name() override;
    const std::vector<double>& Kernel() const { return kernel_; }

private:
    /// Builds the kernel from the dialog and closes it, on the first run
    /// that can read it.
    void ReadDialog();
    status_t FilterSelected();

    std::vector<double> kernel_;
};

}  // namespace glimmet
