#include "sound/SoftClip.h"

#include <cmath>

namespace glimmet {

namespace {

constexpr float kKnee = 0.3f;
constexpr float kBlendWidth = 0.7f;
constexpr float kParabolaWidth = 1.2f;

// The parabola part, rounded to single precision.
float Parabola(float x)
{
    return float(kKnee + kBlendWidth * (1.0 - std::pow((x - kKnee) / kParabolaWidth - 1.0f, 2.0)));
}

}  // namespace

float soft_clip(float x)
{
    if (x < -kKnee)
        return -soft_clip(-x);
    if (x <= kKnee)
        return x;
    if (x < 1.0f) {
        const double a = std::pow((x - kKnee) / kBlendWidth - 1.0f, 2.0);
        const float p = Parabola(x);
        const float oneMinusA = float(1.0 - a);
        return float(p * oneMinusA + x * a);
    }
    return Parabola(x);
}

}  // namespace glimmet
