#pragma once

#include "app/PointerProbe.h"

namespace glimmet {

/// The real desktop: Qt's cursor position, the buttons Qt knows to be down,
/// the widget Qt finds at a point (which accounts for stacking and for
/// covered parts of widgets), and the primary screen.
class DesktopPointerProbe : public PointerProbe {
public:
    QPoint Position() const override;
    Qt::MouseButtons Buttons() const override;
    QWidget* WidgetAt(QPoint screenPoint) const override;
    QRect MainScreen() const override;
};

}  // namespace glimmet
