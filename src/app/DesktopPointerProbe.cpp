#include "app/DesktopPointerProbe.h"

#include <QApplication>
#include <QCursor>
#include <QGuiApplication>
#include <QScreen>
#include <QWidget>

namespace glimmet {

QPoint DesktopPointerProbe::Position() const
{
    return QCursor::pos();
}

Qt::MouseButtons DesktopPointerProbe::Buttons() const
{
    return QGuiApplication::mouseButtons();
}

QWidget* DesktopPointerProbe::WidgetAt(QPoint screenPoint) const
{
    return QApplication::widgetAt(screenPoint);
}

QRect DesktopPointerProbe::MainScreen() const
{
    const QScreen* screen = QGuiApplication::primaryScreen();
    return screen != nullptr ? screen->geometry() : QRect();
}

}  // namespace glimmet
