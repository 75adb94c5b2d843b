#include "edit/dialogs/EParameterWindow.h"

namespace glimmet {

namespace {

const CurveParameterWindow::Kind kKind{QStringLiteral("Envelope"), QStringLiteral("envelope"),
    QStringLiteral("Selection"), QStringLiteral("400%"), 0.75f, 0.75f};

}  // namespace

EParameterWindow::EParameterWindow(QWidget* parent, MessageTarget* target) : CurveParameterWindow(parent, target, kKind) {}

double EParameterWindow::ValueAt(double x) const
{
    return CurveParameterWindow::ValueAt(x) * 4.0;
}

}  // namespace glimmet
