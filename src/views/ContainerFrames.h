#pragma once

#include <QColor>

#include "views/ViewRect.h"

class QFont;
class QPainter;

namespace glimmet {

/// What the channel container draws itself, around and between its sample
/// views: a sunken frame around each view (blue around the focused one),
/// and, without any channel, a sunken area above the zoom slider with a
/// hint in its middle. Pixel-exact in the views' coordinates: a point names
/// the pixel it is centred on, both ends of a line are drawn, and fractions
/// round to the nearest pixel.
class ContainerFrames {
public:
    /// The frame one pixel outside a view's frame.
    static void DrawViewFrame(QPainter& painter, const ViewRect& viewFrame, bool focused);
    /// The empty container of the given bounds, the zoom slider's height
    /// left free at the bottom.
    static void DrawEmptyState(QPainter& painter, const ViewRect& bounds, float sliderHeight, const QFont& font);

private:
    static void Fill(QPainter& painter, float x0, float y0, float x1, float y1, const QColor& colour);
    static void DrawLines(QPainter& painter, const ViewRect& r, const QColor& topLeft, const QColor& bottomRight);
};

}  // namespace glimmet
