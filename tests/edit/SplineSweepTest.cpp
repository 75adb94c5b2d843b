#include "edit/effects/SplineSweep.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <random>
#include <vector>

#include "edit/effects/Spline.h"

namespace glimmet {
namespace {

using effects::SplineSweep;

// The definition the sweep must reproduce bit for bit: the const Compute,
// which searches from the first piece at every abscissa.
double Defined(const Spline& spline, double t)
{
    double out = 0.0;
    spline.Compute(&t, &out, 1);
    return out;
}

// Equal as stored doubles, so that two NaN results (and the sign of zero)
// are compared too.
bool SameBits(double a, double b)
{
    return std::memcmp(&a, &b, sizeof a) == 0;
}

// Knots on [0, 1] with both ends among them, as a curve control has them,
// or spread anywhere when `anywhere` (left of 0, beyond 1, close together).
Spline RandomSpline(std::mt19937& random, int32_t n, bool anywhere)
{
    std::uniform_real_distribution<double> unit(0.0, 1.0);
    std::uniform_real_distribution<double> value(-2.0, 3.0);
    std::vector<double> x;
    for (int32_t i = 0; i < n; ++i)
        x.push_back(anywhere ? 4.0 * unit(random) - 1.5 : unit(random));
    std::sort(x.begin(), x.end());
    if (!anywhere && n >= 2) {
        x.front() = 0.0;
        x.back() = 1.0;
    }
    std::vector<double> y;
    for (int32_t i = 0; i < n; ++i)
        y.push_back(value(random));
    return Spline(x.data(), y.data(), n);
}

// Increasing abscissas over [0, 1): 0, every knot exactly and the doubles
// either side of it, random points and the last double below 1.
std::vector<double> Abscissas(std::mt19937& random, const Spline& spline)
{
    std::vector<double> t = {0.0, std::nextafter(0.0, 1.0), std::nextafter(1.0, 0.0)};
    for (int32_t i = 0; i < spline.Count(); ++i) {
        const double knot = spline.KnotX(i);
        t.push_back(knot);
        t.push_back(std::nextafter(knot, -1.0));
        t.push_back(std::nextafter(knot, 2.0));
    }
    std::uniform_real_distribution<double> unit(0.0, 1.0);
    for (int i = 0; i < 500; ++i)
        t.push_back(unit(random));
    std::sort(t.begin(), t.end());
    return t;
}

TEST(SplineSweepTest, IncreasingAbscissasGiveTheConstComputeBitForBit)
{
    std::mt19937 random(31);
    for (int round = 0; round < 40; ++round) {
        for (int32_t n = 1; n <= 12; ++n) {
            const Spline spline = RandomSpline(random, n, round % 2 == 1);
            SplineSweep sweep(spline);
            for (double t : Abscissas(random, spline)) {
                ASSERT_TRUE(SameBits(sweep(t), Defined(spline, t))) << n << " knots at " << t;
            }
        }
    }
}

TEST(SplineSweepTest, EvenlySpacedFramePositionsGiveTheConstComputeBitForBit)
{
    // The envelope's positions i / n, the form it evaluates the curve at.
    std::mt19937 random(32);
    for (int32_t n = 1; n <= 12; ++n) {
        const Spline spline = RandomSpline(random, n, false);
        SplineSweep sweep(spline);
        const size_t frames = 10007;
        for (size_t i = 0; i < frames; ++i) {
            const double t = double(i) / double(frames);
            ASSERT_TRUE(SameBits(sweep(t), Defined(spline, t))) << n << " knots, frame " << i;
        }
    }
}

TEST(SplineSweepTest, SmallerAbscissasAndNotANumberSearchFromTheFirstPieceAgain)
{
    std::mt19937 random(33);
    std::uniform_real_distribution<double> any(-0.5, 1.5);
    const double nan = std::numeric_limits<double>::quiet_NaN();
    for (int32_t n = 1; n <= 12; ++n) {
        const Spline spline = RandomSpline(random, n, n % 2 == 0);
        SplineSweep sweep(spline);
        for (int i = 0; i < 2000; ++i) {
            const double t = i % 97 == 0 ? nan : any(random);
            ASSERT_TRUE(SameBits(sweep(t), Defined(spline, t))) << n << " knots at " << t;
        }
    }
}

TEST(SplineSweepTest, UnorderedAndCoincidentKnotsGiveTheConstComputeBitForBit)
{
    // Nothing checks that the knots increase; the sweep must still agree.
    std::mt19937 random(34);
    std::uniform_real_distribution<double> unit(0.0, 1.0);
    for (int32_t n = 2; n <= 12; ++n) {
        std::vector<double> x;
        std::vector<double> y;
        for (int32_t i = 0; i < n; ++i) {
            x.push_back(i % 3 == 2 ? x.back() : unit(random));
            y.push_back(unit(random));
        }
        const Spline spline(x.data(), y.data(), n);
        SplineSweep sweep(spline);
        for (int i = 0; i <= 3000; ++i) {
            const double t = double(i) / 3000.0;
            ASSERT_TRUE(SameBits(sweep(t), Defined(spline, t))) << n << " knots at " << t;
        }
    }
}

TEST(SplineSweepTest, ASplineWithoutKnotsIsZero)
{
    const Spline empty;
    SplineSweep sweep(empty);
    EXPECT_TRUE(sweep.Empty());
    EXPECT_EQ(sweep(0.0), 0.0);
    EXPECT_EQ(sweep(0.5), 0.0);
}

}  // namespace
}  // namespace glimmet
