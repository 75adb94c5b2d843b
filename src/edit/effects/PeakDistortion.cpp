#include "edit/effects/PeakDistortion.h"

#include <algorithm>

#include "edit/effects/EffectStore.h"

namespace glimmet::effects {

SampleRun PositiveRun(std::span<const int16_t> samples, size_t begin)
{
    SampleRun run{begin, 0, 0};
    for (size_t j = begin; j < samples.size() && samples[j] >= 1; ++j) {
        run.peak = std::max(run.peak, samples[j]);
        ++run.length;
    }
    return run;
}

SampleRun NegativeRun(std::span<const int16_t> samples, size_t begin)
{
    SampleRun run{begin, 0, 0};
    for (size_t j = begin; j < samples.size() && samples[j] <= -1; ++j) {
        run.peak = std::min(run.peak, samples[j]);
        ++run.length;
    }
    return run;
}

double PeakPosition(const SampleRun& run, bool positive)
{
    if (positive) {
        return double(run.peak) / 32767.0;
    }
    return double(run.peak) * (-1.0 / 32768.0);
}

double RunGain(double curveValue, double position)
{
    // The height is narrowed to float before the division, as the effect has
    // always done; its results depend on that rounding.
    const float height = float(1.0 - curveValue);
    return double(height) / position;
}

void ScaleRun(std::span<int16_t> samples, const SampleRun& run, double gain, int16_t& spare)
{
    const size_t end = run.begin + run.length;  // inclusive: the sample after the run
    for (size_t j = run.begin; j <= end; ++j) {
        int16_t& sample = j < samples.size() ? samples[j] : spare;
        sample = StoreLow16(gain * double(sample));
    }
}

}  // namespace glimmet::effects
