#pragma once

#include <algorithm>
#include <cmath>
#include <vector>

#include <QFont>
#include <QFontMetricsF>
#include <QImage>
#include <QPainter>
#include <QPen>
#include <QPointF>
#include <QString>

#include "edit/effects/Spline.h"

namespace glimmet::test {

/// What the curve control is expected to draw, worked out here on its own
/// from how the control should look rather than from its code.
///
/// Positions are fractional and pixels whole: a position stands for the pixel
/// whose centre is nearest, halves going right and down.
inline int NearestPixel(double position)
{
    return int(std::floor(position + 0.5));
}

/// The control's layout for a widget of width x height pixels: the curve
/// area (inclusive edges) and the frame around it.
struct SplineGeometry {
    SplineGeometry(const QFont& font, int width, int height)
    {
        const QFontMetricsF metrics(font);
        room = metrics.ascent() + metrics.descent();
        left = 0 + room + 4;
        top = 0 + 4;
        right = (width - 1) - 4;
        bottom = (height - 1) - room - 4;
        frameLeft = NearestPixel(left - 4);
        frameTop = NearestPixel(top - 4);
        frameRight = NearestPixel(right + 4);
        frameBottom = NearestPixel(bottom + 4);
    }

    double Width() const { return right - left; }
    double Height() const { return bottom - top; }
    QPointF At(QPointF normalised) const
    {
        return {left + normalised.x() * Width(), top + normalised.y() * Height()};
    }
    QPointF Normalised(QPointF position) const
    {
        return {(position.x() - left) / Width(), (position.y() - top) / Height()};
    }

    double room = 0;
    double left = 0;
    double top = 0;
    double right = 0;
    double bottom = 0;
    int frameLeft = 0;
    int frameTop = 0;
    int frameRight = 0;
    int frameBottom = 0;
};

/// The curve through the points: a line for two, the Lagrange parabola for
/// three, the numeric spline (tested on its own) for more.
inline double ReferenceCurve(const std::vector<QPointF>& points, double x)
{
    if (points.size() == 2) {
        const QPointF a = points[0];
        const QPointF b = points[1];
        return a.y() + (b.y() - a.y()) * (x - a.x()) / (b.x() - a.x());
    }
    if (points.size() == 3) {
        double sum = 0;
        for (size_t i = 0; i < 3; ++i) {
            double term = points[i].y();
            for (size_t j = 0; j < 3; ++j) {
                if (j != i)
                    term *= (x - points[j].x()) / (points[i].x() - points[j].x());
            }
            sum += term;
        }
        return sum;
    }
    std::vector<double> xs;
    std::vector<double> ys;
    for (const QPointF& point : points) {
        xs.push_back(point.x());
        ys.push_back(point.y());
    }
    const Spline spline(xs.data(), ys.data(), int32_t(points.size()));
    double value = 0;
    spline.Compute(&x, &value, 1);
    return value;
}

/// The curve's polyline in pixels: N = ceil(width) + 1 samples at i / N, the
/// first at the area's left edge, then one vertex per whole pixel step to the
/// right while it stays inside the area, vertex k showing sample k.
inline std::vector<QPoint> ReferenceCurveVertices(const SplineGeometry& g, const std::vector<QPointF>& points)
{
    const int n = int(std::ceil(g.Width())) + 1;
    std::vector<QPoint> vertices;
    for (int k = 0; g.left + k <= g.right; ++k) {
        const double value = ReferenceCurve(points, double(k) / double(n));
        vertices.emplace_back(NearestPixel(g.left + k), NearestPixel(g.top + value * g.Height()));
    }
    return vertices;
}

/// Sets every pixel of the inclusive rectangle that lies inside the image.
inline void FillPixels(QImage& image, int left, int top, int right, int bottom, QRgb colour)
{
    for (int y = std::max(top, 0); y <= std::min(bottom, image.height() - 1); ++y) {
        for (int x = std::max(left, 0); x <= std::min(right, image.width() - 1); ++x)
            image.setPixel(x, y, colour);
    }
}

/// The text origins: the rotated label's baseline starts at (f, 5 + its
/// width), the horizontal one's at (right - 2 - its width, bottom - 2).
inline QPoint SecondLabelOrigin(const QFont& font, const QString& label)
{
    const QFontMetricsF metrics(font);
    return {NearestPixel(metrics.ascent() + metrics.descent()), NearestPixel(5 + metrics.horizontalAdvance(label))};
}

inline QPoint FirstLabelOrigin(const QFont& font, const QString& label, int width, int height)
{
    const QFontMetricsF metrics(font);
    return {NearestPixel((width - 1) - 2 - metrics.horizontalAdvance(label)), NearestPixel((height - 1) - 2.0)};
}

/// The whole expected picture over a background; the labels drawn with a
/// painter like any text (the glyphs' shapes are the font's business).
inline QImage ReferenceImage(const QFont& font, int width, int height, const QString& first, const QString& second,
    const std::vector<QPointF>& points, QRgb background)
{
    const SplineGeometry g(font, width, height);
    QImage image(width, height, QImage::Format_RGB32);
    image.fill(background);
    const QRgb low = qRgb(216, 216, 216);
    FillPixels(image, 0, 0, g.frameLeft - 1, height - 1, low);
    FillPixels(image, 0, g.frameBottom + 1, width - 1, height - 1, low);
    {
        QPainter painter(&image);
        painter.setFont(font);
        painter.setPen(Qt::black);
        const QPoint origin = SecondLabelOrigin(font, second);
        painter.save();
        painter.translate(origin);
        painter.rotate(-90);
        painter.drawText(QPoint(0, 0), second);
        painter.restore();
        painter.drawText(FirstLabelOrigin(font, first, width, height), first);
    }
    const int l = g.frameLeft;
    const int t = g.frameTop;
    const int r = g.frameRight;
    const int b = g.frameBottom;
    FillPixels(image, l, t, l, b, qRgb(194, 194, 194));
    FillPixels(image, l + 1, t, r, t, qRgb(194, 194, 194));
    FillPixels(image, r, t + 1, r, b, qRgb(255, 255, 255));
    FillPixels(image, l + 1, b, r - 1, b, qRgb(255, 255, 255));
    FillPixels(image, l + 1, t + 1, l + 1, b - 1, qRgb(108, 108, 108));
    FillPixels(image, r - 1, t + 1, r - 1, b - 1, qRgb(216, 216, 216));
    FillPixels(image, l + 2, t + 1, r - 1, t + 1, qRgb(108, 108, 108));
    FillPixels(image, NearestPixel(g.left - 2), NearestPixel(g.top - 2), NearestPixel(g.right + 2),
        NearestPixel(g.bottom + 2), qRgb(255, 255, 255));
    {
        // Slanted segments are left to the painter's line rasteriser; their
        // end pixels are checked on their own by the tests.
        QPainter painter(&image);
        painter.setRenderHint(QPainter::Antialiasing, false);
        QPen pen(Qt::black, 1.0);
        pen.setCosmetic(true);
        painter.setPen(pen);
        const std::vector<QPoint> vertices = ReferenceCurveVertices(g, points);
        for (size_t k = 1; k < vertices.size(); ++k)
            painter.drawLine(vertices[k - 1], vertices[k]);
    }
    for (const QPointF& point : points) {
        const QPointF centre = g.At(point);
        const int x = NearestPixel(centre.x());
        const int y = NearestPixel(centre.y());
        FillPixels(image, x - 2, y - 2, x + 2, y + 2, qRgb(255, 0, 0));
    }
    return image;
}

}  // namespace glimmet::test
