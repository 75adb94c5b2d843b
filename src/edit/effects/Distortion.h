#pragma once

#include <cmath>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

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
/// curve control's ValueAt. It must depend on its argument alone, as that
/// control's curve does: over a long buffer Distort evaluates it once per
/// input value instead of once per sample (see Distort).

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

/// DistortSample for all 65,536 sample values. The result depends on the
/// sample alone, so looking it up here is the same as computing it, and a
/// lookup costs far less than a spline evaluation.
class DistortionTable {
public:
    static constexpr size_t kSize = 65536;

    template <std::invocable<double> Curve>
    explicit DistortionTable(Curve& curve) : table_(kSize)
    {
        for (size_t i = 0; i < kSize; ++i) {
            table_[i] = DistortSample(int16_t(int32_t(i) - 32768), curve);
        }
    }

    void Apply(std::span<int16_t> samples) const
    {
        for (int16_t& sample : samples) {
            sample = table_[size_t(int32_t(sample) + 32768)];
        }
    }

private:
    std::vector<int16_t> table_;
};

/// DistortSample applied to every sample in place. A buffer shorter than the
/// table is computed sample by sample, first to last; a longer one through
/// a DistortionTable, which costs fewer curve evaluations.
template <std::invocable<double> Curve>
void Distort(std::span<int16_t> samples, Curve&& curve)
{
    if (samples.size() <= DistortionTable::kSize) {
        for (int16_t& sample : samples) {
            sample = DistortSample(sample, curve);
        }
        return;
    }
    DistortionTable(curve).Apply(samples);
}

}  // namespace glimmet::effects
