#pragma once

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "edit/effects/EffectStore.h"
#include "edit/effects/SplineCurve.h"
#include "edit/effects/SplineSweep.h"

namespace glimmet::effects {

/// The sample arithmetic of the Envelope effect: the range is multiplied by a
/// gain that follows the user's curve from the first frame to the last, 0 to
/// 400 % over the curve's height. The control's untouched flat curve at 0.75
/// gives the gain 4 * (1 - 0.75) = 1 exactly, leaving the data unchanged.
///
/// The curve is called with a double and its result used as a double, the
/// signature of the curve control's ValueAt; it is evaluated once per sample,
/// in order.

/// Sample i of n becomes trunc((1 - curve(i / n)) * 4.0 * s), the position
/// and the product in double, multiplied left to right. The curve is sampled
/// over [0, 1); its right end is never reached. A result outside
/// [-32768, 32767] (or not a number) is stored as 32767, also when it is too
/// negative: -10000 at 400 % gives 32767. A curve value of exactly 1 gives 0,
/// which is also what the action stores when it cannot read its dialog.
template <std::invocable<double> Curve>
void ApplyEnvelope(std::span<int16_t> samples, Curve&& curve)
{
    const double count = double(samples.size());
    for (size_t i = 0; i < samples.size(); ++i) {
        const double value = curve(double(i) / count);
        samples[i] = StoreOneSided((1.0 - value) * 4.0 * double(samples[i]));
    }
}

/// ApplyEnvelope's gains (1 - curve(i / n)) * 4.0 for a drawn curve, a block
/// of frames at a time, each the same double ApplyEnvelope multiplies by.
/// The positions i / n lie in [0, 1), where the curve is the spline itself,
/// and they increase, so a SplineSweep finds each frame's piece; within one
/// piece the cubic is evaluated over many frames at once.
class EnvelopeGains {
public:
    /// For a range of n frames.
    EnvelopeGains(const SplineCurve& curve, size_t n);

    /// The gains of frames first .. first + gains.size() - 1; first +
    /// gains.size() must not exceed n.
    void Compute(size_t first, std::span<double> gains);

    /// True when every gain this curve can give over [0, 1) is a finite
    /// number, judged from a bound on its cubics: a silent frame then stays
    /// silent wherever it lies, and need not be computed. False (and the
    /// frames must be computed) when the bound is not finite, even where
    /// every gain would be.
    bool AlwaysFinite() const;

private:
    SplineSweep sweep_;
    double count_;
    std::vector<double> positions_;
};

/// samples[i] = StoreOneSided(gains[i] * samples[i]): ApplyEnvelope's
/// product and store with the gain already formed. The spans must be equally
/// long.
void ApplyGains(std::span<const double> gains, std::span<int16_t> samples);

/// ApplyEnvelope for a drawn curve: the same samples, through EnvelopeGains
/// and ApplyGains.
void ApplySplineEnvelope(std::span<int16_t> samples, const SplineCurve& curve);

/// ApplySplineEnvelope over several ranges of the same length (the channels
/// of one selection), each frame's gain computed once for all of them.
void ApplySplineEnvelopeTogether(std::span<const std::span<int16_t>> ranges, const SplineCurve& curve);

}  // namespace glimmet::effects
