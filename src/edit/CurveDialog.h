#pragma once

#include <cstdint>
#include <optional>

#include "edit/effects/SplineCurve.h"

namespace glimmet {

/// What an effect action needs of its parameter dialog: the curve the user
/// drew (and, for the FIR filter, the number of taps), and a say in when the
/// dialog goes away. The dialog itself is a window of the application layer;
/// the action owns it through this interface from its constructor on, and
/// deleting the interface closes the window if it is still open.
///
/// The dialog answers the document window directly ('acgo' from "Ok",
/// 'accc' from "Cancel" and the close box); the action only reads it.
class CurveDialog {
public:
    virtual ~CurveDialog() = default;

    /// Takes the dialog for reading. False when it can no longer be read
    /// (its window is gone); the action then goes on without it.
    virtual bool Lock() = 0;
    virtual void Unlock() = 0;

    /// The curve as it stands (the control's ValueAt). Caller holds the lock.
    virtual effects::SplineCurve Curve() = 0;
    /// The tap count typed in "Filter passes:", truncated toward zero; 0 for
    /// a dialog without that field. Caller holds the lock.
    virtual int32_t NumPasses() = 0;

    virtual bool IsHidden() = 0;
    /// Hides the dialog and keeps it for the action's redos.
    virtual void Hide() = 0;
    /// Closes the dialog for good; it can no longer be locked afterwards.
    virtual void Quit() = 0;
};

/// For the effects that read their curve again at every redo: hides the
/// dialog (it stays alive, hidden, for the redos) and returns the curve;
/// nothing when the dialog cannot be read.
///
/// The dialog lives in the same thread as the action, so nothing can change
/// it while the action runs: one reading per run gives the values a reading
/// per sample would.
inline std::optional<effects::SplineCurve> HideAndReadCurve(CurveDialog& dialog)
{
    if (!dialog.Lock())
        return std::nullopt;
    if (!dialog.IsHidden())
        dialog.Hide();
    effects::SplineCurve curve = dialog.Curve();
    dialog.Unlock();
    return curve;
}

}  // namespace glimmet
