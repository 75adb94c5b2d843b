#include "views/ContainerFrames.h"

#include <algorithm>

#include <QFontMetricsF>
#include <QPainter>

#include "views/PixelCanvas.h"
#include "views/ViewColors.h"

namespace glimmet {

namespace {

const QColor kSunkenDark(152, 152, 152);
const QColor kSunkenLight(255, 255, 255);
const QColor kFocus(0, 0, 229);

const char* const kEmptyText = "Drag files with audio tracks into here!";

}  // namespace

void ContainerFrames::DrawViewFrame(QPainter& painter, const ViewRect& viewFrame, bool focused)
{
    const ViewRect r = viewFrame.InsetBy(-1, -1);
    if (focused)
        DrawLines(painter, r, kFocus, kFocus);
    else
        DrawLines(painter, r, kSunkenDark, kSunkenLight);
}

void ContainerFrames::DrawEmptyState(QPainter& painter, const ViewRect& bounds, float sliderHeight, const QFont& font)
{
    const float bottom = bounds.bottom - sliderHeight;
    DrawLines(painter, {bounds.left, bounds.top, bounds.right, bottom}, kSunkenDark, kSunkenLight);
    Fill(painter, bounds.left + 1, bounds.top + 1, bounds.right - 1, bottom - 1, ViewBackgroundColor());
    const QString text = QString::fromUtf8(kEmptyText);
    const QFontMetricsF metrics(font);
    const qreal x = (bounds.left + bounds.right) / 2 - metrics.horizontalAdvance(text) / 2;
    const qreal baseline = (bounds.top + bottom) / 2;
    painter.setPen(Qt::black);
    painter.drawText(QPointF(x, baseline), text);
}

void ContainerFrames::Fill(QPainter& painter, float x0, float y0, float x1, float y1, const QColor& colour)
{
    const int left = PixelCanvas::RoundToPixel(std::min(x0, x1));
    const int right = PixelCanvas::RoundToPixel(std::max(x0, x1));
    const int top = PixelCanvas::RoundToPixel(std::min(y0, y1));
    const int bottom = PixelCanvas::RoundToPixel(std::max(y0, y1));
    painter.fillRect(QRect(QPoint(left, top), QPoint(right, bottom)), colour);
}

// Left and top in the first colour, right and bottom in the second.
void ContainerFrames::DrawLines(QPainter& painter, const ViewRect& r, const QColor& topLeft, const QColor& bottomRight)
{
    Fill(painter, r.left, r.bottom, r.left, r.top, topLeft);
    Fill(painter, r.left + 1, r.top, r.right, r.top, topLeft);
    Fill(painter, r.right, r.top + 1, r.right, r.bottom, bottomRight);
    Fill(painter, r.right - 1, r.bottom, r.left + 1, r.bottom, bottomRight);
}

}  // namespace glimmet
