#include "views/SplineControl.h"

#include <algorithm>
#include <cmath>
#include <cstdint>

#include <QEvent>
#include <QFontMetricsF>
#include <QMouseEvent>
#include <QPainter>
#include <QSizePolicy>

namespace glimmet {

namespace {

const QColor kLowColour(216, 216, 216);
const QColor kFrameLight(255, 255, 255);
const QColor kFrameMiddle(194, 194, 194);
const QColor kFrameDark(108, 108, 108);
const QColor kPointColour(255, 0, 0);

// Room around the curve area: 4 pixels to the frame's outer edge, 2 to the
// white field the curve is drawn on.
constexpr double kFrameInset = 4.0;
constexpr double kFieldInset = 2.0;
// Every point claims this many pixels of the curve area, so that points stay
// apart when the control is at its minimum size.
constexpr double kPixelsPerPoint = 6.0;
// Half the side of a control point's square, and of the square a click must
// fall into to grab it.
constexpr int kPointHalfSide = 2;
constexpr double kGrabReach = 4.0;
// A wild curve (near-coincident knots) can leave the widget by far; keep the
// coordinates small enough for integer pixels, the painter clips the rest.
constexpr double kCoordinateLimit = 1.0e6;

// Positions are fractional (the font's height is), pixels are whole: a
// position names the pixel whose centre is nearest, halves going right and
// down. Every drawing step uses this one rule, so the frame, the curve and
// the points stay aligned with each other whatever the font.
int ToPixel(double position)
{
    return int(std::floor(std::clamp(position, -kCoordinateLimit, kCoordinateLimit) + 0.5));
}

QPoint ToPixel(QPointF position)
{
    return {ToPixel(position.x()), ToPixel(position.y())};
}

// Both corners inclusive, as the frame and the fields are described.
QRect PixelRect(double left, double top, double right, double bottom)
{
    return {QPoint(ToPixel(left), ToPixel(top)), QPoint(ToPixel(right), ToPixel(bottom))};
}

bool ContainsInclusive(const QRectF& rect, QPointF position)
{
    return position.x() >= rect.left() && position.x() <= rect.right() && position.y() >= rect.top()
        && position.y() <= rect.bottom();
}

// A one-pixel, aliased pen: a line from one pixel to another covers both end
// pixels and nothing beside them.
QPen PixelPen(const QColor& colour)
{
    QPen pen(colour, 1.0);
    pen.setCapStyle(Qt::SquareCap);
    pen.setCosmetic(true);
    return pen;
}

void StrokeLine(QPainter& painter, QPoint from, QPoint to, const QColor& colour)
{
    painter.setPen(PixelPen(colour));
    painter.drawLine(from, to);
}

}  // namespace

SplineControl::SplineControl(const QString& objectName, const QString& firstLabel, const QString& secondLabel,
    float y0, float y1, QWidget* parent)
    : QWidget(parent), firstLabel_(firstLabel), secondLabel_(secondLabel)
{
    setObjectName(objectName);
    // What the drawing leaves alone shows the parent's background.
    setAutoFillBackground(false);
    QSizePolicy policy(QSizePolicy::Expanding, QSizePolicy::Expanding);
    policy.setHorizontalStretch(1);
    policy.setVerticalStretch(1);
    setSizePolicy(policy);
    points_.emplace_back(0.0, double(y0));
    points_.emplace_back(1.0, double(y1));
    UpdateSpline();
    UpdateSizeLimits();
}

SplineControl::~SplineControl() = default;

double SplineControl::ValueAt(double x) const
{
    return curve_(x);
}

effects::SplineCurve SplineControl::Curve() const
{
    return curve_;
}

void SplineControl::SetVerticalLabel(const QString& label)
{
    secondLabel_ = label;
    UpdateSizeLimits();
    update();
}

// Deliberately the rotated label as well: callers rely on the first label
// staying as it was constructed.
void SplineControl::SetHorizontalLabel(const QString& label)
{
    SetVerticalLabel(label);
}

void SplineControl::SetEnabled(bool enabled)
{
    if (enabled == enabled_)
        return;
    enabled_ = enabled;
    update();
}

int SplineControl::AddControlPoint(QPointF point)
{
    const auto larger =
        std::find_if(points_.begin(), points_.end(), [&](const QPointF& other) { return other.x() > point.x(); });
    const int index = int(larger - points_.begin());
    points_.insert(larger, point);
    if (dragged_ >= index)
        ++dragged_;
    UpdateSpline();
    UpdateSizeLimits();
    GrowWindowIfNarrow();
    return index;
}

int SplineControl::ControlPointAt(QPointF position) const
{
    for (size_t i = 0; i < points_.size(); ++i) {
        const QPointF centre = ViewPosition(points_[i]);
        if (std::abs(position.x() - centre.x()) <= kGrabReach && std::abs(position.y() - centre.y()) <= kGrabReach)
            return int(i);
    }
    return -1;
}

void SplineControl::UpdateSpline()
{
    std::vector<double> xs;
    std::vector<double> ys;
    xs.reserve(points_.size());
    ys.reserve(points_.size());
    for (const QPointF& point : points_) {
        xs.push_back(point.x());
        ys.push_back(point.y());
    }
    spline_.Set(xs.data(), ys.data(), int32_t(points_.size()));
    curve_ = effects::SplineCurve(spline_);
}

QPointF SplineControl::ViewPosition(QPointF normalised) const
{
    return {area_.left() + normalised.x() * area_.width(), area_.top() + normalised.y() * area_.height()};
}

QSize SplineControl::minimumSizeHint() const
{
    const QFontMetricsF metrics(font());
    const double room = LabelRoom();
    const double points = kPixelsPerPoint * double(points_.size());
    return {int(std::ceil(room + metrics.horizontalAdvance(firstLabel_) + 15.0 + points)),
        int(std::ceil(room + metrics.horizontalAdvance(secondLabel_) + 15.0 + points))};
}

QSize SplineControl::sizeHint() const
{
    return minimumSizeHint();
}

void SplineControl::paintEvent(QPaintEvent*)
{
    QPainter painter(this);
    painter.setRenderHint(QPainter::Antialiasing, false);
    DrawStrips(painter);
    DrawLabels(painter);
    DrawFrame(painter);
    DrawCurve(painter);
    DrawControlPoints(painter);
}

void SplineControl::resizeEvent(QResizeEvent* event)
{
    QWidget::resizeEvent(event);
    UpdateCurveArea();
}

void SplineControl::changeEvent(QEvent* event)
{
    QWidget::changeEvent(event);
    if (event->type() != QEvent::FontChange)
        return;
    // The label room follows the font; before the first resize there is no
    // area to correct yet.
    if (area_.width() >= 0)
        UpdateCurveArea();
    UpdateSizeLimits();
}

void SplineControl::mousePressEvent(QMouseEvent* event)
{
    if (!enabled_ || !ContainsInclusive(area_, event->position()))
        return;
    // The buttons held, not the one that changed: a second button pressed
    // during a drag still counts as the primary one being down.
    if (event->buttons() & Qt::LeftButton)
        PressPrimary(event->position());
    else if (event->buttons() & Qt::RightButton)
        PressSecondary(event->position());
}

void SplineControl::mouseMoveEvent(QMouseEvent* event)
{
    if (!enabled_ || dragged_ < 0)
        return;
    DragTo(event->position());
}

void SplineControl::mouseReleaseEvent(QMouseEvent*)
{
    dragged_ = -1;
}

void SplineControl::mouseDoubleClickEvent(QMouseEvent* event)
{
    mousePressEvent(event);
}

double SplineControl::LabelRoom() const
{
    const QFontMetricsF metrics(font());
    return metrics.ascent() + metrics.descent();
}

void SplineControl::UpdateCurveArea()
{
    const double room = LabelRoom();
    const double right = width() - 1;
    const double bottom = height() - 1;
    area_ = QRectF(QPointF(room + kFrameInset, kFrameInset), QPointF(right - kFrameInset, bottom - room - kFrameInset));
    update();
}

void SplineControl::UpdateSizeLimits()
{
    const QFontMetricsF metrics(font());
    const double room = LabelRoom();
    const double points = kPixelsPerPoint * double(points_.size());
    setMaximumSize(int(std::ceil(room + metrics.horizontalAdvance(firstLabel_) + 10000.0 + points)),
        int(std::ceil(room + metrics.horizontalAdvance(secondLabel_) + 10000.0 + points)));
    updateGeometry();
}

// The layout only learns of the larger minimum on its next pass; growing the
// window now keeps a just-added point from being squeezed against the others.
void SplineControl::GrowWindowIfNarrow()
{
    if (area_.width() >= kPixelsPerPoint * double(points_.size()))
        return;
    QWidget* top = window();
    top->resize(top->size().expandedTo(top->minimumSizeHint()));
}

void SplineControl::InvalidateCurve()
{
    // The whole control, not just the field: a curve that overshoots is
    // drawn across the frame and the labels, and redrawing only the field
    // would leave its old path there.
    update();
}

QPointF SplineControl::Normalised(QPointF position) const
{
    return {(position.x() - area_.left()) / area_.width(), (position.y() - area_.top()) / area_.height()};
}

void SplineControl::PressPrimary(QPointF position)
{
    dragged_ = ControlPointAt(position);
    if (dragged_ < 0)
        dragged_ = AddControlPoint(Normalised(position));
    InvalidateCurve();
}

// The end points fix the curve's extent, so only inner points can go.
void SplineControl::PressSecondary(QPointF position)
{
    const int index = ControlPointAt(position);
    if (index > 0 && index < int(points_.size()) - 1) {
        points_.erase(points_.begin() + index);
        if (dragged_ == index)
            dragged_ = -1;
        else if (dragged_ > index)
            --dragged_;
        UpdateSizeLimits();
    }
    UpdateSpline();
    InvalidateCurve();
}

// The points stay sorted and their x distinct: the end points keep x = 0 and
// x = 1, an inner point never passes or meets a neighbour.
void SplineControl::DragTo(QPointF position)
{
    const QPointF target = Normalised(position);
    const double x = std::clamp(target.x(), 0.0, 1.0);
    const double y = std::clamp(target.y(), 0.0, 1.0);
    const size_t index = size_t(dragged_);
    QPointF& point = points_[index];
    const bool inner = index > 0 && index + 1 < points_.size();
    if (inner && x > points_[index - 1].x() && x < points_[index + 1].x())
        point.setX(x);
    point.setY(y);
    UpdateSpline();
    InvalidateCurve();
}

void SplineControl::DrawStrips(QPainter& painter) const
{
    const int frameLeft = ToPixel(area_.left() - kFrameInset);
    const int frameBottom = ToPixel(area_.bottom() + kFrameInset);
    const int right = width() - 1;
    const int bottom = height() - 1;
    painter.fillRect(QRect(QPoint(0, 0), QPoint(frameLeft - 1, bottom)), kLowColour);
    painter.fillRect(QRect(QPoint(0, frameBottom + 1), QPoint(right, bottom)), kLowColour);
}

void SplineControl::DrawLabels(QPainter& painter) const
{
    const QFontMetricsF metrics(font());
    painter.setPen(Qt::black);
    painter.setFont(font());
    painter.save();
    // Rotated a quarter turn against the clock, so the text reads upwards and
    // ends 5 pixels below the top.
    painter.translate(ToPixel(LabelRoom()), ToPixel(5.0 + metrics.horizontalAdvance(secondLabel_)));
    painter.rotate(-90.0);
    painter.drawText(QPoint(0, 0), secondLabel_);
    painter.restore();
    const double x = width() - 1 - 2.0 - metrics.horizontalAdvance(firstLabel_);
    const double y = height() - 1 - 2.0;
    painter.drawText(ToPixel(QPointF(x, y)), firstLabel_);
}

// A double sunken frame: light from the bottom right, the inner ring darker
// at the top left than the outer one.
void SplineControl::DrawFrame(QPainter& painter) const
{
    const QRect frame = PixelRect(area_.left() - kFrameInset, area_.top() - kFrameInset,
        area_.right() + kFrameInset, area_.bottom() + kFrameInset);
    const int l = frame.left();
    const int t = frame.top();
    const int r = frame.right();
    const int b = frame.bottom();
    StrokeLine(painter, {l, b}, {l, t}, kFrameMiddle);
    StrokeLine(painter, {l + 1, t}, {r, t}, kFrameMiddle);
    StrokeLine(painter, {r, t + 1}, {r, b}, kFrameLight);
    StrokeLine(painter, {r - 1, b}, {l + 1, b}, kFrameLight);
    StrokeLine(painter, {l + 1, b - 1}, {l + 1, t + 1}, kFrameDark);
    StrokeLine(painter, {r - 1, t + 1}, {r - 1, b - 1}, kLowColour);
    StrokeLine(painter, {l + 2, t + 1}, {r - 1, t + 1}, kFrameDark);
    painter.fillRect(PixelRect(area_.left() - kFieldInset, area_.top() - kFieldInset, area_.right() + kFieldInset,
                         area_.bottom() + kFieldInset),
        Qt::white);
}

// One sample per pixel column, taken at i / N so that the last one falls just
// short of x = 1; column k of the area shows sample k.
void SplineControl::DrawCurve(QPainter& painter) const
{
    const int32_t count = int32_t(std::ceil(area_.width())) + 1;
    if (count <= 0)
        return;
    std::vector<double> xs(size_t(count), 0.0);
    std::vector<double> ys(size_t(count), 0.0);
    for (int32_t i = 0; i < count; ++i)
        xs[size_t(i)] = double(i) / double(count);
    spline_.Compute(xs.data(), ys.data(), count);
    const auto positionOf = [&](int32_t column) {
        return QPointF(area_.left() + column, area_.top() + ys[size_t(column)] * area_.height());
    };
    QPointF from = positionOf(0);
    for (int32_t column = 1; area_.left() + column <= area_.right(); ++column) {
        const QPointF to = positionOf(column);
        // Coincident knots give infinite or undefined values: leave a gap.
        if (std::isfinite(from.y()) && std::isfinite(to.y()))
            StrokeLine(painter, ToPixel(from), ToPixel(to), Qt::black);
        from = to;
    }
}

void SplineControl::DrawControlPoints(QPainter& painter) const
{
    constexpr int side = 2 * kPointHalfSide + 1;
    for (const QPointF& point : points_) {
        const QPoint centre = ToPixel(ViewPosition(point));
        painter.fillRect(QRect(centre.x() - kPointHalfSide, centre.y() - kPointHalfSide, side, side), kPointColour);
    }
}

}  // namespace glimmet
