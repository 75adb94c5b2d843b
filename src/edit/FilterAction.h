#pragma once

#include <cstdint>
#include <vector>

#include "edit/CurveEffectAction.h"
#include "sound/SampleSlice.h"

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
    /// leaves the channels unchanged. B_NO_MEMORY when memory runs out.
    /// The range is filtered a block at a time, so its length costs only
    /// the blocks of the result: silence far from any data stays shared.
    status_t Go() override;
    const char* Name() override;
    const std::vector<double>& Kernel() const { return kernel_; }

private:
    /// Builds the kernel from the dialog and closes it, on the first run
    /// that can read it.
    void ReadDialog();
    status_t FilterSelected();
    /// The filtered range from source (taps frames of history, then the
    /// count frames of the range), a piece at a time; false when memory ran
    /// out.
    bool FilterSlice(const SampleSlice& source, int64_t count, int64_t taps, int16_t silenceBecomes,
        SampleSlice* result) const;

    std::vector<double> kernel_;
};

}  // namespace glimmet
