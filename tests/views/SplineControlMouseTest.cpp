#include <gtest/gtest.h>

#include <cmath>

#include <QApplication>
#include <QMouseEvent>
#include <QTest>

#include "SplineControlReference.h"
#include "views/SplineControl.h"

namespace glimmet::test {
namespace {

/// A 300 x 200 control with its end points at 0.5, shown as its own window.
class SplineControlMouseTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        control.resize(300, 200);
        control.show();
        ASSERT_TRUE(QTest::qWaitForWindowExposed(&control));
    }

    // The pixel nearest to a normalised position.
    QPoint PixelAt(QPointF normalised) const
    {
        const QPointF position = geometry.At(normalised);
        return {NearestPixel(position.x()), NearestPixel(position.y())};
    }
    QPointF NormalisedAt(QPoint pixel) const { return geometry.Normalised(QPointF(pixel)); }

    void Press(QPoint pixel, Qt::MouseButton button = Qt::LeftButton)
    {
        QTest::mousePress(&control, button, Qt::NoModifier, pixel);
    }
    void Move(QPoint pixel) { QTest::mouseMove(&control, pixel); }
    void Release(QPoint pixel, Qt::MouseButton button = Qt::LeftButton)
    {
        QTest::mouseRelease(&control, button, Qt::NoModifier, pixel);
    }
    void Drag(QPoint from, QPoint to)
    {
        Press(from);
        Move(to);
        Release(to);
    }

    const std::vector<QPointF>& Points() const { return control.ControlPoints(); }

    SplineControl control{"curve", "Time", "Gain", 0.5f, 0.5f};
    SplineGeometry geometry{control.font(), 300, 200};
};

TEST_F(SplineControlMouseTest, PressAddsAPointWhereItIsAndDragsIt)
{
    const QPoint at(150, 60);
    Press(at);
    ASSERT_EQ(Points().size(), 3u);
    EXPECT_DOUBLE_EQ(Points()[1].x(), NormalisedAt(at).x());
    EXPECT_DOUBLE_EQ(Points()[1].y(), NormalisedAt(at).y());
    const QPoint to(170, 100);
    Move(to);
    EXPECT_DOUBLE_EQ(Points()[1].x(), NormalisedAt(to).x());
    EXPECT_DOUBLE_EQ(Points()[1].y(), NormalisedAt(to).y());
    EXPECT_NEAR(control.ValueAt(Points()[1].x()), Points()[1].y(), 1e-12);
    Release(to);
    // No drag any more.
    QMouseEvent move(QEvent::MouseMove, QPointF(200, 40), control.mapToGlobal(QPointF(200, 40)), Qt::NoButton,
        Qt::NoButton, Qt::NoModifier);
    QApplication::sendEvent(&control, &move);
    EXPECT_DOUBLE_EQ(Points()[1].x(), NormalisedAt(to).x());
    EXPECT_EQ(Points().size(), 3u);
}

TEST_F(SplineControlMouseTest, PressOnAPointGrabsItInsteadOfAddingOne)
{
    control.AddControlPoint({0.4, 0.3});
    // Three pixels off the point's position still grabs it.
    const QPoint on = PixelAt({0.4, 0.3}) + QPoint(3, -3);
    const QPoint to(120, 130);
    Drag(on, to);
    ASSERT_EQ(Points().size(), 3u);
    EXPECT_DOUBLE_EQ(Points()[1].x(), NormalisedAt(to).x());
    EXPECT_DOUBLE_EQ(Points()[1].y(), NormalisedAt(to).y());
}

TEST_F(SplineControlMouseTest, DoubleClickActsAsAPress)
{
    const QPoint at(100, 50);
    QTest::mouseDClick(&control, Qt::LeftButton, Qt::NoModifier, at);
    ASSERT_EQ(Points().size(), 3u);
    EXPECT_DOUBLE_EQ(Points()[1].x(), NormalisedAt(at).x());
    const QPoint to(110, 70);
    Move(to);
    EXPECT_DOUBLE_EQ(Points()[1].y(), NormalisedAt(to).y());
    Release(to);
}

