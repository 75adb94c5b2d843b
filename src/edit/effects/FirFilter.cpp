#include "edit/effects/FirFilter.h"

#include <algorithm>
#include <stdexcept>

#include "edit/effects/EffectStore.h"

namespace glimmet::effects {

namespace {

int32_t Clamp16(int32_t value)
{
    return std::clamp<int32_t>(value, -32768, 32767);
}

// The int32 sum of the running total and one term, wrapping as the 32-bit
// arithmetic of the filter always has; signed overflow itself would be
// undefined.
int32_t AddWrapping(int32_t a, int32_t b)
{
    return int32_t(uint32_t(a) + uint32_t(b));
}

// One output frame; current points at the current frame, whose history lies
// just before it.
int16_t FilterFrame(const int16_t* current, std::span<const double> kernel)
{
    int32_t acc = TruncateToInt32(kernel[0] * double(current[0]));
    if (kernel.size() == 1) {
        return int16_t(Clamp16(acc));
    }
    for (size_t k = 1; k < kernel.size(); ++k) {
        const int32_t term = TruncateToInt32(kernel[k] * double(*(current - k)));
        acc = Clamp16(AddWrapping(acc, term));
    }
    return int16_t(acc);
}

}  // namespace

void FirFilter(std::span<const int16_t> input, std::span<const double> kernel,
               std::span<int16_t> output)
{
    if (input.size() != output.size() + kernel.size()) {
        throw std::invalid_argument("FirFilter: input must hold the history and the range");
    }
    if (kernel.empty()) {
        std::copy(input.begin(), input.end(), output.begin());
        return;
    }
    const int16_t* range = input.data() + kernel.size();
    for (size_t i = 0; i < output.size(); ++i) {
        output[i] = FilterFrame(range + i, kernel);
    }
}

}  // namespace glimmet::effects
