#pragma once

#include <cmath>

#include "edit/effects/Spline.h"

namespace glimmet::effects {

/// The curve a user drew in a curve control, as the effects read it: the
/// spline through the control's points on [0, 1], and 0 anywhere else (left
/// of 0, right of 1, or not a number). Inside [0, 1] the value is the
/// spline's, unclamped, in the control's normalised y (0 is the top edge).
///
/// A copy taken from the control when an effect runs, so the effect's loop
/// calls no widget.
class SplineCurve {
public:
    SplineCurve() = default;
    explicit SplineCurve(Spline spline) : spline_(std::move(spline)) {}

    double operator()(double x) const
    {
        if (std::isnan(x) || x < 0.0 || x > 1.0) {
            return 0.0;
        }
        double value = 0.0;
        spline_.Compute(&x, &value, 1);
        return value;
    }

    const Spline& Knots() const { return spline_; }

private:
    Spline spline_;
};

}  // namespace glimmet::effects
