#pragma once

#include <cstdint>

namespace glimmet {

/// The mixer's soft-clipping curve for the sum of two or more channels on
/// one side: the identity up to 0.3 in magnitude, then a blend into a
/// parabola that peaks at 1.0 for x = 1.5 and falls again above it. The
/// parabola is not clamped, so very loud sums fold back down.
float soft_clip(float x);

namespace soft_clip_detail {

constexpr float kKnee = 0.3f;
constexpr float kBlendWidth = 0.7f;
constexpr float kParabolaWidth = 1.2f;

// The parabola part, rounded to single precision. The base is a float, so
// its square is exact in double precision and equals what pow(base, 2.0)
// returns.
inline float Parabola(float x)
{
    const double base = double((x - kKnee) / kParabolaWidth - 1.0f);
    return float(kKnee + kBlendWidth * (1.0 - base * base));
}

// The blend between the identity and the parabola, for 0.3 < x < 1.
inline float Blend(float x, float parabola)
{
    const double base = double((x - kKnee) / kBlendWidth - 1.0f);
    const double a = base * base;
    const float oneMinusA = float(1.0 - a);
    return float(parabola * oneMinusA + x * a);
}

}  // namespace soft_clip_detail

/// soft_clip of count values in vector code: out[i] = soft_clip(in[i]), bit
/// for bit on every input (negative zero, infinities and not-a-number
/// included). The arrays may be the same one, but must not overlap
/// otherwise.
void soft_clip_block(const float* in, float* out, int64_t count);

}  // namespace glimmet
