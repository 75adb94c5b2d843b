#pragma once

#include <cstdint>

#include "edit/effects/PeakDistortion.h"
#include "sound/SampleSlice.h"

namespace glimmet {

/// Peak Distort over a slice of any length, streamed from its blocks into
/// new ones: the same samples as effects::PeakDistortWithGains over the
/// slice as one array, holding two pieces of input and one of output at a
/// time. A run of same-signed samples is read twice, once for its peak and
/// once to scale it, so a run longer than a piece costs no buffer; stretches
/// of silence are passed over a piece at a time and stay shared.
class PeakDistortPass {
public:
    /// gains must outlive the pass.
    explicit PeakDistortPass(const effects::PeakGains& gains) : gains_(gains) {}

    /// The distorted source into result; false when memory ran out.
    bool Run(const SampleSlice& source, SampleSlice* result) const;

private:
    const effects::PeakGains& gains_;
};

}  // namespace glimmet
