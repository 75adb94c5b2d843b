#pragma once

#include "edit/dialogs/CurveParameterWindow.h"

namespace glimmet {

/// "Distort": The transfer curve of Distort: each magnitude's output height.
class DParameterWindow : public CurveParameterWindow {
    Q_OBJECT

public:
    DParameterWindow(QWidget* parent, MessageTarget* target);
};

}  // namespace glimmet
