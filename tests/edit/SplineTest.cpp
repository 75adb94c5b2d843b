#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <random>
#include <vector>

#include "edit/effects/Spline.h"
#include "edit/SplineReference.h"

namespace glimmet {
namespace {

using spline_reference::ReferenceCurve;

struct Knots {
    std::vector<double> x;
    std::vector<double> y;
};

Spline SplineThrough(const Knots& knots)
{
    return Spline(knots.x.data(), knots.y.data(), int32_t(knots.x.size()));
}

// Gaps of at least 0.05 keep the systems well conditioned, so a tight
// tolerance compares the methods rather than their rounding.
Knots RandomKnots(std::mt19937& random, size_t n)
{
    std::uniform_real_distribution<double> start(-5.0, 5.0);
    std::uniform_real_distribution<double> gap(0.05, 2.0);
    std::uniform_real_distribution<double> value(-3.0, 3.0);
    Knots knots;
    double x = start(random);
    for (size_t i = 0; i < n; ++i) {
        knots.x.push_back(x);
        knots.y.push_back(value(random));
        x += gap(random);
    }
    return knots;
}

double ValueAt(const Spline& spline, double t)
{
    double out = 0.0;
    spline.Compute(&t, &out, 1);
    return out;
}

double Tolerance(double expected)
{
    return 1e-9 * (1.0 + std::fabs(expected));
}

// --- The four coefficient cases, checked at the knots ---

TEST(SplineTest, EveryCaseInterpolatesItsKnotsWithBothForms)
{
    std::mt19937 random(11);
    for (size_t n = 1; n <= 12; ++n) {
        const Knots knots = RandomKnots(random, n);
        Spline spline = SplineThrough(knots);
        for (size_t i = 0; i < n; ++i) {
            EXPECT_NEAR(ValueAt(spline, knots.x[i]), knots.y[i], 1e-12 * (1 + std::fabs(knots.y[i]))) << n << " knots, knot " << i;
            if (n > 1) {
                double out = 0.0;
                spline.Compute(&out, knots.x[i], 1.0, 1);
                EXPECT_NEAR(out, knots.y[i], 1e-12 * (1 + std::fabs(knots.y[i]))) << n << " knots, knot " << i;
            }
        }
    }
}

TEST(SplineTest, TwoKnotsGiveAStraightLine)
{
    const Knots knots{{1.0, 3.0}, {2.0, -2.0}};
    const Spline spline = SplineThrough(knots);
    EXPECT_DOUBLE_EQ(spline.Linear(0), -2.0);
    EXPECT_EQ(spline.Quadratic(0), 0.0);
    EXPECT_EQ(spline.Cubic(0), 0.0);
    for (double t = -2.0; t <= 6.0; t += 0.125) {
        EXPECT_NEAR(ValueAt(spline, t), 2.0 - 2.0 * (t - 1.0), 1e-12) << t;
    }
}

TEST(SplineTest, ThreeKnotsGiveOneParabolaOnBothIntervals)
{
    // y = 2 - (t - 1)^2 through 0, 1 and 3.
    auto parabola = [](double t) { return 2.0 - (t - 1.0) * (t - 1.0); };
    const Knots knots{{0.0, 1.0, 3.0}, {parabola(0.0), parabola(1.0), parabola(3.0)}};
    const Spline spline = SplineThrough(knots);
    EXPECT_EQ(spline.Cubic(0), 0.0);
    EXPECT_EQ(spline.Cubic(1), 0.0);
    EXPECT_DOUBLE_EQ(spline.Quadratic(0), -1.0);
    EXPECT_DOUBLE_EQ(spline.Quadratic(1), -1.0);
    for (double t = -2.0; t <= 5.0; t += 0.0625) {
        EXPECT_NEAR(ValueAt(spline, t), parabola(t), 1e-12) << t;
    }
}

// Slope and curvature where piece k - 1 ends must be those where piece k
// starts; the coefficients are the derivatives at a piece's left knot.
void ExpectSmoothAtInnerKnots(const Spline& spline, const Knots& knots)
{
    for (int32_t k = 1; k + 1 < int32_t(knots.x.size()); ++k) {
        const double h = knots.x[size_t(k)] - knots.x[size_t(k) - 1];
        const double b = spline.Linear(k - 1), c = spline.Quadratic(k - 1), d = spline.Cubic(k - 1);
        const double slopeAtEnd = b + 2 * c * h + 3 * d * h * h;
        const double curvatureAtEnd = 2 * c + 6 * d * h;
        EXPECT_NEAR(slopeAtEnd, spline.Linear(k), Tolerance(slopeAtEnd)) << "knot " << k;
        EXPECT_NEAR(curvatureAtEnd, 2 * spline.Quadratic(k), Tolerance(curvatureAtEnd)) << "knot " << k;
    }
}

TEST(SplineTest, ParabolaIsSmoothAtItsMiddleKnot)
{
    std::mt19937 random(3);
    for (int round = 0; round < 50; ++round) {
        const Knots knots = RandomKnots(random, 3);
        ExpectSmoothAtInnerKnots(SplineThrough(knots), knots);
    }
}

TEST(SplineTest, CubicSplineHasContinuousFirstAndSecondDerivatives)
{
    std::mt19937 random(5);
    for (size_t n = 4; n <= 12; ++n) {
        const Knots knots = RandomKnots(random, n);
        ExpectSmoothAtInnerKnots(SplineThrough(knots), knots);
    }
}

TEST(SplineTest, CubicSplineHasNoKnotAtTheSecondAndSecondToLastKnot)
{
    std::mt19937 random(7);
    for (size_t n = 4; n <= 12; ++n) {
        const Knots knots = RandomKnots(random, n);
        const Spline spline = SplineThrough(knots);
        const int32_t last = int32_t(n) - 1;
        EXPECT_NEAR(spline.Cubic(0), spline.Cubic(1), Tolerance(spline.Cubic(0))) << n << " knots";
        EXPECT_NEAR(spline.Cubic(last - 2), spline.Cubic(last - 1), Tolerance(spline.Cubic(last - 1))) << n << " knots";
    }
}

TEST(SplineTest, FourKnotsOnACubicReproduceIt)
{
    auto cubic = [](double t) { return 0.5 * t * t * t - t * t + 2.0 * t - 1.0; };
    const Knots knots{{-1.0, 0.5, 1.25, 3.0}, {cubic(-1.0), cubic(0.5), cubic(1.25), cubic(3.0)}};
    const Spline spline = SplineThrough(knots);
    for (double t = -3.0; t <= 5.0; t += 0.03125) {
        EXPECT_NEAR(ValueAt(spline, t), cubic(t), 1e-10) << t;
    }
}

// --- Against the independent construction ---

std::vector<double> SortedAbscissas(std::mt19937& random, const Knots& knots, size_t count)
{
    const double span = knots.x.back() - knots.x.front() + 1.0;
    std::uniform_real_distribution<double> position(knots.x.front() - 0.5 * span, knots.x.back() + 0.5 * span);
    std::vector<double> abscissas(count);
    for (double& t : abscissas) {
        t = position(random);
    }
    abscissas.insert(abscissas.end(), knots.x.begin(), knots.x.end());
    std::sort(abscissas.begin(), abscissas.end());
    return abscissas;
}

// Five random knot sets of every size from 1 to 12, with their reference.
template <typename Check>
void ForRandomKnotSets(unsigned seed, Check check)
{
    std::mt19937 random(seed);
    for (int round = 0; round < 5; ++round) {
        for (size_t n = 1; n <= 12; ++n) {
            const Knots knots = RandomKnots(random, n);
            check(random, knots, ReferenceCurve(knots.x, knots.y));
        }
    }
}

TEST(SplineTest, ArbitraryAbscissasMatchTheReferenceForRandomKnots)
{
    ForRandomKnotSets(2024, [](std::mt19937& random, const Knots& knots, const ReferenceCurve& reference) {
        std::vector<double> abscissas = SortedAbscissas(random, knots, 3000);
        std::shuffle(abscissas.begin(), abscissas.end(), random);
        std::vector<double> out(abscissas.size());
        SplineThrough(knots).Compute(abscissas.data(), out.data(), int32_t(out.size()));
        for (size_t i = 0; i < out.size(); ++i) {
            const double expected = reference.ValueAt(abscissas[i]);
            ASSERT_NEAR(out[i], expected, Tolerance(expected)) << knots.x.size() << " knots at " << abscissas[i];
        }
    });
}

TEST(SplineTest, EvenlySpacedRangeMatchesTheReferenceForRandomKnots)
{
    ForRandomKnotSets(4711, [](std::mt19937&, const Knots& knots, const ReferenceCurve& reference) {
        const size_t n = knots.x.size();
        const double span = std::max(knots.x.back() - knots.x.front(), 1.0);
        const double x0 = knots.x.front() - 0.25 * span;
        const int32_t count = 4000;
        const double dx = 1.5 * span / count;
        std::vector<double> out(static_cast<size_t>(count));
        Spline spline = SplineThrough(knots);
        spline.Compute(out.data(), x0, dx, count);
        for (int32_t i = 0; i < count; ++i) {
            const double t = x0 + double(i) * dx;
            if (n == 1) {
                // The lone knot's origin is the search stop here.
                ASSERT_TRUE(std::isnan(out[size_t(i)])) << t;
                continue;
            }
            const double expected = reference.ValueAt(t);
            ASSERT_NEAR(out[size_t(i)], expected, Tolerance(expected)) << n << " knots at " << t;
        }
        EXPECT_EQ(spline.KnotX(int32_t(n) - 1), knots.x.back()) << "the search stop is taken back";
    });
}

TEST(SplineTest, RangeGoingBackwardsKeepsTheIntervalReachedSoFar)
{
    std::mt19937 random(9);
    const Knots knots = RandomKnots(random, 6);
    const ReferenceCurve reference(knots.x, knots.y);
    Spline spline = SplineThrough(knots);
    const double x0 = knots.x.back() + 1.0;
    const double dx = -0.01;
    const int32_t count = 2000;
    std::vector<double> out(static_cast<size_t>(count));
    spline.Compute(out.data(), x0, dx, count);
    // The first abscissa lies right of every knot, so every value comes
    // from the last piece, however far left the range goes.
    const size_t lastPiece = reference.PieceCount() - 1;
    for (int32_t i = 0; i < count; ++i) {
        const double t = x0 + double(i) * dx;
        const double expected = reference.ValueOfPiece(lastPiece, t);
        ASSERT_NEAR(out[size_t(i)], expected, Tolerance(expected)) << t;
    }
}

TEST(SplineTest, ValuesOutsideTheKnotsExtendTheEndPieces)
{
    std::mt19937 random(13);
    const Knots knots = RandomKnots(random, 7);
    const ReferenceCurve reference(knots.x, knots.y);
    const Spline spline = SplineThrough(knots);
    for (double offset : {0.5, 2.0, 10.0}) {
        const double left = knots.x.front() - offset;
        const double right = knots.x.back() + offset;
        const double expectedLeft = reference.ValueOfPiece(0, left);
        const double expectedRight = reference.ValueOfPiece(reference.PieceCount() - 1, right);
        EXPECT_NEAR(ValueAt(spline, left), expectedLeft, Tolerance(expectedLeft));
        EXPECT_NEAR(ValueAt(spline, right), expectedRight, Tolerance(expectedRight));
    }
}

// --- A single knot ---

TEST(SplineTest, SingleKnotIsAConstantForArbitraryAbscissas)
{
    const double x = 0.25, y = 0.75;
    const Spline spline(&x, &y, 1);
    EXPECT_EQ(spline.Count(), 1);
    EXPECT_EQ(spline.KnotX(1), std::numeric_limits<double>::infinity());
    for (double t : {-100.0, 0.0, 0.25, 0.5, 1.0, 1e6}) {
        EXPECT_EQ(ValueAt(spline, t), y) << t;
    }
}

TEST(SplineTest, SingleKnotRangeIsNotANumberAndLeavesTheKnotAsItWas)
{
    const double x = 0.25, y = 0.75;
    Spline spline(&x, &y, 1);
    std::vector<double> out(5, 1.0);
    spline.Compute(out.data(), 0.0, 0.25, 5);
    for (double value : out) {
        EXPECT_TRUE(std::isnan(value));
    }
    EXPECT_EQ(spline.KnotX(0), x);
    EXPECT_EQ(ValueAt(spline, 0.5), y);
}

// --- Unset curves, refused input, reads past the data ---

TEST(SplineTest, EmptyCurveEvaluatesToZero)
{
    Spline spline;
    EXPECT_EQ(spline.Count(), 0);
    EXPECT_EQ(ValueAt(spline, 0.5), 0.0);
    std::vector<double> out(3, 1.0);
    spline.Compute(out.data(), 0.0, 0.5, 3);
    EXPECT_EQ(out, std::vector<double>(3, 0.0));
}

TEST(SplineTest, SetWithoutUsableKnotsKeepsTheCurve)
{
    const Knots knots{{0.0, 1.0}, {0.0, 1.0}};
    Spline spline = SplineThrough(knots);
    spline.Set(knots.x.data(), knots.y.data(), 0);
    spline.Set(knots.x.data(), knots.y.data(), -5);
    spline.Set(nullptr, knots.y.data(), 2);
    spline.Set(knots.x.data(), nullptr, 2);
    // Too many knots is refused before anything is read or allocated.
    spline.Set(knots.x.data(), knots.y.data(), Spline::kMaxKnots + 1);
    spline.Set(knots.x.data(), knots.y.data(), std::numeric_limits<int32_t>::max());
    EXPECT_EQ(spline.Count(), 2);
    EXPECT_DOUBLE_EQ(ValueAt(spline, 0.5), 0.5);
}

TEST(SplineTest, UnsetForgetsEveryKnot)
{
    const Knots knots{{0.0, 1.0, 2.0}, {1.0, 0.0, 1.0}};
    Spline spline = SplineThrough(knots);
    spline.Unset();
    EXPECT_EQ(spline.Count(), 0);
    EXPECT_EQ(spline.KnotX(0), 0.0);
    EXPECT_EQ(ValueAt(spline, 1.0), 0.0);
}

TEST(SplineTest, ReadsOutsideTheStoredEntriesGiveZero)
{
    const Knots knots{{0.0, 1.0, 2.0, 3.0}, {1.0, 2.0, 0.0, 4.0}};
    const Spline spline = SplineThrough(knots);
    EXPECT_EQ(spline.KnotX(3), 3.0);
    for (int32_t i : {-1, 4, 1000, std::numeric_limits<int32_t>::min()}) {
        EXPECT_EQ(spline.KnotX(i), 0.0);
        EXPECT_EQ(spline.KnotY(i), 0.0);
        EXPECT_EQ(spline.Linear(i), 0.0);
        EXPECT_EQ(spline.Quadratic(i), 0.0);
        EXPECT_EQ(spline.Cubic(i), 0.0);
    }
}

TEST(SplineTest, NullOrEmptyOutputIsLeftAlone)
{
    const Knots knots{{0.0, 1.0}, {0.0, 1.0}};
    Spline spline = SplineThrough(knots);
    double t = 0.5, out = -1.0;
    spline.Compute(nullptr, 0.0, 0.1, 10);
    spline.Compute(&out, 0.0, 0.1, 0);
    spline.Compute(nullptr, &out, 1);
    spline.Compute(&t, nullptr, 1);
    spline.Compute(&t, &out, -1);
    EXPECT_EQ(out, -1.0);
}

TEST(SplineTest, CoincidentKnotsGiveNonFiniteValuesWithoutFailing)
{
    // A click exactly on an existing x gives two knots with the same x.
    for (const Knots& knots : {Knots{{0.0, 0.0}, {0.0, 1.0}}, Knots{{0.0, 0.5, 0.5}, {0.0, 1.0, 0.0}},
             Knots{{0.0, 0.5, 0.5, 1.0, 1.5}, {0.0, 1.0, 0.0, 1.0, 0.0}}}) {
        Spline spline = SplineThrough(knots);
        std::vector<double> out(50);
        spline.Compute(out.data(), -0.5, 0.05, 50);
        EXPECT_TRUE(std::any_of(out.begin(), out.end(), [](double v) { return !std::isfinite(v); }));
    }
}

// --- Copies ---

TEST(SplineTest, CopyIsDeepAndIndependent)
{
    std::mt19937 random(17);
    const Knots first = RandomKnots(random, 6);
    const Knots second = RandomKnots(random, 4);
    Spline original = SplineThrough(first);
    const Spline copy(original);
    original.Set(second.x.data(), second.y.data(), 4);
    const ReferenceCurve reference(first.x, first.y);
    EXPECT_EQ(copy.Count(), 6);
    for (size_t i = 0; i < first.x.size(); ++i) {
        EXPECT_EQ(copy.KnotX(int32_t(i)), first.x[i]);
        const double t = first.x[i] + 0.01;
        EXPECT_NEAR(ValueAt(copy, t), reference.ValueAt(t), Tolerance(reference.ValueAt(t)));
    }
}

TEST(SplineTest, AssignmentReplacesTheCurveAndStaysIndependent)
{
    std::mt19937 random(19);
    const Knots first = RandomKnots(random, 8);
    const Knots second = RandomKnots(random, 3);
    Spline source = SplineThrough(first);
    Spline target = SplineThrough(second);
    target = source;
    source.Unset();
    EXPECT_EQ(target.Count(), 8);
    for (size_t i = 0; i < first.x.size(); ++i) {
        EXPECT_NEAR(ValueAt(target, first.x[i]), first.y[i], Tolerance(first.y[i]));
    }
    EXPECT_EQ(target.KnotX(8), 0.0);
}

TEST(SplineTest, SelfAssignmentKeepsTheCurve)
{
    const Knots knots{{0.0, 1.0, 2.0, 4.0, 5.0}, {1.0, 3.0, 2.0, 0.0, 1.0}};
    Spline spline = SplineThrough(knots);
    const double before = ValueAt(spline, 3.0);
    Spline& alias = spline;
    spline = alias;
    EXPECT_EQ(spline.Count(), 5);
    EXPECT_EQ(ValueAt(spline, 3.0), before);
}

TEST(SplineTest, MovingLeavesTheSourceUnset)
{
    const Knots knots{{0.0, 1.0, 2.0}, {1.0, 3.0, 2.0}};
    Spline source = SplineThrough(knots);
    Spline target(std::move(source));
    EXPECT_EQ(target.Count(), 3);
    EXPECT_EQ(source.Count(), 0);  // NOLINT(bugprone-use-after-move): the moved-from state is defined
    EXPECT_EQ(ValueAt(source, 1.0), 0.0);
    Spline assigned;
    assigned = std::move(target);
    EXPECT_EQ(assigned.Count(), 3);
    EXPECT_EQ(target.Count(), 0);  // NOLINT(bugprone-use-after-move)
    EXPECT_DOUBLE_EQ(ValueAt(assigned, 1.0), 3.0);
}

}  // namespace
}  // namespace glimmet
