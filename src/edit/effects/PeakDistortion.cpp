#include "edit/effects/PeakDistortion.h"

#include <algorithm>
#include <cmath>

#include "edit/effects/EffectStore.h"
#include "edit/effects/VectorClones.h"

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

namespace glimmet::effects {

namespace {

#if defined(__SSE2__)
// Samples per step of the vector scan: one 128-bit register of int16.
constexpr size_t kLanes = 8;

// The largest and the smallest of the eight lanes, folded pairwise.
int16_t LargestLane(__m128i v)
{
    v = _mm_max_epi16(v, _mm_shuffle_epi32(v, _MM_SHUFFLE(1, 0, 3, 2)));
    v = _mm_max_epi16(v, _mm_shuffle_epi32(v, _MM_SHUFFLE(2, 3, 0, 1)));
    v = _mm_max_epi16(v, _mm_shufflelo_epi16(v, _MM_SHUFFLE(2, 3, 0, 1)));
    return int16_t(_mm_cvtsi128_si32(v));
}

int16_t SmallestLane(__m128i v)
{
    v = _mm_min_epi16(v, _mm_shuffle_epi32(v, _MM_SHUFFLE(1, 0, 3, 2)));
    v = _mm_min_epi16(v, _mm_shuffle_epi32(v, _MM_SHUFFLE(2, 3, 0, 1)));
    v = _mm_min_epi16(v, _mm_shufflelo_epi16(v, _MM_SHUFFLE(2, 3, 0, 1)));
    return int16_t(_mm_cvtsi128_si32(v));
}

// All ones in the first `lanes` lanes, zero in the others.
__m128i LeadingLanes(unsigned lanes)
{
    static const int16_t window[2 * kLanes] = {-1, -1, -1, -1, -1, -1, -1, -1, 0, 0, 0, 0, 0, 0, 0, 0};
    return _mm_loadu_si128(reinterpret_cast<const __m128i*>(window + kLanes - lanes));
}

// A run scanned eight samples at a time from begin; j ends where the scan
// stopped and peak holds the peak of the samples before j. Lanes past the
// run's end are zeroed before they are folded into the peak, which a zero
// cannot change: the peak starts at 0 and every sample of a run lies on one
// side of it. Returns true when the run ended inside the data; otherwise the
// last samples, fewer than eight, are left to the sample loop from j.
template <bool kPositive>
bool ScanSteps(std::span<const int16_t> samples, size_t begin, size_t& j, int16_t& peak)
{
    const __m128i zero = _mm_setzero_si128();
    __m128i folded = zero;
    j = begin;
    bool ended = false;
    while (j + kLanes <= samples.size()) {
        const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(samples.data() + j));
        const __m128i inRun = kPositive ? _mm_cmpgt_epi16(v, zero) : _mm_cmplt_epi16(v, zero);
        const unsigned mask = unsigned(_mm_movemask_epi8(inRun));
        if (mask != 0xffffu) {
            // Two mask bits per lane; the first clear one ends the run.
            const unsigned lanes = unsigned(__builtin_ctz(~mask)) / 2;
            const __m128i kept = _mm_and_si128(v, LeadingLanes(lanes));
            folded = kPositive ? _mm_max_epi16(folded, kept) : _mm_min_epi16(folded, kept);
            j += lanes;
            ended = true;
            break;
        }
        folded = kPositive ? _mm_max_epi16(folded, v) : _mm_min_epi16(folded, v);
        j += kLanes;
    }
    peak = kPositive ? LargestLane(folded) : SmallestLane(folded);
    return ended;
}
#endif

// StoreLow16(gain * s) for every sample, in a form that vectorises:
// TruncateToInt32 gives int32_t(p) inside (-2^31 - 1, 2^31) and INT32_MIN
// elsewhere (not-a-number included), so the value is chosen before the
// conversion, which then is always defined; the int16 of an int32 is its low
// 16 bits.
GLIMMET_EFFECT_CLONES
void ScaleSamples(int16_t* samples, size_t count, double gain)
{
    for (size_t j = 0; j < count; ++j) {
        const double product = gain * double(samples[j]);
        const bool fits = product < 2147483648.0 && product > -2147483649.0;
        samples[j] = int16_t(int32_t(fits ? product : -2147483648.0));
    }
}

// The largest gain whose products with any sample stay inside int32's range:
// 65535 * 32768 < 2^31, and rounding the product cannot carry it past the
// rounded bound.
constexpr double kLargestPlainGain = 65535.0;

// ScaleSamples for a gain of at most kLargestPlainGain in magnitude, where
// the out-of-range case cannot arise and the conversion stands alone.
GLIMMET_EFFECT_CLONES
void ScaleSamplesInRange(int16_t* samples, size_t count, double gain)
{
    for (size_t j = 0; j < count; ++j) {
        samples[j] = int16_t(int32_t(gain * double(samples[j])));
    }
}

void Scale(int16_t* samples, size_t count, double gain)
{
    // Written so that a gain that is not a number takes the general loop.
    if (std::fabs(gain) <= kLargestPlainGain) {
        ScaleSamplesInRange(samples, count, gain);
    } else {
        ScaleSamples(samples, count, gain);
    }
}

}  // namespace

SampleRun PositiveRun(std::span<const int16_t> samples, size_t begin)
{
    SampleRun run{begin, 0, 0};
    size_t j = begin;
#if defined(__SSE2__)
    if (ScanSteps<true>(samples, begin, j, run.peak)) {
        run.length = j - begin;
        return run;
    }
#endif
    for (; j < samples.size() && samples[j] >= 1; ++j) {
        run.peak = std::max(run.peak, samples[j]);
    }
    run.length = j - begin;
    return run;
}

SampleRun NegativeRun(std::span<const int16_t> samples, size_t begin)
{
    SampleRun run{begin, 0, 0};
    size_t j = begin;
#if defined(__SSE2__)
    if (ScanSteps<false>(samples, begin, j, run.peak)) {
        run.length = j - begin;
        return run;
    }
#endif
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
        Scale(samples.data() + run.begin, run.length + 1, gain);
        return;
    }
    Scale(samples.data() + run.begin, samples.size() - run.begin, gain);
    spare = StoreLow16(gain * double(spare));
}

void PeakDistortWithGains(std::span<int16_t> samples, const PeakGains& gains)
{
    int16_t spare = 0;
    size_t i = 0;
    const size_t n = samples.size();
    while (i < n) {
        // A zero starts no run of either sign, so the step from it is one
        // sample; runs of zeros are common (silence), and the scans are
        // skipped for them.
        if (samples[i] == 0) {
            ++i;
            continue;
        }
        SampleRun positive{i, 0, 0};
        if (samples[i] >= 1) {
            positive = PositiveRun(samples, i);
            if (positive.length > 1) {
                ScaleRun(samples, positive, gains.Of(positive.peak), spare);
            }
        }
        const size_t u = positive.begin + positive.length;
        SampleRun negative{u, 0, 0};
        if (u < n && samples[u] <= -1) {
            negative = NegativeRun(samples, u);
            if (negative.length > 1) {
                ScaleRun(samples, negative, gains.Of(negative.peak), spare);
            }
        }
        i = negative.begin + negative.length + 1;
    }
}

}  // namespace glimmet::effects
