#pragma once

#include <cstdint>

#include "sound/SoftClip.h"

// The sample loops of the Mixer: summing channels, bending and converting
// the sums. Free functions over plain arrays, so that they vectorise and can
// be reasoned about apart from the document.
namespace glimmet::mix {

/// Every channel sample enters the mix as s / 32768.
inline constexpr float kSampleScale = 3.0517578125e-05f;

/// Such values add up exactly in single precision as long as no partial sum
/// reaches 512 in magnitude: with fewer than 512 contributors per side the
/// float sum in channel order equals the integer sum of the samples, scaled
/// once. Up to this many channels the mixer sums integers, which is exact
/// and fast, and scales at the end.
inline constexpr int32_t kExactIntegerSumLimit = 511;

/// The sides a channel is heard on.
inline constexpr uint8_t kHeardLeft = 1;
inline constexpr uint8_t kHeardRight = 2;

/// Middle is heard on both sides, left and right on theirs, a muted channel
/// (or any other pan value) on none.
uint8_t HeardSides(bool muted, int8_t pan);

/// A side heard from nothing is silent, from one channel passes unchanged (a
/// lone full-scale channel is never bent), from more goes through the curve.
/// There is no division by the number of channels.
inline float CombineSide(float sum, int32_t contributors)
{
    if (contributors == 0)
        return 0.0f;
    return contributors == 1 ? sum : soft_clip(sum);
}

// Rounds to nearest even as the processor does by default, and stores the
// integer-indefinite value -32768 for anything outside the 16-bit range, as
// a 16-bit integer store of the FPU does. Written without branches or calls
// so that the conversion loop vectorises; adding and removing 1.5 * 2^23
// rounds exactly for every magnitude that passes the range test.
inline constexpr float kOutputScale = 32767.0f;
inline constexpr float kRoundingMagic = 12582912.0f;

inline int16_t ToSample(float value)
{
    const float scaled = value * kOutputScale;
    const bool inRange = (scaled >= -32768.5f) & (scaled < 32767.5f);
    const float rounded = (scaled + kRoundingMagic) - kRoundingMagic;
    return int16_t(int32_t(inRange ? rounded : -32768.0f));
}

/// ToSample for a value that cannot leave the 16-bit range: silence, or a
/// single channel's s / 32768, which scales to at most 32767 in magnitude.
inline int16_t ToSampleInRange(float value)
{
    const float scaled = value * kOutputScale;
    return int16_t(int32_t((scaled + kRoundingMagic) - kRoundingMagic));
}

void AddSamples(const int16_t* samples, int64_t frames, int32_t* sums);
void CopySamples(const int16_t* samples, int64_t frames, int32_t* sums);
void AddSamplesToBoth(const int16_t* samples, int64_t frames, int32_t* left, int32_t* right);

// Asks the processor to start loading the samples the next buffer will most
// likely read, so that they arrive while this buffer is mixed: the samples
// come from main memory, and waiting for each cache line in turn took most
// of the mix's time, with many channels in playback and in saving alike. Up
// to kPrefetchLimit samples per channel, the next buffer for playback and
// for saving; far larger requests would only have the first of them evicted
// again before their turn.
inline constexpr int64_t kPrefetchLimit = 4096;

inline void PrefetchSamples(const int16_t* samples, int64_t count)
{
    constexpr int64_t kLineSamples = 64 / sizeof(int16_t);
    for (int64_t i = 0; i < count; i += kLineSamples)
        __builtin_prefetch(samples + i);
}

/// Mixes the integer sums of the sides (heard from leftCount and rightCount
/// channels) into interleaved frames; leftCurved and rightCurved hold frames
/// values each and are overwritten.
void WriteMix(int32_t leftCount, int32_t rightCount, const int32_t* leftSums, const int32_t* rightSums,
    float* leftCurved, float* rightCurved, int64_t frames, float* out);
void WriteMix(int32_t leftCount, int32_t rightCount, const int32_t* leftSums, const int32_t* rightSums,
    float* leftCurved, float* rightCurved, int64_t frames, int16_t* out);

}  // namespace glimmet::mix
