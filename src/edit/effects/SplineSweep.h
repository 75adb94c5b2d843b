#pragma once

#include <cstddef>
#include <vector>

#include "edit/effects/Spline.h"

namespace glimmet::effects {

/// A spline evaluated at one abscissa after another, giving at each the same
/// double as the spline's const Compute, without that form's search from the
/// first piece every time.
///
/// Why the results are the same: Compute takes the piece k found by "start at
/// 0, advance while k is not the last piece and x[k + 1] < t", then
/// y[k] + u * (b[k] + u * (c[k] + u * d[k])) with u = t - x[k]. Each test
/// x[k + 1] < t that holds for t also holds for any larger t, so the pieces
/// that search passes over for t are passed over for every later, larger t
/// too, and resuming from the piece reached for t finds the same piece; the
/// value is then the same expression on the same coefficients. That holds for
/// knots in any order, not-a-number included (a comparison with NaN never
/// holds). An abscissa smaller than the one before (or not a number) restarts
/// the search at piece 0, which is Compute's own search.
class SplineSweep {
public:
    explicit SplineSweep(const Spline& spline);

    /// The spline at t; 0 for a spline without knots.
    double operator()(double t)
    {
        if (empty_) {
            return 0.0;
        }
        return Value(PieceAt(t), t);
    }

    /// The piece Compute would use for t, searching on from the previous one
    /// when t is not smaller than the previous abscissa.
    size_t PieceAt(double t)
    {
        if (!(t >= previous_)) {
            piece_ = 0;
        }
        previous_ = t;
        while (piece_ < lastPiece_ && x_[piece_ + 1] < t) {
            ++piece_;
        }
        return piece_;
    }

    /// Piece k's cubic at t, in the order Compute evaluates it.
    double Value(size_t k, double t) const
    {
        const double u = t - x_[k];
        return y_[k] + u * (b_[k] + u * (c_[k] + u * d_[k]));
    }

    bool Empty() const { return empty_; }
    size_t LastPiece() const { return lastPiece_; }
    /// The knot a search in piece k compares with; past the last piece's
    /// there is no test.
    double SearchStop(size_t k) const { return x_[k + 1]; }
    double KnotX(size_t k) const { return x_[k]; }
    double KnotY(size_t k) const { return y_[k]; }
    double Linear(size_t k) const { return b_[k]; }
    double Quadratic(size_t k) const { return c_[k]; }
    double Cubic(size_t k) const { return d_[k]; }

private:
    bool empty_;
    size_t lastPiece_;
    size_t piece_ = 0;
    double previous_;
    std::vector<double> x_;
    std::vector<double> y_;
    std::vector<double> b_;
    std::vector<double> c_;
    std::vector<double> d_;
};

}  // namespace glimmet::effects
