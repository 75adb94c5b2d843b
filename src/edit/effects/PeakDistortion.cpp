#include "edit/effects/PeakDistortion.h"

#include <algorithm>

#include "edit/effects/EffectStore.h"
#include "edit/effects/VectorClones.h"

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

namespace glimmet::effects {

namespace {

// Samples per step of the vector scan: one 128-bit register of int16.
constexpr size_t kLanes = 8;

#if defined(__SSE2__)
// The largest lane of v.
int16_t LargestLane(__m128i v)
{
    alignas(16) int16_t lanes[kLanes];
    _mm_store_si128(reinterpret_cast<__m128i*>(lanes), v);
    return *std::max_element(lanes, lanes + kLanes);
}

int16_t SmallestLane(__m128i v)
{
    alignas(16) int16_t lanes[kLanes];
    _mm_store_si128(reinterpret_cast<__m128i*>(lanes), v);
    return *std::min_element(lanes, lanes + kLanes);
}
#endif

// How far from begin whole steps of kLanes samples all pass the run's test,
// with their peak folded into peak: a run is mostly scanned eight samples at
// a time, and the step holding its end is left to the sample loop.
size_t PositiveSteps(std::span<const int16_t> samples, size_t begin, int16_t& peak)
{
    size_t j = begin;
#if defined(__SSE2__)
    const __m128i zero = _mm_setzero_si128();
    __m128i largest = zero;
    while (j + kLanes <= samples.size()) {
        const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(samples.data() + j));
        if (_mm_movemask_epi8(_mm_cmpgt_epi16(v, zero)) != 0xffff) {
            break;
        }
        largest = _mm_max_epi16(largest, v);
        j += kLanes;
    }
    peak = std::max(peak, LargestLane(largest));
#else
    (void)samples;
    (void)peak;
#endif
    return j;
}

size_t NegativeSteps(std::span<const int16_t> samples, size_t begin, int16_t& peak)
{
    size_t j = begin;
#if defined(__SSE2__)
    const __m128i zero = _mm_setzero_si128();
    __m128i smallest = zero;
    while (j + kLanes <= samples.size()) {
        const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(samples.data() + j));
        if (_mm_movemask_epi8(_mm_cmplt_epi16(v, zero)) != 0xffff) {
            break;
        }
        smallest = _mm_min_epi16(smallest, v);
        j += kLanes;
    }
    peak = std::min(peak, SmallestLane(smallest));
#else
    (void)samples;
    (void)peak;
#endif
    return j;
}

// StoreLow16(gain * s) for every sample, in a form that vectorises:
// TruncateToInt32 gives int32_t(p) inside (-2^31 - 1, 2^31) and INT32_MIN
// elsewhere (not-a-number included), so the value is chosen before the
// conversion, which then is always defined; the int16 of an int32 is its low
// 16 bits.
GLIMMET_VECTOR_CLONES
void ScaleSamples(int16_t* samples, size_t count, double gain)
{
    for (size_t j = 0; j < count; ++j) {
        const double product = gain * double(samples[j]);
        const bool fits = product < 2147483648.0 && product > -2147483649.0;
        samples[j] = int16_t(int32_t(fits ? product : -2147483648.0));
    }
}

}  // namespace

SampleRun PositiveRun(std::span<const int16_t> samples, size_t begin)
{
    SampleRun run{begin, 0, 0};
    size_t j = PositiveSteps(samples, begin, run.peak);
    for (; j < samples.size() && samples[j] >= 1; ++j) {
        run.peak = std::max(run.peak, samples[j]);
    }
    run.length = j - begin;
    return run;
}

SampleRun NegativeRun(std::span<const int16_t> samples, size_t begin)
{
    SampleRun run{begin, 0, 0};
    size_t j = NegativeSteps(samples, begin, run.peak);
    for (; j < samples.size() && samples[j] <= -1; ++j) {
        run.peak = std::min(run.peak, samples[j]);
    }
    run.length = j - begin;
    return run;
}

double PeakPosition(const SampleRun& run, bool positive)
{
    if (positive) {
        return double(run.peak) / 32767.0;
    }
    return double(run.peak) * (-1.0 / 32768.0);
}

double RunGain(double curveValue, double position)
{
    // The height is narrowed to float before the division, as the effect has
    // always done; its results depend on that rounding.
    const float height = float(1.0 - curveValue);
    return double(height) / position;
}

void ScaleRun(std::span<int16_t> samples, const SampleRun& run, double gain, int16_t& spare)
{
    const size_t end = run.begin + run.length;  // inclusive: the sample after the run
    if (end < samples.size()) {
        ScaleSamples(samples.data() + run.begin, run.length + 1, gain);
        return;
    }
    ScaleSamples(samples.data() + run.begin, samples.size() - run.begin, gain);
    spare = StoreLow16(gain * double(spare));
}

}  // namespace glimmet::effects
