#pragma once

#include "edit/dialogs/CurveParameterWindow.h"

namespace glimmet {

/// "Peak Distort": The curve of Peak Distort: where each half-wave's local peak goes.
class CParameterWindow : public CurveParameterWindow {
    Q_OBJECT

public:
    CParameterWindow(QWidget* parent, MessageTarget* target);
};

}  // namespace glimmet
