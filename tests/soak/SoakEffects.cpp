#include "SoakEffects.h"

#include <cmath>
#include <limits>

#include "edit/EffectReference.h"
#include "edit/SplineReference.h"

namespace glimmet::test {

double SoakEffects::Value(const SoakCurve& curve, double x)
{
    const spline_reference::ReferenceCurve line({0.0, 1.0}, {curve.y0, curve.y1});
    return ControlValue(x, [&line](double t) { return line.ValueAt(t); });
}

std::vector<int16_t> SoakEffects::Distort(std::vector<int16_t> samples, const SoakCurve& curve)
{
    for (int16_t& s : samples) {
        if (!curve.readable) {
            s = 0;
            continue;
        }
        // Negative samples are measured against 32768, positive ones
        // against 32767; the curve gives 1 - the output magnitude.
        double v;
        if (s < 0)
            v = (1 - Value(curve, std::fabs(s / 32768.0))) * -32768;
        else
            v = 32767 * (1 - Value(curve, std::fabs(s / 32767.0)));
        s = ReferenceOneSided(v);
    }
    return samples;
}

std::vector<int16_t> SoakEffects::PeakDistort(const std::vector<int16_t>& samples, const SoakCurve& curve)
{
    if (!curve.readable)
        return samples;
    const size_t n = samples.size();
    // One spare sample past the end, which scaling a final run reaches.
    std::vector<int16_t> b(samples);
    b.push_back(0);
    auto scale = [&b, &curve](size_t from, size_t count, double peak) {
        const double gain = double(float(1 - Value(curve, peak))) / peak;
        for (size_t j = from; j <= from + count; ++j)
            b[j] = ReferenceLow16(gain * b[j]);
    };
    size_t i = 0;
    while (i < n) {
        size_t up = 0;
        int top = 0;
        for (; i + up < n && b[i + up] >= 1; ++up)
            top = std::max(top, int(b[i + up]));
        if (up > 1)
            scale(i, up, top / 32767.0);
        const size_t u = i + up;
        size_t down = 0;
        int bottom = 0;
        for (; u + down < n && b[u + down] <= -1; ++down)
            bottom = std::min(bottom, int(b[u + down]));
        if (down > 1)
            scale(u, down, bottom * -1.0 / 32768.0);
        i = u + down + 1;
    }
    b.pop_back();
    return b;
}

std::vector<int16_t> SoakEffects::Envelope(std::vector<int16_t> samples, const SoakCurve& curve)
{
    const size_t n = samples.size();
    for (size_t i = 0; i < n; ++i) {
        if (!curve.readable) {
            samples[i] = 0;
            continue;
        }
        const double gain = (1 - Value(curve, double(i) / double(n))) * 4.0;
        samples[i] = ReferenceOneSided(gain * samples[i]);
    }
    return samples;
}

std::vector<double> SoakEffects::Kernel(const SoakCurve& curve, int32_t taps)
{
    std::vector<double> kernel;
    for (int32_t i = 0; i < taps; ++i)
        kernel.push_back(1.0 - Value(curve, double(i) / double(taps)));
    return kernel;
}

std::vector<int16_t> SoakEffects::Filter(const std::vector<int16_t>& input, const std::vector<double>& kernel)
{
    const size_t taps = kernel.size();
    const size_t n = input.size() - taps;
    if (taps == 0)
        return std::vector<int16_t>(input.begin(), input.end());
    auto clamp = [](int64_t v) { return std::min<int64_t>(32767, std::max<int64_t>(-32768, v)); };
    std::vector<int16_t> output(n);
    for (size_t i = 0; i < n; ++i) {
        int64_t acc = ReferenceInt32(kernel[0] * input[i + taps]);
        if (taps == 1)
            acc = clamp(acc);
        for (size_t k = 1; k < taps; ++k) {
            acc += ReferenceInt32(kernel[k] * input[i + taps - k]);
            // The running sum is an int32: it wraps before it is clamped.
            acc = int64_t(int32_t(uint32_t(uint64_t(acc))));
            acc = clamp(acc);
        }
        output[i] = int16_t(acc);
    }
    return output;
}

int64_t SoakEffects::StretchedLength(int64_t frames, float factor)
{
    const float product = float(frames) * factor;
    if (!(product >= 0.0f && product < 1.0e18f))
        return 0;
    return int64_t(product);
}

}  // namespace glimmet::test
