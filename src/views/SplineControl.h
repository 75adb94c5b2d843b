#pragma once

#include <QPointF>
#include <QRectF>
#include <QString>
#include <QWidget>

class QPainter;

#include <vector>

#include "edit/effects/Spline.h"
#include "edit/effects/SplineCurve.h"

namespace glimmet {

/// A small curve editor for the effect dialogs: the user places control
/// points in a unit square and the control draws the smooth curve through
/// them (a Spline). Points are kept sorted by x in normalised coordinates:
/// x from the curve area's left edge (0) to its right edge (1), y from its
/// top edge (0) to its bottom edge (1).
///
/// The first label is drawn horizontally at the bottom right, the second
/// rotated by 90 degrees along the left edge, reading upwards.
///
/// Geometry is fractional (the label room is the font's height); whatever is
/// drawn lands on the pixel whose centre is nearest, halves going right and
/// down, so a point's 5 x 5 square sits where its position rounds to.
class SplineControl : public QWidget {
    Q_OBJECT

public:
    /// The two end points (0, y0) and (1, y1) are added and the curve
    /// computed. objectName becomes the widget's object name.
    SplineControl(const QString& objectName, const QString& firstLabel, const QString& secondLabel, float y0,
        float y1, QWidget* parent = nullptr);
    ~SplineControl() override;

    /// 0 for x < 0, x > 1 or not a number; the curve's value otherwise, in
    /// normalised y (0 = top), unclamped.
    double ValueAt(double x) const;
    /// A copy of the curve, evaluated exactly as ValueAt.
    effects::SplineCurve Curve() const;

    /// Both set the rotated (second) label; the horizontal one leaves the
    /// first label alone.
    void SetVerticalLabel(const QString& label);
    void SetHorizontalLabel(const QString& label);
    QString FirstLabel() const { return firstLabel_; }
    QString SecondLabel() const { return secondLabel_; }

    /// A disabled control ignores the mouse and draws the same.
    void SetEnabled(bool enabled);
    bool IsEnabled() const { return enabled_; }

    /// Inserts a point (normalised) before the first point with a larger x
    /// (appended otherwise), recomputes the curve and, when the curve area
    /// has become narrower than 6 pixels per point, asks its window to grow
    /// to its minimum size. Returns the point's index.
    int AddControlPoint(QPointF point);
    /// Index of the first point whose 9 x 9 square (4 pixels each side of
    /// its position, in view coordinates) contains position; -1 if none.
    int ControlPointAt(QPointF position) const;
    /// Recomputes the spline from the points.
    void UpdateSpline();

    const std::vector<QPointF>& ControlPoints() const { return points_; }
    /// The curve area in view coordinates (left, top, right, bottom as
    /// inclusive pixel positions); (0, 0, -1, -1) before the first resize.
    QRectF CurveArea() const { return area_; }
    /// The view position of a normalised point: (area.left + x * width,
    /// area.top + y * height).
    QPointF ViewPosition(QPointF normalised) const;

    QSize minimumSizeHint() const override;
    QSize sizeHint() const override;

protected:
    void paintEvent(QPaintEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;
    void mouseMoveEvent(QMouseEvent* event) override;
    void mouseReleaseEvent(QMouseEvent* event) override;
    /// Qt turns the second press of a double click into this event; for the
    /// control it is just another press.
    void mouseDoubleClickEvent(QMouseEvent* event) override;
    void changeEvent(QEvent* event) override;

private:
    /// Ascent plus descent of the widget's font: the room kept for a label.
    double LabelRoom() const;
    void UpdateCurveArea();
    void UpdateSizeLimits();
    void GrowWindowIfNarrow();
    void InvalidateCurve();
    QPointF Normalised(QPointF position) const;

    void PressPrimary(QPointF position);
    void PressSecondary(QPointF position);
    void DragTo(QPointF position);

    // Drawing, in painting order; each later step may cover an earlier one.
    void DrawStrips(QPainter& painter) const;
    void DrawLabels(QPainter& painter) const;
    void DrawFrame(QPainter& painter) const;
    void DrawCurve(QPainter& painter) const;
    void DrawControlPoints(QPainter& painter) const;

    std::vector<QPointF> points_;
    int dragged_ = -1;  // index into points_, -1 when nothing is dragged
    QString firstLabel_;
    QString secondLabel_;
    bool enabled_ = true;
    QRectF area_{QPointF(0, 0), QPointF(-1, -1)};
    Spline spline_;
    // The spline again, wrapped the way effects read it, so that ValueAt and
    // Curve share one definition of "outside [0, 1]".
    effects::SplineCurve curve_;
};

}  // namespace glimmet
