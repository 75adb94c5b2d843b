#pragma once

namespace glimmet {

/// The mixer's soft-clipping curve for the sum of two or more channels on
/// one side: the identity up to 0.3 in magnitude, then a blend into a
/// parabola that peaks at 1.0 for x = 1.5 and falls again above it. The
/// parabola is not clamped, so very loud sums fold back down.
float soft_clip(float x);

}  // namespace glimmet
