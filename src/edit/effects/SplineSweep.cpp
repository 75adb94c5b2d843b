#include "edit/effects/SplineSweep.h"

#include <cstdint>
#include <limits>

namespace glimmet::effects {

SplineSweep::SplineSweep(const Spline& spline)
    : empty_(spline.Count() == 0),
      lastPiece_(spline.Count() > 1 ? size_t(spline.Count()) - 2 : 0),
      previous_(-std::numeric_limits<double>::infinity())
{
    // A spline stores at least two entries per array, so a single knot still
    // has the second x that stops its search.
    const int32_t entries = spline.Count() < 2 ? 2 : spline.Count();
    for (int32_t i = 0; i < entries; ++i) {
        x_.push_back(spline.KnotX(i));
        y_.push_back(spline.KnotY(i));
        b_.push_back(spline.Linear(i));
        c_.push_back(spline.Quadratic(i));
        d_.push_back(spline.Cubic(i));
    }
}

}  // namespace glimmet::effects
