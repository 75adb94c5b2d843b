#pragma once

#include <QImage>

#include "views/ViewRect.h"

namespace glimmet {

/// Pixel-exact drawing of horizontal and vertical lines and filled
/// rectangles into an RGB32 image, with the original toolkit's coordinates:
/// a point names the pixel it is centred on, both ends of a line are drawn,
/// and fractional coordinates are rounded to the nearest pixel (halves up).
/// Everything outside the image is clipped.
class PixelCanvas {
public:
    explicit PixelCanvas(QImage& image) : image_(image) {}

    /// Draws an axis-parallel line; a slanted one is drawn as the rectangle
    /// its ends span (the controls here draw only axis-parallel lines).
    void StrokeLine(float x0, float y0, float x1, float y1, QRgb colour);
    void FillRect(const ViewRect& rect, QRgb colour);

    static int RoundToPixel(float value);

private:
    void FillPixels(int left, int top, int right, int bottom, QRgb colour);

    QImage& image_;
};

}  // namespace glimmet
