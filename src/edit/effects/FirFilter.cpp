#include "edit/effects/FirFilter.h"

#include <algorithm>
#include <cmath>
#include <stdexcept>
#include <vector>

#include "edit/effects/EffectStore.h"
#include "edit/effects/VectorClones.h"

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

// The largest coefficient magnitude the vector path takes. With |x| <= 32768
// every product stays within 2^29, so its truncation fits an int32 without
// the out-of-range case, and the running sum (a clamped value or the first
// term, plus one term) stays within 2^30, so the int32 sum never wraps. All
// of it is then exact integer arithmetic on values far below 2^53, which
// double carries out with the same results: trunc(p) as double(int32_t(p)),
// the sum as a double sum, the clamp as min/max.
constexpr double kLargestExactCoefficient = 16384.0;

bool FitsVectorPath(std::span<const double> kernel)
{
    // Written so that not-a-number fails the test as well.
    return std::all_of(kernel.begin(), kernel.end(),
                       [](double k) { return std::fabs(k) <= kLargestExactCoefficient; });
}

// Frames per block: the block's samples as doubles and its running sums stay
// in the first-level cache while every tap passes over them.
constexpr size_t kBlockFrames = 2048;

// The running sums of one block, tap after tap: sums[i] belongs to output i
// and x[i + taps] is its current frame. The loops are plain so that the
// compiler vectorises them.
GLIMMET_VECTOR_CLONES
void SumTaps(const double* x, std::span<const double> kernel, double* sums, size_t count)
{
    const size_t taps = kernel.size();
    const double k0 = kernel[0];
    for (size_t i = 0; i < count; ++i) {
        sums[i] = double(int32_t(k0 * x[i + taps]));
    }
    for (size_t k = 1; k < taps; ++k) {
        const double coefficient = kernel[k];
        const double* history = x + taps - k;
        for (size_t i = 0; i < count; ++i) {
            const double sum = sums[i] + double(int32_t(coefficient * history[i]));
            sums[i] = std::min(std::max(sum, -32768.0), 32767.0);
        }
    }
}

// Filters one block of at most kBlockFrames outputs. frames holds the taps
// frames before the block, then the block's own frames, all as they were
// before filtering; out may be where the block's frames came from.
class BlockFilter {
public:
    explicit BlockFilter(std::span<const double> kernel)
        : kernel_(kernel), vector_(FitsVectorPath(kernel))
    {
        if (vector_) {
            x_.resize(kBlockFrames + kernel.size());
            sums_.resize(kBlockFrames);
        }
    }

    void Run(const int16_t* frames, int16_t* out, size_t count)
    {
        const size_t taps = kernel_.size();
        if (!vector_) {
            for (size_t i = 0; i < count; ++i) {
                out[i] = FilterFrame(frames + taps + i, kernel_);
            }
            return;
        }
        for (size_t j = 0; j < count + taps; ++j) {
            x_[j] = double(frames[j]);
        }
        SumTaps(x_.data(), kernel_, sums_.data(), count);
        for (size_t i = 0; i < count; ++i) {
            // A single tap has added no term and is clamped only here.
            out[i] = int16_t(std::min(std::max(sums_[i], -32768.0), 32767.0));
        }
    }

private:
    std::span<const double> kernel_;
    bool vector_;
    std::vector<double> x_;
    std::vector<double> sums_;
};

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
    BlockFilter filter(kernel);
    for (size_t begin = 0; begin < output.size(); begin += kBlockFrames) {
        const size_t count = std::min(kBlockFrames, output.size() - begin);
        filter.Run(input.data() + begin, output.data() + begin, count);
    }
}

void FirFilterInPlace(std::span<const int16_t> history, std::span<const double> kernel,
                      std::span<int16_t> samples)
{
    if (history.size() != kernel.size()) {
        throw std::invalid_argument("FirFilterInPlace: history must hold one frame per tap");
    }
    if (kernel.empty()) {
        return;
    }
    const size_t taps = kernel.size();
    // The frames a block reads, kept as they were: its own are overwritten
    // by its output, and the next block needs the last taps of them.
    std::vector<int16_t> frames(taps + kBlockFrames);
    std::copy(history.begin(), history.end(), frames.begin());
    BlockFilter filter(kernel);
    for (size_t begin = 0; begin < samples.size(); begin += kBlockFrames) {
        const size_t count = std::min(kBlockFrames, samples.size() - begin);
        std::copy_n(samples.data() + begin, count, frames.data() + taps);
        filter.Run(frames.data(), samples.data() + begin, count);
        std::copy_n(frames.data() + count, taps, frames.data());
    }
}

}  // namespace glimmet::effects
