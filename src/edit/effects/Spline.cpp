#include "edit/effects/Spline.h"

#include <algorithm>
#include <limits>
#include <utility>

namespace glimmet {

namespace {

constexpr double kInfinity = std::numeric_limits<double>::infinity();

// Storage per array: a single knot still needs a second x as search stop.
size_t EntriesFor(int32_t n)
{
    return size_t(std::max(n, 2));
}

// The tridiagonal system for the knot slopes of the not-a-knot spline,
// one row per knot.
struct SlopeSystem {
    std::vector<double> lower;
    std::vector<double> diagonal;
    std::vector<double> upper;
    std::vector<double> right;

    explicit SlopeSystem(size_t n) : lower(n, 0.0), diagonal(n, 0.0), upper(n, 0.0), right(n, 0.0) {}

    // Gaussian elimination without pivoting: the inner rows are diagonally
    // dominant for increasing knots, and the end rows only touch their
    // neighbour, so no row swap is needed.
    void Solve(std::vector<double>& solution)
    {
        const size_t n = diagonal.size();
        for (size_t i = 1; i < n; ++i) {
            const double multiplier = -lower[i] / diagonal[i - 1];
            diagonal[i] += multiplier * upper[i - 1];
            right[i] += multiplier * right[i - 1];
        }
        solution[n - 1] = right[n - 1] / diagonal[n - 1];
        for (size_t i = n - 1; i-- > 0;) {
            solution[i] = (right[i] - upper[i] * solution[i + 1]) / diagonal[i];
        }
    }
};

}  // namespace

Spline::Spline(const double* x, const double* y, int32_t n)
{
    Set(x, y, n);
}

Spline::Spline(Spline&& other) noexcept
    : count_(std::exchange(other.count_, 0)),
      x_(std::move(other.x_)),
      y_(std::move(other.y_)),
      b_(std::move(other.b_)),
      c_(std::move(other.c_)),
      d_(std::move(other.d_))
{
    other.Unset();
}

Spline& Spline::operator=(Spline&& other) noexcept
{
    if (this != &other) {
        count_ = std::exchange(other.count_, 0);
        x_ = std::move(other.x_);
        y_ = std::move(other.y_);
        b_ = std::move(other.b_);
        c_ = std::move(other.c_);
        d_ = std::move(other.d_);
        other.Unset();
    }
    return *this;
}

void Spline::Set(const double* x, const double* y, int32_t n)
{
    if (n < 1 || n > kMaxKnots || x == nullptr || y == nullptr) {
        return;
    }
    Unset();
    const size_t entries = EntriesFor(n);
    count_ = n;
    x_.assign(entries, 0.0);
    y_.assign(entries, 0.0);
    b_.assign(entries, 0.0);
    c_.assign(entries, 0.0);
    d_.assign(entries, 0.0);
    std::copy(x, x + n, x_.begin());
    std::copy(y, y + n, y_.begin());
    switch (n) {
    case 1: ComputeConstant(); break;
    case 2: ComputeLine(); break;
    case 3: ComputeParabola(); break;
    default: ComputeNotAKnot(); break;
    }
}

void Spline::Unset()
{
    count_ = 0;
    x_.clear();
    y_.clear();
    b_.clear();
    c_.clear();
    d_.clear();
    x_.shrink_to_fit();
    y_.shrink_to_fit();
    b_.shrink_to_fit();
    c_.shrink_to_fit();
    d_.shrink_to_fit();
}

void Spline::ComputeConstant()
{
    // The second x exists only to end the search; the piece is y[0] everywhere.
    x_[1] = kInfinity;
}

void Spline::ComputeLine()
{
    b_[0] = (y_[1] - y_[0]) / (x_[1] - x_[0]);
}

void Spline::ComputeParabola()
{
    // One parabola through all three points, written as two pieces that
    // share the quadratic coefficient.
    const double h1 = x_[1] - x_[0];
    const double h2 = x_[2] - x_[0];
    const double e1 = y_[1] - y_[0];
    const double c = ((y_[2] - y_[0]) - (h2 / h1) * e1) / (h2 * h2 - h1 * h2);
    b_[0] = (e1 - h1 * h1 * c) / h1;
    c_[0] = c;
    c_[1] = c;
    b_[1] = 2.0 * c * h1 + b_[0];
}

void Spline::ComputeNotAKnot()
{
    const size_t n = size_t(count_);
    // h[i] and s[i] describe interval i - 1 (index 0 unused).
    std::vector<double> h(n, 0.0);
    std::vector<double> s(n, 0.0);
    for (size_t i = 1; i < n; ++i) {
        h[i] = x_[i] - x_[i - 1];
        s[i] = (y_[i] - y_[i - 1]) / h[i];
    }
    const double p = x_[2] - x_[0];
    const double q = x_[n - 1] - x_[n - 3];

    SlopeSystem system(n);
    // Third derivative continuous at the second knot.
    system.diagonal[0] = h[2];
    system.upper[0] = p;
    system.right[0] = ((h[1] + 2.0 * p) * s[1] * h[2] + h[1] * h[1] * s[2]) / p;
    // Second derivative continuous at every inner knot.
    for (size_t i = 1; i + 1 < n; ++i) {
        system.lower[i] = h[i + 1];
        system.diagonal[i] = 2.0 * (h[i] + h[i + 1]);
        system.upper[i] = h[i];
        system.right[i] = 3.0 * (h[i + 1] * s[i] + h[i] * s[i + 1]);
    }
    // Third derivative continuous at the second-to-last knot.
    system.lower[n - 1] = q;
    system.diagonal[n - 1] = h[n - 2];
    system.right[n - 1] = ((h[n - 1] + 2.0 * q) * s[n - 1] * h[n - 2] + h[n - 1] * h[n - 1] * s[n - 2]) / q;
    system.Solve(b_);

    for (size_t k = 0; k + 1 < n; ++k) {
        const size_t i = k + 1;
        const double t = b_[k] + b_[k + 1] - 2.0 * s[i];
        c_[k] = ((s[i] - b_[k]) - t) / h[i];
        d_[k] = t / (h[i] * h[i]);
    }
}

void Spline::Compute(double* out, double x0, double dx, int32_t count)
{
    if (out == nullptr || count <= 0) {
        return;
    }
    if (count_ == 0) {
        std::fill(out, out + count, 0.0);
        return;
    }
    // The last knot as +infinity ends every search inside the last piece.
    // With a single knot it is also the piece's origin, which is why that
    // curve gives NaN here.
    const size_t last = size_t(count_) - 1;
    const double lastKnot = x_[last];
    x_[last] = kInfinity;
    size_t interval = 0;
    for (int32_t i = 0; i < count; ++i) {
        const double t = x0 + double(i) * dx;
        interval = IntervalFrom(interval, t);
        out[i] = PieceValue(interval, t);
    }
    x_[last] = lastKnot;
}

void Spline::Compute(const double* xs, double* out, int32_t count) const
{
    if (xs == nullptr || out == nullptr || count <= 0) {
        return;
    }
    for (int32_t i = 0; i < count; ++i) {
        out[i] = count_ == 0 ? 0.0 : PieceValue(IntervalFrom(0, xs[i]), xs[i]);
    }
}

size_t Spline::IntervalFrom(size_t start, double t) const
{
    // A single knot has one piece; n knots have n - 1.
    const size_t lastPiece = count_ > 1 ? size_t(count_) - 2 : 0;
    size_t i = std::min(start, lastPiece);
    while (i < lastPiece && x_[i + 1] < t) {
        ++i;
    }
    return i;
}

double Spline::PieceValue(size_t k, double t) const
{
    const double u = t - x_[k];
    return y_[k] + u * (b_[k] + u * (c_[k] + u * d_[k]));
}

double Spline::EntryOf(const std::vector<double>& entries, int32_t i)
{
    if (i < 0 || size_t(i) >= entries.size()) {
        return 0.0;
    }
    return entries[size_t(i)];
}

}  // namespace glimmet
