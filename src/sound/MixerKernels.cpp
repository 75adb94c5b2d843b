#include "sound/MixerKernels.h"

#include "sound/Channel.h"
#include "support/VectorClones.h"

namespace glimmet::mix {

namespace {

// How one side of the mix is heard; see CombineSide.
enum class SideMode { kSilent, kSingle, kCurve };

SideMode ModeFor(int32_t contributors)
{
    if (contributors == 0)
        return SideMode::kSilent;
    return contributors == 1 ? SideMode::kSingle : SideMode::kCurve;
}

// One side's input to the last pass: the integer sums, and for a side that
// goes through the curve, its values already bent.
struct SideInput {
    const int32_t* sums;
    const float* curved;
};

template <SideMode mode>
inline float SideValue(const SideInput& side, int64_t i)
{
    if constexpr (mode == SideMode::kSilent)
        return 0.0f;
    else if constexpr (mode == SideMode::kSingle)
        return float(side.sums[i]) * kSampleScale;
    else
        return side.curved[i];
}

// The last pass of a mix: scale the integer sums, combine each side and
// interleave. One instance per pair of side modes keeps the loop free of
// branches, so the common cases vectorise.
template <SideMode left, SideMode right>
GLIMMET_VECTOR_CLONES void WriteFrames(SideInput leftSide, SideInput rightSide, int64_t frames, float* out)
{
    for (int64_t i = 0; i < frames; ++i) {
        out[2 * i] = SideValue<left>(leftSide, i);
        out[2 * i + 1] = SideValue<right>(rightSide, i);
    }
}

// Only the curve can leave the 16-bit range (its parabola falls without
// bound); the other sides skip the range test.
template <SideMode mode>
inline int16_t SideSample(const SideInput& side, int64_t i)
{
    if constexpr (mode == SideMode::kCurve)
        return ToSample(SideValue<mode>(side, i));
    else
        return ToSampleInRange(SideValue<mode>(side, i));
}

template <SideMode left, SideMode right>
GLIMMET_VECTOR_CLONES void WriteFrames(SideInput leftSide, SideInput rightSide, int64_t frames, int16_t* out)
{
    for (int64_t i = 0; i < frames; ++i) {
        out[2 * i] = SideSample<left>(leftSide, i);
        out[2 * i + 1] = SideSample<right>(rightSide, i);
    }
}

template <typename Sample, SideMode left>
void WriteFramesFor(SideMode right, SideInput leftSide, SideInput rightSide, int64_t frames, Sample* out)
{
    switch (right) {
        case SideMode::kSilent: WriteFrames<left, SideMode::kSilent>(leftSide, rightSide, frames, out); break;
        case SideMode::kSingle: WriteFrames<left, SideMode::kSingle>(leftSide, rightSide, frames, out); break;
        case SideMode::kCurve: WriteFrames<left, SideMode::kCurve>(leftSide, rightSide, frames, out); break;
    }
}

GLIMMET_VECTOR_CLONES void ScaleSums(const int32_t* sums, int64_t frames, float* values)
{
    for (int64_t i = 0; i < frames; ++i)
        values[i] = float(sums[i]) * kSampleScale;
}

// Bends a side heard from several channels: its scaled sums go through the
// curve in vector code, into curved.
SideInput PrepareSide(SideMode mode, const int32_t* sums, int64_t frames, float* curved)
{
    if (mode == SideMode::kCurve) {
        ScaleSums(sums, frames, curved);
        soft_clip_block(curved, curved, frames);
    }
    return SideInput{sums, curved};
}

template <typename Sample>
void WriteMixOf(int32_t leftCount, int32_t rightCount, const int32_t* leftSums, const int32_t* rightSums,
    float* leftCurved, float* rightCurved, int64_t frames, Sample* out)
{
    const SideMode leftMode = ModeFor(leftCount);
    const SideMode right = ModeFor(rightCount);
    const SideInput leftSide = PrepareSide(leftMode, leftSums, frames, leftCurved);
    const SideInput rightSide = PrepareSide(right, rightSums, frames, rightCurved);
    switch (leftMode) {
        case SideMode::kSilent:
            WriteFramesFor<Sample, SideMode::kSilent>(right, leftSide, rightSide, frames, out);
            break;
        case SideMode::kSingle:
            WriteFramesFor<Sample, SideMode::kSingle>(right, leftSide, rightSide, frames, out);
            break;
        case SideMode::kCurve:
            WriteFramesFor<Sample, SideMode::kCurve>(right, leftSide, rightSide, frames, out);
            break;
    }
}

}  // namespace

uint8_t HeardSides(bool muted, int8_t pan)
{
    if (muted)
        return 0;
    uint8_t sides = 0;
    if (pan == Channel::kPanMiddle || pan == Channel::kPanLeft)
        sides |= kHeardLeft;
    if (pan == Channel::kPanMiddle || pan == Channel::kPanRight)
        sides |= kHeardRight;
    return sides;
}

GLIMMET_VECTOR_CLONES void AddSamples(const int16_t* samples, int64_t frames, int32_t* sums)
{
    for (int64_t i = 0; i < frames; ++i)
        sums[i] += samples[i];
}

GLIMMET_VECTOR_CLONES void CopySamples(const int16_t* samples, int64_t frames, int32_t* sums)
{
    for (int64_t i = 0; i < frames; ++i)
        sums[i] = samples[i];
}

GLIMMET_VECTOR_CLONES void AddSamplesToBoth(const int16_t* samples, int64_t frames, int32_t* left, int32_t* right)
{
    for (int64_t i = 0; i < frames; ++i) {
        left[i] += samples[i];
        right[i] += samples[i];
    }
}

void WriteMix(int32_t leftCount, int32_t rightCount, const int32_t* leftSums, const int32_t* rightSums,
    float* leftCurved, float* rightCurved, int64_t frames, float* out)
{
    WriteMixOf(leftCount, rightCount, leftSums, rightSums, leftCurved, rightCurved, frames, out);
}

void WriteMix(int32_t leftCount, int32_t rightCount, const int32_t* leftSums, const int32_t* rightSums,
    float* leftCurved, float* rightCurved, int64_t frames, int16_t* out)
{
    WriteMixOf(leftCount, rightCount, leftSums, rightSums, leftCurved, rightCurved, frames, out);
}

}  // namespace glimmet::mix
