#pragma once

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <span>

namespace glimmet::effects {

/// The sample arithmetic of Peak Distort: each run of same-signed samples is
/// scaled as a whole so that its local peak is mapped through the user's
/// curve, which keeps the shape of each half-wave. A run's peak p becomes
/// 32767 * (1 - curve(p / 32767)) for positive runs, and likewise with 32768
/// for negative ones.
///
/// The curve is called with a double and its result used as a double, the
/// signature of the curve control's ValueAt; it is evaluated once per run of
/// two or more samples, in order.

/// A run of same-signed samples: where it starts, how many samples it has
/// and its largest magnitude (0 for an empty run).
struct SampleRun {
    size_t begin = 0;
    size_t length = 0;
    int16_t peak = 0;
};

/// The samples >= 1 from begin on, up to the first that is not or the end.
SampleRun PositiveRun(std::span<const int16_t> samples, size_t begin);
/// The samples <= -1 from begin on; the peak is the most negative value.
SampleRun NegativeRun(std::span<const int16_t> samples, size_t begin);

/// The curve position of a run's peak: p / 32767, or q * -1/32768 for a
/// negative run, in double.
double PeakPosition(const SampleRun& run, bool positive);

/// (1 - curveValue, rounded to a float) / position, in double: the factor
/// that takes the peak at position to 1 - curveValue of full scale.
double RunGain(double curveValue, double position);

/// Scales the run and the one sample after it (the zero crossing or the
/// first sample of the opposite sign): s = trunc(gain * s), stored as the low
/// 16 bits without clipping. When the run reaches the end, that sample lies
/// one past the data and spare stands in for it, so nothing outside samples
/// is touched and the caller never sees it.
void ScaleRun(std::span<int16_t> samples, const SampleRun& run, double gain, int16_t& spare);

/// Peak Distort in place. With i the next unprocessed sample, from 0 while
/// i < n: the positive run from i, scaled if it has two or more samples;
/// then the negative run from the sample after it (counted on the samples as
/// the positive run's scaling left them), scaled likewise; then i moves one
/// past the sample after the negative run, which therefore never starts a run
/// of its own. Runs of one sample stay unchanged, so a buffer that changes
/// sign at every sample is left as it is, and zeros are skipped one at a time.
template <std::invocable<double> Curve>
void PeakDistort(std::span<int16_t> samples, Curve&& curve)
{
    int16_t spare = 0;
    size_t i = 0;
    while (i < samples.size()) {
        const SampleRun positive = PositiveRun(samples, i);
        if (positive.length > 1) {
            const double position = PeakPosition(positive, true);
            ScaleRun(samples, positive, RunGain(curve(position), position), spare);
        }
        const SampleRun negative = NegativeRun(samples, positive.begin + positive.length);
        if (negative.length > 1) {
            const double position = PeakPosition(negative, false);
            ScaleRun(samples, negative, RunGain(curve(position), position), spare);
        }
        i = negative.begin + negative.length + 1;
    }
}

}  // namespace glimmet::effects
