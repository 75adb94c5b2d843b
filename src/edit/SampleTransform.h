#pragma once

#include <cstdint>

namespace glimmet {

/// The sample arithmetic of the in-place transforms, free of any document so
/// that it can be tested and measured on plain arrays.
///
/// Results are computed in double precision with 64-bit positions, truncated
/// toward zero to an int32, and the low 16 bits of that are stored: there is
/// no clipping.
class SampleTransform {
public:
    /// The low 16 bits of value truncated toward zero to an int32. A value
    /// no int32 can hold, not-a-number included, converts to 0x80000000,
    /// whose low 16 bits are 0.
    static int16_t StoreTruncated(double value)
    {
        // Written as two selects rather than a branch so that loops over
        // samples vectorise. A comparison with not-a-number is false.
        value = value < 2147483648.0 ? value : -2147483648.0;
        value = value > -2147483649.0 ? value : -2147483648.0;
        return int16_t(uint16_t(uint32_t(int32_t(value))));
    }

    /// s' = (i * s) / (n - 1): gain from 0 at the first sample to 1 at the
    /// last. One sample divides 0 by 0 and becomes 0.
    static void FadeIn(int16_t* samples, int64_t count);
    /// s' = (1 - i / (n - 1)) * s: gain from 1 at the first sample to 0 at
    /// the last.
    static void FadeOut(int16_t* samples, int64_t count);
    /// FadeIn and FadeOut for the count samples that sit at position first
    /// of a range of total samples: the same values the whole range would
    /// get, so a long range can be faded a piece at a time.
    static void FadeInPiece(int16_t* samples, int64_t count, int64_t first, int64_t total);
    static void FadeOutPiece(int16_t* samples, int64_t count, int64_t first, int64_t total);
    /// Reverses the order of the samples; an odd count keeps the middle one.
    static void Revert(int16_t* samples, int64_t count);
    /// 16-bit negation: -32768 stays -32768.
    static void RevertPhases(int16_t* samples, int64_t count);

    /// The first sample of the largest magnitude (|-32768| being 32768),
    /// compared with the peak found so far; 0 for silence.
    static int16_t Peak(const int16_t* samples, int64_t count, int16_t peakSoFar);
    /// |32767 / peak| as a float; infinite for a peak of 0.
    static float MaximizeFactor(int16_t peak);
    /// s' = factor * s.
    static void Scale(int16_t* samples, int64_t count, float factor);
};

}  // namespace glimmet
