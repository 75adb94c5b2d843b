#pragma once

#include <QPoint>
#include <QRect>
#include <Qt>

class QWidget;

namespace glimmet {

/// What bubble help reads of the desktop at every poll: where the pointer
/// is, which buttons are down, which widget is under a point, and the main
/// screen. Tests give the helper a probe of their own, so that the pointer
/// can rest or move exactly when a test says so.
class PointerProbe {
public:
    virtual ~PointerProbe() = default;

    /// The pointer's position in screen coordinates.
    virtual QPoint Position() const = 0;
    virtual Qt::MouseButtons Buttons() const = 0;
    /// The innermost visible widget of this application at a screen point,
    /// or null.
    virtual QWidget* WidgetAt(QPoint screenPoint) const = 0;
    /// The main screen's frame; right() and bottom() are its last pixels.
    virtual QRect MainScreen() const = 0;
};

}  // namespace glimmet
