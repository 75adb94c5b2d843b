#pragma once

#include <QString>

#include <cstdint>

#include "edit/dialogs/ParameterDialog.h"

class QLayout;
class QVBoxLayout;

namespace glimmet {

class SplineControl;

/// A parameter dialog of the curve effects: a curve control above the row
/// of "Cancel" and "Ok".
class CurveParameterWindow : public ParameterDialog {
    Q_OBJECT

public:
    /// The texts and the two end heights of one kind of dialog.
    struct Kind {
        QString title;
        QString controlName;
        /// Drawn along the bottom of the curve control.
        QString controlTitle;
        /// Drawn upwards along its left edge.
        QString controlLabel;
        float y0;
        float y1;
    };

    /// parent is the document window the dialog belongs to; target receives
    /// its answers (not owned, outlives the dialog).
    CurveParameterWindow(QWidget* parent, MessageTarget* target, const Kind& kind);
    ~CurveParameterWindow() override;

    /// The height of the curve at x: 1 - the control's value.
    virtual double ValueAt(double x) const;
    /// The FIR filter's tap count; 0 where the dialog has no such field.
    virtual int32_t NumPasses() const;

    SplineControl* Control() const { return control_; }

protected:
    /// Inserts a row between the curve and the buttons.
    void AddRowAboveButtons(QLayout* row);

private:
    SplineControl* control_;
    QVBoxLayout* column_;
};

}  // namespace glimmet
