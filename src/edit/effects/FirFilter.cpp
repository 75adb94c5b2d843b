#include "edit/effects/FirFilter.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <stdexcept>
#include <vector>

#include "edit/effects/EffectStore.h"
#include "edit/effects/VectorClones.h"

#if defined(__GNUC__) && !defined(__clang__)
// The vector helpers below are internal and always inlined, so GCC's note
// that vector arguments pass differently with and without AVX concerns no
// call that exists; it is reported at the end of the file, out of reach of a
// narrower push and pop.
#pragma GCC diagnostic ignored "-Wpsabi"
#endif

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
// every product stays within 2^29, so its truncation fits an int32 and
// TruncateToInt32's out-of-range case never arises; and the running sum (a
// clamped value or the first term, plus one term) stays within 2^30, so the
// int32 sum never wraps. The per-term checks and the wrapping sum can then be
// left out, and the samples are converted to double once per block instead
// of once per term, without changing a single result.
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

// trunc(k * x) for a coefficient the vector path takes: the product lies
// within 2^29, so the conversion to int32 is defined and truncates.
inline int32_t Term(double k, double x)
{
    return int32_t(k * x);
}

inline int32_t Clamp16Fast(int32_t value)
{
    return value < -32768 ? -32768 : (value > 32767 ? 32767 : value);
}

#if defined(__GNUC__) && !defined(__clang__)
// Eight outputs side by side in GCC's vector types; the arithmetic per lane is
// that of Term, Clamp16Fast and the int32 sum below.
using Doubles8 = double __attribute__((vector_size(64)));
using Ints8 = int32_t __attribute__((vector_size(32)));

[[gnu::always_inline]] inline Ints8 Terms8(double k, const double* x)
{
    Doubles8 v;
    std::memcpy(&v, x, sizeof v);
    return __builtin_convertvector(k * v, Ints8);
}

[[gnu::always_inline]] inline Ints8 Clamp8(Ints8 v)
{
    const Ints8 low = {-32768, -32768, -32768, -32768, -32768, -32768, -32768, -32768};
    const Ints8 high = {32767, 32767, 32767, 32767, 32767, 32767, 32767, 32767};
    v = v < low ? low : v;
    return v > high ? high : v;
}

// Outputs i .. i + 15 with every running sum held in registers while the taps
// pass: two groups of eight, so two chains of sums are under way at once.
[[gnu::always_inline]] inline void SumSixteen(const double* x, std::span<const double> kernel, int32_t* sums,
                                              size_t i)
{
    const size_t taps = kernel.size();
    Ints8 a = Terms8(kernel[0], x + i + taps);
    Ints8 b = Terms8(kernel[0], x + i + taps + 8);
    for (size_t k = 1; k < taps; ++k) {
        a = Clamp8(a + Terms8(kernel[k], x + i + taps - k));
        b = Clamp8(b + Terms8(kernel[k], x + i + taps - k + 8));
    }
    std::memcpy(sums + i, &a, sizeof a);
    std::memcpy(sums + i + 8, &b, sizeof b);
}
#endif

// The running sums of one block: sums[i] belongs to output i and x[i + taps]
// is its current frame. Under the vector path's bound the int32 sum of a
// clamped value (or the first term) and a term cannot wrap, so it is the
// plain sum.
GLIMMET_EFFECT_CLONES
void SumTaps(const double* x, std::span<const double> kernel, int32_t* sums, size_t count)
{
    const size_t taps = kernel.size();
    size_t i = 0;
#if defined(__GNUC__) && !defined(__clang__)
    for (; i + 16 <= count; i += 16) {
        SumSixteen(x, kernel, sums, i);
    }
#endif
    for (; i < count; ++i) {
        int32_t sum = Term(kernel[0], x[i + taps]);
        for (size_t k = 1; k < taps; ++k) {
            sum = Clamp16Fast(sum + Term(kernel[k], x[i + taps - k]));
        }
        sums[i] = sum;
    }
}

GLIMMET_EFFECT_CLONES
void ToDoubles(const int16_t* samples, double* out, size_t count)
{
    for (size_t j = 0; j < count; ++j) {
        out[j] = double(samples[j]);
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
        ToDoubles(frames, x_.data(), count + taps);
        SumTaps(x_.data(), kernel_, sums_.data(), count);
        for (size_t i = 0; i < count; ++i) {
            // A single tap has added no term and is clamped only here.
            out[i] = int16_t(Clamp16Fast(sums_[i]));
        }
    }

private:
    std::span<const double> kernel_;
    bool vector_;
    std::vector<double> x_;
    std::vector<int32_t> sums_;
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
