#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include <QApplication>
#include <QFontMetricsF>
#include <QTest>
#include <QVBoxLayout>

#include "SplineControlReference.h"
#include "views/SplineControl.h"

namespace glimmet::test {
namespace {

// 0.25 and 0.75 are exact in float, the type the end values come in.
class SplineControlTest : public ::testing::Test {
protected:
    // The least whole number of pixels holding room + label + extra.
    int Least(const QString& label, double extra) const
    {
        const QFontMetricsF metrics(control.font());
        return int(std::ceil(metrics.ascent() + metrics.descent() + metrics.horizontalAdvance(label) + extra));
    }

    SplineControl control{"filter func", "Time", "Gain", 0.25f, 0.75f};
};

TEST_F(SplineControlTest, StartsWithTheTwoEndPoints)
{
    EXPECT_EQ(control.objectName(), "filter func");
    EXPECT_EQ(control.FirstLabel(), "Time");
    EXPECT_EQ(control.SecondLabel(), "Gain");
    EXPECT_TRUE(control.IsEnabled());
    ASSERT_EQ(control.ControlPoints().size(), 2u);
    EXPECT_EQ(control.ControlPoints()[0], QPointF(0, 0.25));
    EXPECT_EQ(control.ControlPoints()[1], QPointF(1, 0.75));
    // Not resized yet: the area is still the empty one.
    EXPECT_EQ(control.CurveArea(), QRectF(QPointF(0, 0), QPointF(-1, -1)));
}

TEST_F(SplineControlTest, TwoPointsGiveAStraightLine)
{
    for (double x : {0.0, 0.1, 0.33, 0.5, 0.9, 1.0})
        EXPECT_NEAR(control.ValueAt(x), 0.25 + 0.5 * x, 1e-12) << x;
}

TEST_F(SplineControlTest, ThreePointsGiveTheParabolaThroughThem)
{
    control.AddControlPoint({0.4, 0.1});
    // Lagrange form, worked out here: p(x) = 0.25 (x - 0.4)(x - 1) / 0.4
    // + 0.1 x (x - 1) / (0.4 * -0.6) + 0.75 x (x - 0.4) / 0.6.
    const auto parabola = [](double x) {
        return 0.25 * (x - 0.4) * (x - 1) / 0.4 + 0.1 * x * (x - 1) / (-0.24) + 0.75 * x * (x - 0.4) / 0.6;
    };
    for (double x : {0.0, 0.05, 0.2, 0.4, 0.55, 0.8, 1.0})
        EXPECT_NEAR(control.ValueAt(x), parabola(x), 1e-12) << x;
    // At 0.2: 0.25 * -0.2 * -0.8 / 0.4 + 0.1 * 0.2 * -0.8 / -0.24 + 0.75 * 0.2 * -0.2 / 0.6
    // = 0.1 + 0.0666... - 0.05.
    EXPECT_NEAR(control.ValueAt(0.2), 0.1 + 0.2 / 3 - 0.05, 1e-12);
}

TEST_F(SplineControlTest, OutsideTheUnitIntervalTheCurveIsZero)
{
    EXPECT_EQ(control.ValueAt(-0.1), 0.0);
    EXPECT_EQ(control.ValueAt(1.1), 0.0);
    EXPECT_EQ(control.ValueAt(-1e-9), 0.0);
    EXPECT_EQ(control.ValueAt(std::numeric_limits<double>::quiet_NaN()), 0.0);
    EXPECT_EQ(control.ValueAt(std::numeric_limits<double>::infinity()), 0.0);
    EXPECT_DOUBLE_EQ(control.ValueAt(0.0), 0.25);
    EXPECT_NEAR(control.ValueAt(1.0), 0.75, 1e-12);
}

TEST_F(SplineControlTest, ValuesAreNotClamped)
{
    // A parabola through (0, 0.25), (0.5, 1), (1, 0.75) peaks above 1.
    control.AddControlPoint({0.5, 1.0});
    EXPECT_GT(control.ValueAt(0.6), 1.0);
}

TEST_F(SplineControlTest, TheCurveCopyReadsLikeValueAt)
{
    control.AddControlPoint({0.3, 0.9});
    control.AddControlPoint({0.7, 0.05});
    const effects::SplineCurve curve = control.Curve();
    for (double x : {-0.5, 0.0, 0.1, 0.3, 0.42, 0.7, 0.99, 1.0, 1.5})
        EXPECT_EQ(curve(x), control.ValueAt(x)) << x;
    // Four points: the not-a-knot spline, through every point.
    for (const QPointF& point : control.ControlPoints())
        EXPECT_NEAR(curve(point.x()), point.y(), 1e-12);
    EXPECT_NEAR(control.ValueAt(0.55), ReferenceCurve(control.ControlPoints(), 0.55), 1e-12);
}

TEST_F(SplineControlTest, PointsAreInsertedBeforeTheFirstLargerX)
{
    EXPECT_EQ(control.AddControlPoint({0.5, 0.1}), 1);
    EXPECT_EQ(control.AddControlPoint({0.2, 0.2}), 1);
    EXPECT_EQ(control.AddControlPoint({0.8, 0.3}), 3);
    // An equal x goes after the point already there.
    EXPECT_EQ(control.AddControlPoint({0.5, 0.4}), 3);
    const std::vector<QPointF> expected = {{0, 0.25}, {0.2, 0.2}, {0.5, 0.1}, {0.5, 0.4}, {0.8, 0.3}, {1, 0.75}};
    EXPECT_EQ(control.ControlPoints(), expected);
}

TEST_F(SplineControlTest, PointsBeyondTheLastAreAppended)
{
    EXPECT_EQ(control.AddControlPoint({1.0, 0.5}), 2);
    EXPECT_EQ(control.AddControlPoint({0.0, 0.5}), 1);
    EXPECT_EQ(control.ControlPoints().size(), 4u);
    EXPECT_EQ(control.ControlPoints().back(), QPointF(1.0, 0.5));
}

TEST_F(SplineControlTest, BothLabelSettersChangeTheRotatedLabel)
{
    control.SetVerticalLabel("Level");
    EXPECT_EQ(control.SecondLabel(), "Level");
    EXPECT_EQ(control.FirstLabel(), "Time");
    control.SetHorizontalLabel("Frequency");
    EXPECT_EQ(control.SecondLabel(), "Frequency");
    EXPECT_EQ(control.FirstLabel(), "Time");
}

TEST_F(SplineControlTest, MinimumSizeHoldsLabelsFrameAndPoints)
{
    // Two points claim 12 pixels.
    EXPECT_EQ(control.minimumSizeHint(), QSize(Least("Time", 15 + 12), Least("Gain", 15 + 12)));
    EXPECT_EQ(control.sizeHint(), control.minimumSizeHint());
    EXPECT_EQ(control.maximumSize(), QSize(Least("Time", 10000 + 12), Least("Gain", 10000 + 12)));
    const QSizePolicy policy = control.sizePolicy();
    EXPECT_EQ(policy.horizontalPolicy(), QSizePolicy::Expanding);
    EXPECT_EQ(policy.verticalPolicy(), QSizePolicy::Expanding);
    EXPECT_EQ(policy.horizontalStretch(), 1);
    EXPECT_EQ(policy.verticalStretch(), 1);
}

TEST_F(SplineControlTest, MinimumSizeGrowsBySixPerPoint)
{
    const QSize before = control.minimumSizeHint();
    const QSize maximum = control.maximumSize();
    control.AddControlPoint({0.5, 0.5});
    EXPECT_EQ(control.minimumSizeHint(), before + QSize(6, 6));
    EXPECT_EQ(control.maximumSize(), maximum + QSize(6, 6));
    control.AddControlPoint({0.7, 0.5});
    EXPECT_EQ(control.minimumSizeHint(), before + QSize(12, 12));
    EXPECT_EQ(control.minimumSizeHint(), QSize(Least("Time", 15 + 24), Least("Gain", 15 + 24)));
}

TEST_F(SplineControlTest, MinimumSizeFollowsTheLabels)
{
    control.SetHorizontalLabel("A much longer label");
    EXPECT_EQ(control.minimumSizeHint(), QSize(Least("Time", 27), Least("A much longer label", 27)));
    EXPECT_EQ(control.maximumSize().height(), Least("A much longer label", 10012));
    control.SetVerticalLabel("");
    EXPECT_EQ(control.minimumSizeHint().height(), Least("", 27));
}

TEST_F(SplineControlTest, CurveAreaLeavesRoomForTheLabels)
{
    control.resize(200, 150);
    control.show();
    ASSERT_TRUE(QTest::qWaitForWindowExposed(&control));
    const SplineGeometry g(control.font(), 200, 150);
    const QRectF area = control.CurveArea();
    EXPECT_DOUBLE_EQ(area.left(), g.left);
    EXPECT_DOUBLE_EQ(area.top(), 4.0);
    EXPECT_DOUBLE_EQ(area.right(), 199.0 - 4);
    EXPECT_DOUBLE_EQ(area.bottom(), 149.0 - g.room - 4);
    EXPECT_DOUBLE_EQ(control.ViewPosition({0.5, 0.25}).x(), g.left + 0.5 * (195.0 - g.left));
    EXPECT_DOUBLE_EQ(control.ViewPosition({0.5, 0.25}).y(), 4.0 + 0.25 * (145.0 - g.room - 4));
    control.resize(120, 90);
    EXPECT_DOUBLE_EQ(control.CurveArea().right(), 115.0);
    EXPECT_DOUBLE_EQ(control.CurveArea().bottom(), 89.0 - g.room - 4);
}

TEST_F(SplineControlTest, AnotherFontMovesTheAreaAndTheMinimum)
{
    control.resize(200, 150);
    control.show();
    ASSERT_TRUE(QTest::qWaitForWindowExposed(&control));
    QFont font = control.font();
    font.setPixelSize(23);
    control.setFont(font);
    const SplineGeometry g(font, 200, 150);
    EXPECT_DOUBLE_EQ(control.CurveArea().left(), g.left);
    EXPECT_DOUBLE_EQ(control.CurveArea().bottom(), g.bottom);
    EXPECT_EQ(control.minimumSizeHint(), QSize(Least("Time", 27), Least("Gain", 27)));
}

TEST_F(SplineControlTest, DisablingKeepsTheFlag)
{
    control.SetEnabled(false);
    EXPECT_FALSE(control.IsEnabled());
    control.SetEnabled(false);
    EXPECT_FALSE(control.IsEnabled());
    control.SetEnabled(true);
    EXPECT_TRUE(control.IsEnabled());
}

// The control as its own window: too narrow for one more point, it grows to
// its minimum size at once.
TEST_F(SplineControlTest, NarrowControlGrowsItsWindow)
{
    control.resize(40, 40);
    control.show();
    ASSERT_TRUE(QTest::qWaitForWindowExposed(&control));
    ASSERT_EQ(control.size(), QSize(40, 40));
    control.AddControlPoint({0.5, 0.5});
    EXPECT_EQ(control.size(), QSize(Least("Time", 15 + 18), Least("Gain", 15 + 18)));
    EXPECT_GE(control.CurveArea().width(), 18.0);
}

TEST_F(SplineControlTest, WideControlLeavesItsWindowAlone)
{
    control.resize(300, 40);
    control.show();
    ASSERT_TRUE(QTest::qWaitForWindowExposed(&control));
    control.AddControlPoint({0.5, 0.5});
    control.AddControlPoint({0.6, 0.5});
    EXPECT_EQ(control.size(), QSize(300, 40));
}

// Inside a dialog-like window whose layout lets it be smaller than the
// control wants: adding a point grows the window before any layout pass.
TEST(SplineControlWindow, NarrowControlGrowsTheWindowItIsIn)
{
    QWidget window;
    auto* layout = new QVBoxLayout(&window);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->setSizeConstraint(QLayout::SetNoConstraint);
    auto* control = new SplineControl("curve", "Time", "Gain", 0.5f, 0.5f);
    layout->addWidget(control);
    window.resize(30, 30);
    window.show();
    ASSERT_TRUE(QTest::qWaitForWindowExposed(&window));
    QApplication::processEvents();
    ASSERT_LT(control->CurveArea().width(), 18.0);
    control->AddControlPoint({0.5, 0.5});
    const QSize wanted = control->minimumSizeHint();
    EXPECT_GE(window.width(), wanted.width());
    EXPECT_GE(window.height(), wanted.height());
    QApplication::processEvents();
    EXPECT_GE(control->CurveArea().width(), 18.0);
}

TEST(SplineControlWindow, HiddenControlStillTakesPoints)
{
    SplineControl control("curve", "", "", 0.0f, 1.0f);
    EXPECT_EQ(control.AddControlPoint({0.5, 0.5}), 1);
    EXPECT_NEAR(control.ValueAt(0.25), 0.25, 1e-12);
}

}  // namespace
}  // namespace glimmet::test