TEST_F(SplineControlMouseTest, EndPointsOnlyMoveVertically)
{
    const QPoint to(150, 40);
    Drag(PixelAt({0, 0.5}), to);
    EXPECT_EQ(Points()[0].x(), 0.0);
    EXPECT_DOUBLE_EQ(Points()[0].y(), NormalisedAt(to).y());
    const QPoint other(150, 120);
    Drag(PixelAt({1, 0.5}), other);
    EXPECT_EQ(Points()[1].x(), 1.0);
    EXPECT_DOUBLE_EQ(Points()[1].y(), NormalisedAt(other).y());
    EXPECT_EQ(Points().size(), 2u);
}

TEST_F(SplineControlMouseTest, InnerPointsStayBetweenTheirNeighbours)
{
    control.AddControlPoint({0.3, 0.5});
    control.AddControlPoint({0.6, 0.5});
    // Past the right neighbour: only y follows.
    const QPoint past = PixelAt({0.8, 0.2});
    Press(PixelAt({0.3, 0.5}));
    Move(past);
    EXPECT_EQ(Points()[1].x(), 0.3);
    EXPECT_DOUBLE_EQ(Points()[1].y(), NormalisedAt(past).y());
    // Between the neighbours: both follow.
    const QPoint between = PixelAt({0.45, 0.7});
    Move(between);
    EXPECT_DOUBLE_EQ(Points()[1].x(), NormalisedAt(between).x());
    EXPECT_DOUBLE_EQ(Points()[1].y(), NormalisedAt(between).y());
    // Left of the left neighbour (the first point): only y.
    const QPoint left(2, 30);
    Move(left);
    EXPECT_DOUBLE_EQ(Points()[1].x(), NormalisedAt(between).x());
    EXPECT_DOUBLE_EQ(Points()[1].y(), NormalisedAt(left).y());
    Release(left);
    EXPECT_EQ(Points().size(), 4u);
}

TEST_F(SplineControlMouseTest, InnerPointCannotMeetItsNeighbour)
{
    // The neighbour's x exactly: not strictly between, so x stays.
    const QPoint right = PixelAt({0.6, 0.5});
    control.AddControlPoint(NormalisedAt(right));
    control.AddControlPoint({0.3, 0.5});
    Press(PixelAt({0.3, 0.5}));
    Move(QPoint(right.x(), 20));
    EXPECT_EQ(Points()[1].x(), 0.3);
    Move(QPoint(right.x() - 1, 20));
    EXPECT_DOUBLE_EQ(Points()[1].x(), NormalisedAt(QPoint(right.x() - 1, 20)).x());
    Release(QPoint(right.x() - 1, 20));
}

TEST_F(SplineControlMouseTest, DraggingClampsToTheUnitSquare)
{
    Press(PixelAt({1, 0.5}));
    Move(QPoint(400, -50));
    EXPECT_EQ(Points()[1], QPointF(1, 0));
    Move(QPoint(-30, 500));
    EXPECT_EQ(Points()[1], QPointF(1, 1));
    Release(QPoint(-30, 500));
    control.AddControlPoint({0.5, 0.5});
    Press(PixelAt({0.5, 0.5}));
    // Between the neighbours x follows; y is held to the square.
    const double x = NormalisedAt(QPoint(150, 0)).x();
    Move(QPoint(150, 1000));
    EXPECT_EQ(Points()[1], QPointF(x, 1));
    Move(QPoint(150, -1000));
    EXPECT_EQ(Points()[1], QPointF(x, 0));
    Release(QPoint(150, -1000));
    EXPECT_NEAR(control.ValueAt(x), 0.0, 1e-12);
}

TEST_F(SplineControlMouseTest, SecondaryButtonRemovesInnerPointsOnly)
{
    control.AddControlPoint({0.25, 0.5});
    control.AddControlPoint({0.75, 0.2});
    Press(PixelAt({0.25, 0.5}), Qt::RightButton);
    Release(PixelAt({0.25, 0.5}), Qt::RightButton);
    ASSERT_EQ(Points().size(), 3u);
    EXPECT_EQ(Points()[1], QPointF(0.75, 0.2));
    // The curve follows: a parabola through the three points left.
    EXPECT_NEAR(control.ValueAt(0.5), ReferenceCurve(Points(), 0.5), 1e-12);
    for (const QPointF end : {QPointF(0, 0.5), QPointF(1, 0.5)}) {
        Press(PixelAt(end), Qt::RightButton);
        Release(PixelAt(end), Qt::RightButton);
    }
    EXPECT_EQ(Points().size(), 3u);
    // Nothing under the mouse: nothing goes, nothing comes.
    Press(QPoint(60, 150), Qt::RightButton);
    Release(QPoint(60, 150), Qt::RightButton);
    EXPECT_EQ(Points().size(), 3u);
}

