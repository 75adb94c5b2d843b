#include "files/FrameSpreader.h"

#include <algorithm>
#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#define GLIMMET_SPREAD_SSE2 1
#endif

namespace glimmet::FrameSpreader {

namespace {

#ifdef GLIMMET_SPREAD_SSE2
constexpr uintptr_t kVectorAlign = 16;
constexpr int64_t kVectorSamples = 8;

bool IsAligned(const void* pointer)
{
    return (reinterpret_cast<uintptr_t>(pointer) & (kVectorAlign - 1)) == 0;
}

/// Samples to store one by one before to reaches a vector boundary; int16_t
/// arrays are at least 2-byte aligned, so this is below kVectorSamples.
int64_t SamplesToAlignment(const int16_t* to)
{
    const uintptr_t misalignment = reinterpret_cast<uintptr_t>(to) & (kVectorAlign - 1);
    return misalignment == 0 ? 0 : int64_t((kVectorAlign - misalignment) / sizeof(int16_t));
}
#endif

void SpreadOne(const int16_t* interleaved, int64_t frames, int16_t* to, int channel)
{
    for (int64_t frame = 0; frame < frames; ++frame)
        to[frame] = interleaved[2 * frame + channel];
}

}  // namespace

void SpreadMono(const int16_t* interleaved, int64_t frames, int16_t* to)
{
    int64_t frame = 0;
#ifdef GLIMMET_SPREAD_SSE2
    const int64_t head = std::min<int64_t>(frames, SamplesToAlignment(to));
    std::memcpy(to, interleaved, size_t(head) * sizeof(int16_t));
    for (frame = head; frame + kVectorSamples <= frames; frame += kVectorSamples) {
        const __m128i samples = _mm_loadu_si128(reinterpret_cast<const __m128i*>(interleaved + frame));
        _mm_stream_si128(reinterpret_cast<__m128i*>(to + frame), samples);
    }
#endif
    if (frame < frames)
        std::memcpy(to + frame, interleaved + frame, size_t(frames - frame) * sizeof(int16_t));
}

void SpreadStereo(const int16_t* interleaved, int64_t frames, int16_t* left, int16_t* right)
{
    if (left == nullptr || right == nullptr) {
        if (left != nullptr)
            SpreadOne(interleaved, frames, left, 0);
        if (right != nullptr)
            SpreadOne(interleaved, frames, right, 1);
        return;
    }
    int64_t frame = 0;
#ifdef GLIMMET_SPREAD_SSE2
    const int64_t head = std::min<int64_t>(frames, SamplesToAlignment(left));
    for (; frame < head; ++frame) {
        left[frame] = interleaved[2 * frame];
        right[frame] = interleaved[2 * frame + 1];
    }
    // Both arrays reach a vector boundary at the same frame when they share
    // their alignment, as page-aligned arrays filled in step do; otherwise
    // everything goes the plain way below.
    if (IsAligned(right + frame)) {
        for (; frame + kVectorSamples <= frames; frame += kVectorSamples) {
            const auto* from = reinterpret_cast<const __m128i*>(interleaved + 2 * frame);
            const __m128i first = _mm_loadu_si128(from);
            const __m128i second = _mm_loadu_si128(from + 1);
            // Each 32-bit lane holds one frame: left in its low half, right
            // in its high half. Shifting sign-extends either half to 32
            // bits, and packing takes them back to 16 bits unchanged.
            const __m128i lefts = _mm_packs_epi32(_mm_srai_epi32(_mm_slli_epi32(first, 16), 16),
                                                  _mm_srai_epi32(_mm_slli_epi32(second, 16), 16));
            const __m128i rights = _mm_packs_epi32(_mm_srai_epi32(first, 16), _mm_srai_epi32(second, 16));
            _mm_stream_si128(reinterpret_cast<__m128i*>(left + frame), lefts);
            _mm_stream_si128(reinterpret_cast<__m128i*>(right + frame), rights);
        }
    }
#endif
    for (; frame < frames; ++frame) {
        left[frame] = interleaved[2 * frame];
        right[frame] = interleaved[2 * frame + 1];
    }
}

void Finish()
{
#ifdef GLIMMET_SPREAD_SSE2
    _mm_sfence();
#endif
}

}  // namespace glimmet::FrameSpreader
