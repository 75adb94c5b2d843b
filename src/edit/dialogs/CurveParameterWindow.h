#pragma once

#include <QDialog>
#include <QString>

#include <cstdint>

class QPushButton;
class QVBoxLayout;

namespace glimmet {

class MessageTarget;
class SplineControl;

/// A parameter dialog of the curve effects: a curve control above a row of
/// "Cancel" and "Ok". It is modal for its document window only, so other
/// document windows keep working while it is open.
///
/// It answers the document window, not its action: "Ok" (the default
/// button) posts 'acgo', "Cancel", the close box and Escape post 'accc'.
/// Closing it therefore only asks; the window drops the action, and the
/// action takes the dialog away.
class CurveParameterWindow : public QDialog {
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
    QPushButton* OkButton() const { return ok_; }
    QPushButton* CancelButton() const { return cancel_; }

    /// Brings the dialog up at its place on the screen, at least as large as
    /// its contents need.
    void ShowAtHome();

protected:
    /// Inserts a row between the curve and the buttons.
    void AddRowAboveButtons(QLayout* row);

    void closeEvent(QCloseEvent* event) override;
    void reject() override;

private:
    void Answer(uint32_t what);

    MessageTarget* target_;
    SplineControl* control_;
    QVBoxLayout* column_;
    QPushButton* cancel_;
    QPushButton* ok_;
};

}  // namespace glimmet
