#pragma once

#include <atomic>
#include <cstdint>

namespace glimmet {

/// The time stretch of one channel by the phase vocoder: the input is
/// analysed in overlapping windows, frames are read at a rate of 1 / stretch
/// with linear interpolation between neighbours, and each frame is
/// resynthesised by the oscillator bank (P != 0) or by inverse FFT and
/// overlap-add (P == 0) into a 16384-float accumulator that is copied over
/// the start of the output after every frame.
///
/// The whole run holds the vocoder's lock, so stretches take turns.
class VocoderStretch {
public:
    /// The window length of the analysis and synthesis.
    static constexpr int kWindow = 16384;

    VocoderStretch() = delete;

    /// The input frames the vocoder ever reads: the first two windows, which
    /// make its first two analysis frames; every later frame is analysed from
    /// the FFT buffer. A caller may pass just these.
    static constexpr int64_t kInputRead = 2 * int64_t(kWindow);
    /// The output frames it ever writes: the accumulator is copied over the
    /// start of the output after every frame, so everything past the first
    /// window stays as the caller left it. A caller may pass just these.
    static constexpr int64_t kOutputWritten = kWindow;

    /// N is the FFT length, D the analysis hop, I the synthesis hop (D when
    /// 0), P the oscillators' pitch factor. inputFrames and outputFrames are
    /// the lengths of the whole input and output; input need only hold
    /// min(inputFrames, kInputRead) floats and output min(outputFrames,
    /// kOutputWritten), so a stretch of any length costs a few windows. False, with a message, for a
    /// stretch factor of 0 and for values the vocoder cannot use. stop, when
    /// given and set, ends the run early (false, as a failure); the program
    /// uses it only when it quits in the middle of a stretch. progress, when
    /// given, follows the share of the input analysed so far (0 to 1).
    static bool Stretch(const float* input, int64_t inputFrames, float* output, int64_t outputFrames, int32_t N,
        int32_t D, int32_t I, float P, float stretch, float unused, const std::atomic<bool>* stop = nullptr,
        std::atomic<double>* progress = nullptr);

    /// dst[k] = src[k] for k < n.
    static void CopyFrame(float* dst, const float* src, int32_t n);
    /// dst[k] = (1 - t) a[k] + t b[k], in float.
    static void InterpolateFrame(float* dst, const float* a, const float* b, int32_t n, float t);
    /// The largest of a[0 .. n-1], starting from a[0].
    static float MaxOf(const float* a, int32_t n);

private:
    static bool UsableParameters(int32_t N, float stretch);
};

}  // namespace glimmet
