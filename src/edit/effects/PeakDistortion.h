#pragma once

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace glimmet::effects {

/// The sample arithmetic of Peak Distort: each run of same-signed samples is
/// scaled as a whole so that its local peak is mapped through the user's
/// curve, which keeps the shape of each half-wave. A run's peak p becomes
/// 32767 * (1 - curve(p / 32767)) for positive runs, and likewise with 32768
/// for negative ones.
///
/// The curve is called with a double and its result used as a double, the
/// signature of the curve control's ValueAt. It must depend on its argument
/// alone, as that control's curve does: a buffer shorter than a PeakGains
/// table evaluates it once per run of two or more samples, in order, a longer
/// one once per possible peak (see PeakDistort).

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

/// One sample of a scaled run: trunc(gain * sample) kept to its low 16 bits
/// (INT32_MIN's, 0, when the product is out of int32's range or not a
/// number), the value ScaleRun stores.
inline int16_t ScaledSample(int16_t sample, double gain)
{
    const double product = gain * double(sample);
    const bool fits = product < 2147483648.0 && product > -2147483649.0;
    return int16_t(int32_t(fits ? product : -2147483648.0));
}

/// RunGain for every peak a run can have, so that a run's gain is looked up
/// instead of evaluated: the gain of a run depends on its peak alone (whose
/// sign tells the side), so the lookup gives the same double.
class PeakGains {
public:
    static constexpr size_t kSize = 65536;

    template <std::invocable<double> Curve>
    explicit PeakGains(Curve& curve) : gains_(kSize, 0.0)
    {
        for (int32_t peak = -32768; peak <= 32767; ++peak) {
            if (peak == 0) {
                continue;  // no run has it
            }
            const SampleRun run{0, 0, int16_t(peak)};
            const double position = PeakPosition(run, peak > 0);
            gains_[Index(run.peak)] = RunGain(curve(position), position);
        }
    }

    double Of(int16_t peak) const { return gains_[Index(peak)]; }

private:
    static size_t Index(int16_t peak) { return size_t(int32_t(peak) + 32768); }

    std::vector<double> gains_;
};

/// PeakDistort with every run's gain taken from gains.
void PeakDistortWithGains(std::span<int16_t> samples, const PeakGains& gains);

/// Peak Distort in place. With i the next unprocessed sample, from 0 while
/// i < n: the positive run from i, scaled if it has two or more samples;
/// then the negative run from the sample after it (counted on the samples as
/// the positive run's scaling left them), scaled likewise; then i moves one
/// past the sample after the negative run, which therefore never starts a run
/// of its own. Runs of one sample stay unchanged, so a buffer that changes
/// sign at every sample is left as it is, and zeros are skipped one at a time.
///
/// A buffer longer than the PeakGains table takes its gains from one, which
/// costs fewer curve evaluations than that many samples' runs would.
template <std::invocable<double> Curve>
void PeakDistort(std::span<int16_t> samples, Curve&& curve)
{
    if (samples.size() > PeakGains::kSize) {
        PeakDistortWithGains(samples, PeakGains(curve));
        return;
    }
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
