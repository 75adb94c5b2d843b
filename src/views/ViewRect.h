#pragma once

#include <QRect>

namespace glimmet {

/// A rectangle given by its four edges, all inclusive, in float pixel
/// coordinates where pixel (x, y) is centred on the integer point (x, y).
/// So a rectangle from 0 to 10 covers 11 pixels and has a width of 10.
struct ViewRect {
    float left = 0;
    float top = 0;
    float right = -1;
    float bottom = -1;

    float Width() const { return right - left; }
    float Height() const { return bottom - top; }
    bool IsValid() const { return left <= right && top <= bottom; }
    bool Contains(float x, float y) const { return x >= left && x <= right && y >= top && y <= bottom; }
    ViewRect InsetBy(float dx, float dy) const { return {left + dx, top + dy, right - dx, bottom - dy}; }

    /// The Qt rectangle of the pixels this one touches.
    static ViewRect FromQRect(const QRect& rect)
    {
        return {float(rect.left()), float(rect.top()), float(rect.right()), float(rect.bottom())};
    }
};

}  // namespace glimmet
