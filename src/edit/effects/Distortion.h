#pragma once

#include <cmath>
#include <concepts>
#include <cstdint>
#include <span>

#include "edit/effects/EffectStore.h"

namespace glimmet::effects {

/// The sample arithmetic of Distort, a static transfer function: each
/// sample's magnitude in [0, 1] is mapped through the user's curve to the
/// output magnitude 1 - curve, and the sign is kept. Negative samples are
/// scaled by 32768 and positive ones by 32767, so both -32768 and 32767 reach
/// the curve at exactly 1.
///
/// The curve is any callable taking and returning a number; it is called
/// with a double and its result is used as a double, the signature of the
/// curve control's ValueAt. It is evaluated once per sample, in order,
/// without tabulation.

/// One sample:
///   s < 0:  trunc((1 - curve(|s / 32768|)) * -32768)
///   s >= 0: trunc(32767 * (1 - curve(|s / 32767|)))
/// in double; a result outside [-32768, 32767] (or not a number) is stored as
/// 32767, on either side. A curve value of exactly 1 gives 0, which is also
/// what the action stores when it cannot read its dialog.
template <std::invocable<double> Curve>
int16_t DistortSample(int16_t sample, Curve& curve)
{
    if (sample < 0) {
        const double value = curve(std::fabs(double(sample) / 32768.0));
        return StoreOneSided((1.0 - value) * -32768.0);
    }
    const double value = curve(std::fabs(double(sample) / 32767.0));
    return StoreOneSided(32767.0 * (1.0 - value));
}

/// DistortSample applied to every sample in place, first to last.
template <std::invocable<double> Curve>
void Distort(std::span<int16_t> samples, Curve&& curve)
{
    for (int16_t& sample : samples) {
        sample = DistortSample(sample, curve);
    }
}

}  // namespace glimmet::effects
