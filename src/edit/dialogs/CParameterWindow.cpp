#include "edit/dialogs/CParameterWindow.h"

namespace glimmet {

namespace {

const CurveParameterWindow::Kind kKind{QStringLiteral("Peak Distort"), QStringLiteral("compressor"),
    QStringLiteral("Local Peak"), QStringLiteral("Gain"), 1.0f, 0.0f};

}  // namespace

CParameterWindow::CParameterWindow(QWidget* parent, MessageTarget* target) : CurveParameterWindow(parent, target, kKind) {}

}  // namespace glimmet
