#include "views/FrameMapping.h"

#include <cmath>

namespace glimmet {

int64_t TruncateToFrame(float value)
{
    if (std::isnan(value))
        return 0;
    // Far beyond any document; the headroom lets callers add a frame offset
    // to the result without overflowing.
    constexpr float kLimit = 4611686018427387904.0f;  // 2^62
    if (value >= kLimit)
        return int64_t(1) << 62;
    if (value <= -kLimit)
        return -(int64_t(1) << 62);
    return int64_t(value);
}

float FrameMapping::PosAt(int64_t frame) const
{
    const int64_t divisor = last_ - first_;
    if (divisor == 0)
        return -1.0f;
    // The product is exact in double for every realistic document, so the
    // quotient is rounded to single precision exactly once.
    const double quotient = double(frame - first_) * double(width_ - 1.0f) / double(divisor);
    return std::ceil(float(quotient)) - 1.0f;
}

float FrameMapping::FramesPerColumn() const
{
    const float span = float(last_ - first_ + 1);
    return span / (width_ - 1.0f);
}

int64_t FrameMapping::FirstFrameAt(float x) const
{
    return TruncateToFrame(x * FramesPerColumn()) + first_;
}

int64_t FrameMapping::LastFrameAt(float x) const
{
    return TruncateToFrame((x + 1.0f) * FramesPerColumn()) + first_ - 1;
}

int64_t FrameMapping::FrameAt(float x) const
{
    return (FirstFrameAt(x) + LastFrameAt(x)) / 2;
}

}  // namespace glimmet
