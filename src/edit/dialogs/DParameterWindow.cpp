#include "edit/dialogs/DParameterWindow.h"

namespace glimmet {

namespace {

const CurveParameterWindow::Kind kKind{QStringLiteral("Distort"), QStringLiteral("compressor"),
    QStringLiteral("Aplitudes"), QStringLiteral("Gain"), 1.0f, 0.0f};

}  // namespace

DParameterWindow::DParameterWindow(QWidget* parent, MessageTarget* target) : CurveParameterWindow(parent, target, kKind) {}

}  // namespace glimmet
