#pragma once

#include "edit/dialogs/CurveParameterWindow.h"

namespace glimmet {

class SpinButton;

/// "FIR Filter": the filter's coefficients drawn as a curve, and the number
/// of coefficients typed in "Filter passes:" (10 at first).
class FParameterWindow : public CurveParameterWindow {
    Q_OBJECT

public:
    FParameterWindow(QWidget* parent, MessageTarget* target);

    /// The typed value truncated toward zero.
    int32_t NumPasses() const override;
    SpinButton* PassesField() const { return passes_; }

private:
    SpinButton* passes_;
};

}  // namespace glimmet
