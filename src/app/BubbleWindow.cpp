#include "app/BubbleWindow.h"

#include <QFontMetrics>
#include <QPainter>

#include <algorithm>

namespace glimmet {

BubbleWindow::BubbleWindow()
    : QWidget(nullptr, Qt::ToolTip | Qt::FramelessWindowHint | Qt::WindowDoesNotAcceptFocus)
{
    setAttribute(Qt::WA_ShowWithoutActivating);
    setAttribute(Qt::WA_TransparentForMouseEvents);
    setAttribute(Qt::WA_OpaquePaintEvent);
    setAttribute(Qt::WA_QuitOnClose, false);
    setFocusPolicy(Qt::NoFocus);
    setGeometry(-100, -100, 50, 50);
}

void BubbleWindow::SetText(const QString& text)
{
    text_ = text;
    // An empty text is still one (empty) line, as in any text view.
    lines_ = text.split(QLatin1Char('\n'));
    setWindowTitle(text);
    update();
}

int BubbleWindow::TextHeight() const
{
    return int(lines_.size()) * QFontMetrics(font()).lineSpacing();
}

int BubbleWindow::MaxLineWidth() const
{
    const QFontMetrics metrics(font());
    int widest = 0;
    for (const QString& line : lines_)
        widest = std::max(widest, metrics.horizontalAdvance(line));
    return widest;
}

void BubbleWindow::paintEvent(QPaintEvent*)
{
    QPainter painter(this);
    painter.fillRect(rect(), Background());
    painter.setPen(TextColor());
    const QFontMetrics metrics(font());
    int baseline = kInset + metrics.ascent();
    for (const QString& line : lines_) {
        painter.drawText(kInset, baseline, line);
        baseline += metrics.lineSpacing();
    }
}

}  // namespace glimmet
