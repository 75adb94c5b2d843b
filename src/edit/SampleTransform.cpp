#include "edit/SampleTransform.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <limits>
#include <utility>

#include "support/VectorClones.h"

namespace glimmet {

namespace {

// The loops below work in blocks of a fixed number of samples so that the
// compiler turns each block into vector code (packed divisions included);
// the last, partial block runs the same per-sample function one sample at a
// time. A block is computed into an array of doubles first and truncated and
// stored in a second loop: with both steps in one loop the compiler leaves
// the division scalar.
constexpr int64_t kBlock = 16;

template <typename SampleFunction>
inline void ForEachSample(int16_t* samples, int64_t count, int64_t first, SampleFunction function)
{
    double values[kBlock];
    int64_t i = 0;
    for (; i + kBlock <= count; i += kBlock) {
        const double base = double(first + i);
        int16_t* block = samples + i;
        for (int32_t j = 0; j < int32_t(kBlock); j++)
            values[j] = function(base + double(j), block[j]);
        for (int32_t j = 0; j < int32_t(kBlock); j++)
            block[j] = SampleTransform::StoreTruncated(values[j]);
    }
    for (; i < count; i++)
        samples[i] = SampleTransform::StoreTruncated(function(double(first + i), samples[i]));
}

GLIMMET_VECTOR_CLONES void FadeInSamples(int16_t* samples, int64_t count, int64_t first, double last)
{
    ForEachSample(samples, count, first, [last](double position, int16_t sample) { return position * double(sample) / last; });
}

GLIMMET_VECTOR_CLONES void FadeOutSamples(int16_t* samples, int64_t count, int64_t first, double last)
{
    ForEachSample(
        samples, count, first, [last](double position, int16_t sample) { return (1.0 - position / last) * double(sample); });
}

GLIMMET_VECTOR_CLONES void ScaleSamples(int16_t* samples, int64_t count, double factor)
{
    ForEachSample(samples, count, 0, [factor](double, int16_t sample) { return factor * double(sample); });
}

// A one-sample range divides 0 by 0: not-a-number, which stores 0. Said
// outright rather than left to the division, which sanitizers may flag.
bool ClearSingleSample(int16_t* samples, int64_t count)
{
    if (count != 1)
        return false;
    samples[0] = 0;
    return true;
}

}  // namespace

void SampleTransform::FadeIn(int16_t* samples, int64_t count)
{
    FadeInPiece(samples, count, 0, count);
}

void SampleTransform::FadeOut(int16_t* samples, int64_t count)
{
    FadeOutPiece(samples, count, 0, count);
}

void SampleTransform::FadeInPiece(int16_t* samples, int64_t count, int64_t first, int64_t total)
{
    if (ClearSingleSample(samples, total))
        return;
    FadeInSamples(samples, count, first, double(total - 1));
}

void SampleTransform::FadeOutPiece(int16_t* samples, int64_t count, int64_t first, int64_t total)
{
    if (ClearSingleSample(samples, total))
        return;
    FadeOutSamples(samples, count, first, double(total - 1));
}

void SampleTransform::Revert(int16_t* samples, int64_t count)
{
    for (int64_t i = 0; i < count / 2; i++)
        std::swap(samples[i], samples[count - 1 - i]);
}

void SampleTransform::RevertPhases(int16_t* samples, int64_t count)
{
    for (int64_t i = 0; i < count; i++)
        samples[i] = int16_t(-int32_t(samples[i]));
}

int16_t SampleTransform::Peak(const int16_t* samples, int64_t count, int16_t peakSoFar)
{
    // The largest magnitude first (a loop the compiler vectorises), then the
    // first sample that has it.
    int32_t largest = 0;
    for (int64_t i = 0; i < count; i++)
        largest = std::max(largest, std::abs(int32_t(samples[i])));
    if (largest <= std::abs(int32_t(peakSoFar)))
        return peakSoFar;
    for (int64_t i = 0; i < count; i++) {
        if (std::abs(int32_t(samples[i])) == largest)
            return samples[i];
    }
    return peakSoFar;
}

float SampleTransform::MaximizeFactor(int16_t peak)
{
    // Silence has no peak: the factor is infinite, and every 0 * infinity
    // is not-a-number, which stores 0.
    if (peak == 0)
        return std::numeric_limits<float>::infinity();
    return std::fabs(32767.0f / float(peak));
}

void SampleTransform::Scale(int16_t* samples, int64_t count, float factor)
{
    ScaleSamples(samples, count, double(factor));
}

}  // namespace glimmet
