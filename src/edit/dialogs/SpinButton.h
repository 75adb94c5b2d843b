#pragma once

#include <QDoubleSpinBox>

namespace glimmet {

/// A number field with arrows that takes any value, whole or not, and shows
/// it without trailing zeros ("10", "2.5"): the tap count of the FIR filter
/// is typed here and truncated by whoever reads it.
class SpinButton : public QDoubleSpinBox {
    Q_OBJECT

public:
    explicit SpinButton(QWidget* parent = nullptr);

protected:
    QString textFromValue(double value) const override;
};

}  // namespace glimmet
