#pragma once

#include <cstdint>
#include <vector>

namespace glimmet::test {

/// A drawn curve as the soak draws it: a straight line from (0, y0) to
/// (1, y1). Lines only, because a spline through more knots evaluated by an
/// independent solver differs from the program's in the last bits, and
/// that flips truncated samples by one; a line through two knots is the
/// same number whichever way it is computed.
struct SoakCurve {
    double y0 = 0.0;
    double y1 = 0.0;
    /// False: the dialog cannot be locked when the effect reads it.
    bool readable = true;
};

/// The curve effects' and the time stretch's results written out again
/// from their descriptions, one sample at a time, over plain vectors: the
/// model's reference, sharing no code with the program's effects.
class SoakEffects {
public:
    /// The control's value at x: the line inside [0, 1], 0 elsewhere.
    static double Value(const SoakCurve& curve, double x);

    static std::vector<int16_t> Distort(std::vector<int16_t> samples, const SoakCurve& curve);
    static std::vector<int16_t> PeakDistort(const std::vector<int16_t>& samples, const SoakCurve& curve);
    static std::vector<int16_t> Envelope(std::vector<int16_t> samples, const SoakCurve& curve);
    /// The coefficients the filter draws from curve with taps of them.
    static std::vector<double> Kernel(const SoakCurve& curve, int32_t taps);
    /// input: the kernel's length of history frames, then the range.
    static std::vector<int16_t> Filter(const std::vector<int16_t>& input, const std::vector<double>& kernel);

    /// Frames a time stretch of frames by factor writes back (0: none).
    static int64_t StretchedLength(int64_t frames, float factor);
    /// The longest range whose stretch the vocoder leaves silent: it only
    /// starts analysing past three of its 16384-frame windows.
    static constexpr int64_t kSilentStretchFrames = 49152;
};

}  // namespace glimmet::test
