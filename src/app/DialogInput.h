#pragma once

#include <QPoint>
#include <QString>

#include <string>

class QWidget;

namespace glimmet {

class SplineControl;

/// Input events for a widget, built as the windowing system would deliver
/// them, for scripts that work dialogs as a user does.
class DialogInput {
public:
    /// Press and release of button at position (widget coordinates).
    static void Click(QWidget* widget, QPoint position, Qt::MouseButton button);
    /// A click in the middle of the widget.
    static void ClickCentre(QWidget* widget);
    /// Press at from, moves towards to in steps of at most 3 pixels, release
    /// at to.
    static void Drag(QWidget* widget, QPoint from, QPoint to);
    /// Select-all, then each character of text as a key press and release.
    static void TypeReplacing(QWidget* widget, const QString& text);

    /// The pixel of the control's curve area nearest to the normalised
    /// point (x, y).
    static QPoint CurvePixel(const SplineControl& control, double x, double y);

    /// The shortest decimal text that reads back as exactly value.
    static std::string ExactNumber(double value);
};

}  // namespace glimmet
