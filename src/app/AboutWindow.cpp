#include "app/AboutWindow.h"

#include <QScreen>

#include <cmath>

#include "app/AboutView.h"
#include "app/AnimationRunner.h"

namespace glimmet {

AboutWindow::AboutWindow(std::unique_ptr<AnimationRunner> runner)
    : QWidget(nullptr, Qt::Window | Qt::FramelessWindowHint)
{
    setObjectName(QStringLiteral("About Window"));
    setWindowTitle(QStringLiteral("About Window"));
    setWindowModality(Qt::ApplicationModal);
    setAttribute(Qt::WA_DeleteOnClose);
    setAttribute(Qt::WA_QuitOnClose, false);
    setFixedSize(kWidth, kHeight);
    if (const QScreen* screen = this->screen())
        move(CentredOn(screen->geometry()));
    view_ = new AboutView(this, std::move(runner));
    view_->setGeometry(rect());
    show();
}

AboutWindow::~AboutWindow() = default;

QPoint AboutWindow::CentredOn(const QRect& screen)
{
    // right() and bottom() are the screen's last pixels; halfway between its
    // first and last pixel, less half the box, rounds to an even margin.
    const double x = (screen.right() - screen.left()) * 0.5 - kWidth / 2.0;
    const double y = (screen.bottom() - screen.top()) * 0.5 - kHeight / 2.0;
    return screen.topLeft() + QPoint(int(std::lround(x)), int(std::lround(y)));
}

}  // namespace glimmet
