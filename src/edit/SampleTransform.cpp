#include "edit/SampleTransform.h"

#include <cmath>
#include <cstdlib>
#include <limits>
#include <utility>

namespace glimmet {

namespace {

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
    if (ClearSingleSample(samples, count))
        return;
    const double last = double(count - 1);
    for (int64_t i = 0; i < count; i++)
        samples[i] = StoreTruncated(double(i) * double(samples[i]) / last);
}

void SampleTransform::FadeOut(int16_t* samples, int64_t count)
{
    if (ClearSingleSample(samples, count))
        return;
    const double last = double(count - 1);
    for (int64_t i = 0; i < count; i++)
        samples[i] = StoreTruncated((1.0 - double(i) / last) * double(samples[i]));
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
    int16_t peak = peakSoFar;
    int32_t magnitude = std::abs(int32_t(peak));
    for (int64_t i = 0; i < count; i++) {
        const int32_t sampleMagnitude = std::abs(int32_t(samples[i]));
        if (sampleMagnitude > magnitude) {
            peak = samples[i];
            magnitude = sampleMagnitude;
        }
    }
    return peak;
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
    const double wide = double(factor);
    for (int64_t i = 0; i < count; i++)
        samples[i] = StoreTruncated(wide * double(samples[i]));
}

}  // namespace glimmet
