#include "edit/dialogs/SpinButton.h"

#include <limits>

namespace glimmet {

SpinButton::SpinButton(QWidget* parent) : QDoubleSpinBox(parent)
{
    // No bounds of its own: the reader decides what a value means. The
    // int32 range is what any reader can take in.
    setRange(double(std::numeric_limits<int32_t>::min()), double(std::numeric_limits<int32_t>::max()));
    setDecimals(6);
    setSingleStep(1.0);
    setKeyboardTracking(true);
}

QString SpinButton::textFromValue(double value) const
{
    return locale().toString(value, 'g', 16);
}

}  // namespace glimmet