TEST_F(SplineControlMouseTest, ADisabledControlIgnoresTheMouse)
{
    control.AddControlPoint({0.5, 0.5});
    control.SetEnabled(false);
    Drag(QPoint(100, 40), QPoint(120, 60));
    Drag(PixelAt({0.5, 0.5}), QPoint(200, 100));
    Press(PixelAt({0.5, 0.5}), Qt::RightButton);
    Release(PixelAt({0.5, 0.5}), Qt::RightButton);
    QTest::mouseDClick(&control, Qt::LeftButton, Qt::NoModifier, QPoint(100, 40));
    Release(QPoint(100, 40));
    const std::vector<QPointF> unchanged = {{0, 0.5}, {0.5, 0.5}, {1, 0.5}};
    EXPECT_EQ(Points(), unchanged);
    control.SetEnabled(true);
    Drag(QPoint(100, 40), QPoint(100, 40));
    EXPECT_EQ(Points().size(), 4u);
}

TEST_F(SplineControlMouseTest, PressesOutsideTheCurveAreaAreIgnored)
{
    // The nearest whole pixels outside each edge of the area.
    const int outsideLeft = int(std::ceil(geometry.left)) - 1;
    const int outsideBottom = int(std::floor(geometry.bottom)) + 1;
    const int insideLeft = int(std::ceil(geometry.left));
    for (const QPoint at : {QPoint(5, 50), QPoint(outsideLeft, 50), QPoint(150, 3), QPoint(296, 50),
             QPoint(150, outsideBottom), QPoint(150, 195)}) {
        Press(at);
        Release(at);
        EXPECT_EQ(Points().size(), 2u) << at.x() << "," << at.y();
    }
    // The edges themselves are inside.
    for (const QPoint at : {QPoint(insideLeft, 50), QPoint(150, 4), QPoint(295, 20)}) {
        Press(at);
        Release(at);
    }
    EXPECT_EQ(Points().size(), 5u);
}

TEST_F(SplineControlMouseTest, ControlPointAtCoversNinePixelsSquare)
{
    control.AddControlPoint({0.37, 0.41});
    const QPointF centre = geometry.At({0.37, 0.41});
    for (const QPointF offset : {QPointF(0, 0), QPointF(4, 0), QPointF(-4, 0), QPointF(0, 4), QPointF(0, -4),
             QPointF(4, 4), QPointF(-4, -4), QPointF(4, -4), QPointF(3.5, -2)})
        EXPECT_EQ(control.ControlPointAt(centre + offset), 1) << offset.x() << "," << offset.y();
    for (const QPointF offset : {QPointF(5, 0), QPointF(-5, 0), QPointF(0, 5), QPointF(0, -5), QPointF(4, 5),
             QPointF(-5, -4), QPointF(4.001, 0)})
        EXPECT_EQ(control.ControlPointAt(centre + offset), -1) << offset.x() << "," << offset.y();
}

TEST_F(SplineControlMouseTest, ControlPointAtFindsTheFirstInOrder)
{
    control.AddControlPoint({0.5, 0.5});
    control.AddControlPoint({0.505, 0.5});
    const QPointF between = (geometry.At({0.5, 0.5}) + geometry.At({0.505, 0.5})) / 2;
    EXPECT_EQ(control.ControlPointAt(between), 1);
    EXPECT_EQ(control.ControlPointAt(geometry.At({0.505, 0.5}) + QPointF(4, 0)), 2);
    // The end points' squares reach outside the area.
    EXPECT_EQ(control.ControlPointAt(geometry.At({0, 0.5}) - QPointF(4, 0)), 0);
    EXPECT_EQ(control.ControlPointAt(QPointF(150, 5)), -1);
}

}  // namespace
}  // namespace glimmet::test
