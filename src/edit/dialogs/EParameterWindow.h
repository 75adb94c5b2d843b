#pragma once

#include "edit/dialogs/CurveParameterWindow.h"

namespace glimmet {

/// "Envelope": The gain over the selection, 0 to 400 %; the flat curve it starts with is a gain of exactly 1.
class EParameterWindow : public CurveParameterWindow {
    Q_OBJECT

public:
    EParameterWindow(QWidget* parent, MessageTarget* target);
    /// The gain at x: 4 times the height of the curve.
    double ValueAt(double x) const override;
};

}  // namespace glimmet
