#pragma once

// An interpolant built from first principles, to check Spline against
// without using any of its formulas: every piece's four coefficients are
// unknowns of one dense linear system made of the interpolation and
// continuity conditions, solved by Gaussian elimination with partial
// pivoting.

#include <array>
#include <cmath>
#include <cstddef>
#include <utility>
#include <vector>

namespace glimmet::spline_reference {

// Solves a * solution = rhs in place; a is square, row-major.
inline std::vector<double> SolveDense(std::vector<std::vector<double>> a, std::vector<double> rhs)
{
    const size_t n = rhs.size();
    for (size_t col = 0; col < n; ++col) {
        size_t pivot = col;
        for (size_t row = col + 1; row < n; ++row) {
            if (std::fabs(a[row][col]) > std::fabs(a[pivot][col])) {
                pivot = row;
            }
        }
        std::swap(a[col], a[pivot]);
        std::swap(rhs[col], rhs[pivot]);
        for (size_t row = col + 1; row < n; ++row) {
            const double factor = a[row][col] / a[col][col];
            for (size_t k = col; k < n; ++k) {
                a[row][k] -= factor * a[col][k];
            }
            rhs[row] -= factor * rhs[col];
        }
    }
    std::vector<double> solution(n, 0.0);
    for (size_t row = n; row-- > 0;) {
        double sum = rhs[row];
        for (size_t k = row + 1; k < n; ++k) {
            sum -= a[row][k] * solution[k];
        }
        solution[row] = sum / a[row][row];
    }
    return solution;
}

// Coefficients of u^0 .. u^3 of one piece, u measured from the piece's
// left knot.
using Piece = std::array<double, 4>;

class ReferenceCurve {
public:
    ReferenceCurve(std::vector<double> x, std::vector<double> y) : x_(std::move(x)), y_(std::move(y))
    {
        const size_t n = x_.size();
        if (n == 1) {
            pieces_.push_back({y_[0], 0.0, 0.0, 0.0});
        } else if (n == 2) {
            pieces_.push_back({y_[0], (y_[1] - y_[0]) / (x_[1] - x_[0]), 0.0, 0.0});
        } else if (n == 3) {
            BuildParabola();
        } else {
            BuildNotAKnot();
        }
    }

    // Knots belong to the interval on their left; outside, the first or
    // last piece goes on.
    double ValueAt(double t) const
    {
        size_t k = 0;
        for (size_t j = 1; j + 1 < x_.size(); ++j) {
            if (x_[j] < t) {
                k = j;
            }
        }
        return ValueOfPiece(k, t);
    }

    double ValueOfPiece(size_t k, double t) const
    {
        const double u = t - Origin(k);
        const Piece& p = pieces_[k];
        return p[0] + p[1] * u + p[2] * u * u + p[3] * u * u * u;
    }

    size_t PieceCount() const { return pieces_.size(); }

private:
    // The parabola's pieces all measure u from x[0].
    double Origin(size_t k) const { return x_.size() == 3 ? x_[0] : x_[k]; }

    void BuildParabola()
    {
        std::vector<std::vector<double>> a(3, std::vector<double>(3, 0.0));
        for (size_t row = 0; row < 3; ++row) {
            const double u = x_[row] - x_[0];
            a[row] = {1.0, u, u * u};
        }
        const std::vector<double> p = SolveDense(a, y_);
        pieces_.assign(2, {p[0], p[1], p[2], 0.0});
    }

    void BuildNotAKnot()
    {
        const size_t n = x_.size();
        const size_t unknowns = 4 * (n - 1);
        std::vector<std::vector<double>> a;
        std::vector<double> rhs;
        auto addRow = [&](std::vector<std::pair<size_t, double>> terms, double value) {
            std::vector<double> row(unknowns, 0.0);
            for (const auto& [column, factor] : terms) {
                row[column] += factor;
            }
            a.push_back(std::move(row));
            rhs.push_back(value);
        };
        for (size_t k = 0; k + 1 < n; ++k) {
            const size_t o = 4 * k;
            const double h = x_[k + 1] - x_[k];
            addRow({{o, 1.0}}, y_[k]);
            addRow({{o, 1.0}, {o + 1, h}, {o + 2, h * h}, {o + 3, h * h * h}}, y_[k + 1]);
        }
        for (size_t j = 1; j + 1 < n; ++j) {
            const size_t left = 4 * (j - 1);
            const size_t right = 4 * j;
            const double h = x_[j] - x_[j - 1];
            addRow({{left + 1, 1.0}, {left + 2, 2 * h}, {left + 3, 3 * h * h}, {right + 1, -1.0}}, 0.0);
            addRow({{left + 2, 2.0}, {left + 3, 6 * h}, {right + 2, -2.0}}, 0.0);
        }
        for (size_t j : {size_t(1), n - 2}) {
            addRow({{4 * (j - 1) + 3, 1.0}, {4 * j + 3, -1.0}}, 0.0);
        }
        const std::vector<double> s = SolveDense(a, rhs);
        for (size_t k = 0; k + 1 < n; ++k) {
            pieces_.push_back({s[4 * k], s[4 * k + 1], s[4 * k + 2], s[4 * k + 3]});
        }
    }

    std::vector<double> x_;
    std::vector<double> y_;
    std::vector<Piece> pieces_;
};

}  // namespace glimmet::spline_reference
