#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace glimmet {

/// A piecewise cubic interpolant through knots with strictly increasing x,
/// with not-a-knot end conditions. On interval k (x[k] <= t <= x[k+1]) the
/// value is y[k] + b[k]*u + c[k]*u^2 + d[k]*u^3 with u = t - x[k].
///
/// By knot count: one knot gives a constant, two a straight line, three the
/// parabola through them, four or more the not-a-knot cubic spline. Left of
/// the first knot and right of the last, the first or last piece is
/// extrapolated; a knot belongs to the interval on its left.
///
/// Each of the five arrays holds max(n, 2) entries, so a single knot still
/// has a second x (+infinity) that stops the interval search. Increasing x
/// is not checked: equal abscissas divide by zero and give infinities or
/// NaN, never a read outside the arrays.
class Spline {
public:
    /// More knots than this are refused by Set, so no caller can make the
    /// class allocate an unbounded block (5 + 4 doubles per knot at most).
    static constexpr int32_t kMaxKnots = 1 << 20;

    Spline() = default;
    Spline(const double* x, const double* y, int32_t n);

    // Copies are deep; a moved-from curve is left unset.
    Spline(const Spline& other) = default;
    Spline& operator=(const Spline& other) = default;
    Spline(Spline&& other) noexcept;
    Spline& operator=(Spline&& other) noexcept;
    ~Spline() = default;

    /// Copies n knots and computes the coefficients. Keeps the current curve
    /// when n < 1, n > kMaxKnots or either pointer is null.
    void Set(const double* x, const double* y, int32_t n);
    /// Forgets every knot; the count becomes 0.
    void Unset();

    /// Evaluates at x0, x0 + dx, ..., x0 + (count - 1) * dx. The interval
    /// found for one abscissa is where the search for the next one starts, so
    /// the abscissas are expected to increase (dx > 0); a smaller one reuses
    /// the interval reached so far. While it runs, the last knot's x stands
    /// at +infinity as the search stop — for a single knot that is the
    /// piece's own origin, so every result is NaN.
    void Compute(double* out, double x0, double dx, int32_t count);
    /// Evaluates at arbitrary abscissas, searching from the first interval
    /// for each one. A single knot gives y[0] at every finite abscissa.
    void Compute(const double* xs, double* out, int32_t count) const;

    int32_t Count() const { return count_; }

    // Stored entries, index 0 .. max(n, 2) - 1; any other index reads 0.
    double KnotX(int32_t i) const { return EntryOf(x_, i); }
    double KnotY(int32_t i) const { return EntryOf(y_, i); }
    double Linear(int32_t i) const { return EntryOf(b_, i); }
    double Quadratic(int32_t i) const { return EntryOf(c_, i); }
    double Cubic(int32_t i) const { return EntryOf(d_, i); }

private:
    static double EntryOf(const std::vector<double>& entries, int32_t i);

    void ComputeConstant();
    void ComputeLine();
    void ComputeParabola();
    void ComputeNotAKnot();

    /// The interval holding t, searching upwards from `start`; never beyond
    /// the last piece, whatever the knots hold.
    std::size_t IntervalFrom(std::size_t start, double t) const;
    double PieceValue(std::size_t k, double t) const;

    int32_t count_ = 0;
    std::vector<double> x_;
    std::vector<double> y_;
    std::vector<double> b_;
    std::vector<double> c_;
    std::vector<double> d_;
};

}  // namespace glimmet
