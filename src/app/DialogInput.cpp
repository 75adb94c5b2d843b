#include "app/DialogInput.h"

#include <QApplication>
#include <QKeyEvent>
#include <QMouseEvent>
#include <QWidget>

#include <algorithm>
#include <charconv>
#include <cmath>

#include "views/SplineControl.h"

namespace glimmet {

namespace {

void SendMouse(QWidget* widget, QEvent::Type type, QPoint position, Qt::MouseButton button,
    Qt::MouseButtons held)
{
    const QPointF local(position);
    const QPointF global(widget->mapToGlobal(position));
    QMouseEvent event(type, local, local, global, button, held, Qt::NoModifier);
    QApplication::sendEvent(widget, &event);
}

void SendKey(QWidget* widget, int key, Qt::KeyboardModifiers modifiers, const QString& text)
{
    QKeyEvent press(QEvent::KeyPress, key, modifiers, text);
    QApplication::sendEvent(widget, &press);
    QKeyEvent release(QEvent::KeyRelease, key, modifiers, text);
    QApplication::sendEvent(widget, &release);
}

}  // namespace

void DialogInput::Click(QWidget* widget, QPoint position, Qt::MouseButton button)
{
    SendMouse(widget, QEvent::MouseButtonPress, position, button, button);
    SendMouse(widget, QEvent::MouseButtonRelease, position, button, Qt::NoButton);
}

void DialogInput::ClickCentre(QWidget* widget)
{
    Click(widget, widget->rect().center(), Qt::LeftButton);
}

void DialogInput::Drag(QWidget* widget, QPoint from, QPoint to)
{
    constexpr int kStep = 3;
    SendMouse(widget, QEvent::MouseButtonPress, from, Qt::LeftButton, Qt::LeftButton);
    const QPoint delta = to - from;
    const int steps = std::max(1, (std::max(std::abs(delta.x()), std::abs(delta.y())) + kStep - 1) / kStep);
    for (int i = 1; i <= steps; i++) {
        const QPoint at(from.x() + delta.x() * i / steps, from.y() + delta.y() * i / steps);
        SendMouse(widget, QEvent::MouseMove, at, Qt::NoButton, Qt::LeftButton);
    }
    SendMouse(widget, QEvent::MouseButtonRelease, to, Qt::LeftButton, Qt::NoButton);
}

void DialogInput::TypeReplacing(QWidget* widget, const QString& text)
{
    widget->setFocus(Qt::OtherFocusReason);
    SendKey(widget, Qt::Key_A, Qt::ControlModifier, QString());
    for (const QChar character : text)
        SendKey(widget, character.unicode(), Qt::NoModifier, QString(character));
}

QPoint DialogInput::CurvePixel(const SplineControl& control, double x, double y)
{
    const QRectF area = control.CurveArea();
    const QPointF position = control.ViewPosition(QPointF(x, y));
    const auto nearest = [](double value, double low, double high) {
        const int lowest = int(std::ceil(low));
        const int highest = std::max(lowest, int(std::floor(high)));
        return std::clamp(int(std::lround(value)), lowest, highest);
    };
    return QPoint(nearest(position.x(), area.left(), area.right()), nearest(position.y(), area.top(), area.bottom()));
}

std::string DialogInput::ExactNumber(double value)
{
    char text[64];
    const std::to_chars_result result = std::to_chars(text, text + sizeof text, value);
    return std::string(text, result.ptr);
}

}  // namespace glimmet
