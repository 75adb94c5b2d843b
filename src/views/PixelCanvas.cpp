#include "views/PixelCanvas.h"

#include <algorithm>
#include <cmath>

namespace glimmet {

int PixelCanvas::RoundToPixel(float value)
{
    if (std::isnan(value))
        return 0;
    const float rounded = std::floor(value + 0.5f);
    // Far outside any image; clamped so that the conversion stays defined.
    return int(std::clamp(rounded, -1.0e6f, 1.0e6f));
}

void PixelCanvas::StrokeLine(float x0, float y0, float x1, float y1, QRgb colour)
{
    const int ax = RoundToPixel(x0);
    const int bx = RoundToPixel(x1);
    const int ay = RoundToPixel(y0);
    const int by = RoundToPixel(y1);
    FillPixels(std::min(ax, bx), std::min(ay, by), std::max(ax, bx), std::max(ay, by), colour);
}

void PixelCanvas::FillRect(const ViewRect& rect, QRgb colour)
{
    FillPixels(RoundToPixel(rect.left), RoundToPixel(rect.top), RoundToPixel(rect.right), RoundToPixel(rect.bottom),
               colour);
}

void PixelCanvas::FillPixels(int left, int top, int right, int bottom, QRgb colour)
{
    left = std::max(left, 0);
    top = std::max(top, 0);
    right = std::min(right, image_.width() - 1);
    bottom = std::min(bottom, image_.height() - 1);
    if (left > right || top > bottom)
        return;
    for (int y = top; y <= bottom; ++y) {
        QRgb* line = reinterpret_cast<QRgb*>(image_.scanLine(y));
        std::fill(line + left, line + right + 1, colour);
    }
}

}  // namespace glimmet
