#pragma once

#include <cstdint>

namespace glimmet {

/// The mapping between frames and pixel columns shared by every channel
/// view: a display range [first, last] (both inclusive) over a container
/// whose bounds are `width` wide (right edge minus left edge).
///
/// The formulas are deliberately not symmetric: the first displayed frame
/// lies at x = -1 and the last at x = width - 2, while a column covers
/// span / (width - 1) frames.
class FrameMapping {
public:
    FrameMapping(float width, int64_t first, int64_t last) : width_(width), first_(first), last_(last) {}

    /// x of a frame: ceil((frame - first) * (width - 1) / (last - first)) - 1,
    /// the quotient rounded once to single precision. A one-frame display
    /// range has no scale; every frame then lies at -1.
    float PosAt(int64_t frame) const;
    /// The first frame under column x (truncated towards zero).
    int64_t FirstFrameAt(float x) const;
    /// The last frame under column x.
    int64_t LastFrameAt(float x) const;
    /// The middle of the frames under column x, rounded towards zero.
    int64_t FrameAt(float x) const;

    /// Frames per column: span / (width - 1) in single precision.
    float FramesPerColumn() const;

private:
    float width_;
    int64_t first_;
    int64_t last_;
};

/// float to int64 truncating towards zero; NaN gives 0 and values beyond
/// +-2^62 are clamped there, so no conversion is ever undefined.
int64_t TruncateToFrame(float value);

}  // namespace glimmet
