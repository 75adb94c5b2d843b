#pragma once

#include <concepts>
#include <cstdint>
#include <span>

#include "edit/effects/EffectStore.h"

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

}  // namespace glimmet::effects
