#include <gtest/gtest.h>

#include <memory>
#include <sstream>
#include <string>

#include <QTest>

#include "SplineControlReference.h"
#include "views/SplineControl.h"

namespace glimmet::test {
namespace {

constexpr QRgb kBackground = qRgb(12, 34, 56);
constexpr QRgb kOtherBackground = qRgb(90, 140, 30);
constexpr QRgb kLow = qRgb(216, 216, 216);
constexpr QRgb kBlack = qRgb(0, 0, 0);
constexpr QRgb kRed = qRgb(255, 0, 0);

// End points are exact in float, the type the constructor takes them in.
struct Scene {
    const char* name;
    int width;
    int height;
    QString first;
    QString second;
    std::vector<QPointF> points;
};

void PrintTo(const Scene& scene, std::ostream* out)
{
    *out << scene.name;
}

const std::vector<Scene>& Scenes()
{
    static const std::vector<Scene> scenes = {
        {"TwoPointsSmall", 120, 90, "1.0", "Level", {{0, 0.25}, {1, 0.75}}},
        {"TwoPointsLarge", 333, 211, "Time", "Gain", {{0, 0.875}, {1, 0.125}}},
        {"ThreePoints", 200, 150, "Time", "Gain", {{0, 0.875}, {0.4, 0.1}, {1, 0.5}}},
        {"SixPoints", 333, 211, "Filter Function", "1.0",
            {{0, 0.5}, {0.15, 0.05}, {0.3, 0.9}, {0.55, 0.2}, {0.8, 0.95}, {1, 0.375}}},
        // Overshoots the field, so the curve crosses the frame.
        {"FivePointsOvershooting", 200, 150, "", "gy", {{0, 0}, {0.2, 1}, {0.5, 0.5}, {0.7, 0}, {1, 1}}},
        {"FivePointsSmall", 120, 90, "x", "Amplitude", {{0, 1}, {0.1, 0.3}, {0.35, 0.6}, {0.62, 0.61}, {1, 0}}},
    };
    return scenes;
}

std::unique_ptr<SplineControl> MakeControl(const Scene& scene)
{
    auto control = std::make_unique<SplineControl>("curve", scene.first, scene.second,
        float(scene.points.front().y()), float(scene.points.back().y()));
    control->resize(scene.width, scene.height);
    control->show();
    EXPECT_TRUE(QTest::qWaitForWindowExposed(control.get()));
    for (size_t i = 1; i + 1 < scene.points.size(); ++i)
        control->AddControlPoint(scene.points[i]);
    EXPECT_EQ(control->size(), QSize(scene.width, scene.height));
    return control;
}

QImage Render(SplineControl& control, QRgb background)
{
    QImage image(control.size(), QImage::Format_RGB32);
    image.setDevicePixelRatio(1.0);
    image.fill(background);
    control.render(&image, QPoint(), QRegion(), QWidget::RenderFlags());
    return image;
}

std::string Colour(QRgb colour)
{
    std::ostringstream out;
    out << "(" << qRed(colour) << "," << qGreen(colour) << "," << qBlue(colour) << ")";
    return out.str();
}

// Empty when equal; otherwise the number of differing pixels and the first few.
std::string Differences(const QImage& actual, const QImage& expected)
{
    if (actual.size() != expected.size())
        return "sizes differ";
    std::ostringstream out;
    int count = 0;
    for (int y = 0; y < actual.height(); ++y) {
        for (int x = 0; x < actual.width(); ++x) {
            const QRgb a = actual.pixel(x, y) | 0xff000000u;
            const QRgb e = expected.pixel(x, y) | 0xff000000u;
            if (a == e)
                continue;
            if (count < 12)
                out << " (" << x << "," << y << ") is " << Colour(a) << " not " << Colour(e) << ";";
            ++count;
        }
    }
    if (count == 0)
        return {};
    return std::to_string(count) + " pixels differ:" + out.str();
}

class SplineControlPixelTest : public ::testing::TestWithParam<Scene> {};

TEST_P(SplineControlPixelTest, EveryPixelMatchesTheReference)
{
    const Scene& scene = GetParam();
    auto control = MakeControl(scene);
    const QImage expected = ReferenceImage(control->font(), scene.width, scene.height, scene.first, scene.second,
        scene.points, kBackground);
    EXPECT_EQ(Differences(Render(*control, kBackground), expected), "");
}

// Independent of how a slanted line is rasterised: each vertex of the
// polyline is black (unless a point's square covers it), and a black pixel in
// the white field lies within the rows its column's neighbouring vertices span.
TEST_P(SplineControlPixelTest, CurvePixelsFollowTheSamples)
{
    const Scene& scene = GetParam();
    auto control = MakeControl(scene);
    const QImage image = Render(*control, kBackground);
    const SplineGeometry g(control->font(), scene.width, scene.height);
    const std::vector<QPoint> vertices = ReferenceCurveVertices(g, scene.points);
    ASSERT_EQ(int(vertices.size()), int(std::floor(g.Width())) + 1);
    for (const QPoint& vertex : vertices) {
        if (!image.rect().contains(vertex))
            continue;
        const QRgb pixel = image.pixel(vertex) | 0xff000000u;
        EXPECT_TRUE(pixel == kBlack || pixel == kRed) << vertex.x() << "," << vertex.y() << " " << Colour(pixel);
    }
    const int first = vertices.front().x();
    for (int y = NearestPixel(g.top - 2); y <= NearestPixel(g.bottom + 2); ++y) {
        for (int x = NearestPixel(g.left - 2); x <= NearestPixel(g.right + 2); ++x) {
            if ((image.pixel(x, y) | 0xff000000u) != kBlack)
                continue;
            const int k = x - first;
            ASSERT_TRUE(k >= 0 && k < int(vertices.size())) << x << "," << y;
            int low = vertices[size_t(k)].y();
            int high = low;
            for (int j = std::max(k - 1, 0); j <= std::min(k + 1, int(vertices.size()) - 1); ++j) {
                low = std::min(low, vertices[size_t(j)].y());
                high = std::max(high, vertices[size_t(j)].y());
            }
            EXPECT_TRUE(y >= low && y <= high) << x << "," << y;
        }
    }
}

// The glyphs are the font's; wherever they are not, the strips hold the low
// colour, and each label leaves some ink inside its own box.
TEST_P(SplineControlPixelTest, LabelsStayInsideTheirBoxes)
{
    const Scene& scene = GetParam();
    auto control = MakeControl(scene);
    const QImage image = Render(*control, kBackground);
    const SplineGeometry g(control->font(), scene.width, scene.height);
    const QFontMetricsF metrics(control->font());
    const QRectF firstText = metrics.boundingRect(scene.first);
    const QRectF secondText = metrics.boundingRect(scene.second);
    const QPoint firstOrigin = FirstLabelOrigin(control->font(), scene.first, scene.width, scene.height);
    const QPoint secondOrigin = SecondLabelOrigin(control->font(), scene.second);
    // A quarter turn against the clock takes text (u, v) to (v, -u).
    const QRectF firstBox = firstText.translated(firstOrigin).adjusted(-2, -2, 2, 2);
    const QRectF secondBox = QRectF(QPointF(secondOrigin.x() + secondText.top(), secondOrigin.y() - secondText.right()),
        QPointF(secondOrigin.x() + secondText.bottom(), secondOrigin.y() - secondText.left()))
                                 .adjusted(-2, -2, 2, 2);
    int firstInk = 0;
    int secondInk = 0;
    for (int y = 0; y < scene.height; ++y) {
        for (int x = 0; x < scene.width; ++x) {
            if (x >= g.frameLeft && y <= g.frameBottom)
                continue;
            if ((image.pixel(x, y) | 0xff000000u) == kLow)
                continue;
            const bool inFirst = firstBox.contains(QPointF(x, y));
            const bool inSecond = secondBox.contains(QPointF(x, y));
            firstInk += inFirst ? 1 : 0;
            secondInk += inSecond ? 1 : 0;
            EXPECT_TRUE(inFirst || inSecond) << x << "," << y;
        }
    }
    if (!scene.first.isEmpty()) {
        EXPECT_GT(firstInk, 0);
    }
    if (!scene.second.isEmpty()) {
        EXPECT_GT(secondInk, 0);
    }
}

// The view colour is transparent: over another background only the pixels
// nothing paints change, and the one such stretch is the row above the
// frame's bottom line, which has no inner line of its own.
TEST_P(SplineControlPixelTest, OnlyTheUnpaintedRowShowsTheBackground)
{
    const Scene& scene = GetParam();
    auto control = MakeControl(scene);
    const QImage one = Render(*control, kBackground);
    const QImage other = Render(*control, kOtherBackground);
    const SplineGeometry g(control->font(), scene.width, scene.height);
    int shown = 0;
    for (int y = 0; y < scene.height; ++y) {
        for (int x = 0; x < scene.width; ++x) {
            if (one.pixel(x, y) == other.pixel(x, y))
                continue;
            ++shown;
            EXPECT_EQ(y, g.frameBottom - 1) << x;
            EXPECT_TRUE(x >= g.frameLeft + 2 && x <= g.frameRight - 2) << x;
            EXPECT_EQ(one.pixel(x, y) | 0xff000000u, kBackground);
        }
    }
    EXPECT_GT(shown, 0);
}

INSTANTIATE_TEST_SUITE_P(Scenes, SplineControlPixelTest, ::testing::ValuesIn(Scenes()),
    [](const ::testing::TestParamInfo<Scene>& info) { return std::string(info.param.name); });

// A level curve needs no line rasteriser at all: one row, every column from
// the area's left edge on, apart from the points' squares.
TEST(SplineControlPixels, LevelCurveIsOneRow)
{
    SplineControl control("curve", "Time", "Gain", 0.5f, 0.5f);
    control.resize(200, 150);
    control.show();
    ASSERT_TRUE(QTest::qWaitForWindowExposed(&control));
    const QImage image = Render(control, kBackground);
    const SplineGeometry g(control.font(), 200, 150);
    const int row = NearestPixel(g.top + 0.5 * g.Height());
    const int first = NearestPixel(g.left);
    const int last = NearestPixel(g.left + std::floor(g.Width()));
    for (int y = NearestPixel(g.top - 2); y <= NearestPixel(g.bottom + 2); ++y) {
        for (int x = NearestPixel(g.left - 2); x <= NearestPixel(g.right + 2); ++x) {
            const bool nearEnd = std::abs(x - first) <= 2 || std::abs(x - NearestPixel(g.right)) <= 2;
            const bool square = y >= row - 2 && y <= row + 2 && nearEnd;
            QRgb expected = qRgb(255, 255, 255);
            if (square)
                expected = kRed;
            else if (y == row && x >= first && x <= last)
                expected = kBlack;
            ASSERT_EQ(Colour(image.pixel(x, y)), Colour(expected)) << x << "," << y;
        }
    }
}

// Two points on one x make the spline divide by zero; the control still
// draws its frame and points, and leaves out what is not a number.
TEST(SplineControlPixels, CoincidentPointsStillDraw)
{
    SplineControl control("curve", "Time", "Gain", 0.25f, 0.75f);
    control.resize(200, 150);
    control.show();
    ASSERT_TRUE(QTest::qWaitForWindowExposed(&control));
    control.AddControlPoint({0.5, 0.2});
    control.AddControlPoint({0.5, 0.7});
    control.AddControlPoint({0.7, 0.4});
    const QImage image = Render(control, kBackground);
    const SplineGeometry g(control.font(), 200, 150);
    EXPECT_EQ(Colour(image.pixel(g.frameLeft, g.frameTop)), Colour(qRgb(194, 194, 194)));
    EXPECT_EQ(Colour(image.pixel(g.frameRight, g.frameBottom)), Colour(qRgb(255, 255, 255)));
    EXPECT_EQ(Colour(image.pixel(g.frameLeft + 1, g.frameTop + 1)), Colour(qRgb(108, 108, 108)));
    for (const QPointF& point : control.ControlPoints()) {
        const QPointF centre = g.At(point);
        EXPECT_EQ(Colour(image.pixel(NearestPixel(centre.x()), NearestPixel(centre.y()))), Colour(kRed));
    }
}

}  // namespace
}  // namespace glimmet::test
