#include "sound/SoftClip.h"

#include <algorithm>

#include "support/VectorClones.h"

namespace glimmet {

float soft_clip(float x)
{
    using namespace soft_clip_detail;
    if (x < -kKnee)
        return -soft_clip(-x);
    if (x <= kKnee)
        return x;
    if (x < 1.0f)
        return Blend(x, Parabola(x));
    return Parabola(x);
}

// Every piece of the curve is computed for every value, each in a loop of
// its own, and selects pick the piece soft_clip would return. With the
// pieces in one loop the compiler moves the blend behind a branch, since
// only some values need it, and the loop stays scalar. The operations and
// their order are those of soft_clip, so the results are the same bits;
// not-a-number fails every comparison there and here, and takes the
// parabola.
GLIMMET_VECTOR_CLONES void soft_clip_block(const float* in, float* out, int64_t count)
{
    using namespace soft_clip_detail;
    constexpr int64_t kChunk = 64;
    // The input is copied first, so that writing out in place is safe.
    float x[kChunk];
    float magnitude[kChunk];
    float parabola[kChunk];
    float blend[kChunk];
    for (int64_t begin = 0; begin < count; begin += kChunk) {
        const int64_t n = std::min(kChunk, count - begin);
        for (int64_t i = 0; i < n; ++i) {
            x[i] = in[begin + i];
            // Below -0.3 the curve is mirrored: work on -x, negate the result.
            magnitude[i] = x[i] < -kKnee ? -x[i] : x[i];
        }
        for (int64_t i = 0; i < n; ++i)
            parabola[i] = Parabola(magnitude[i]);
        for (int64_t i = 0; i < n; ++i)
            blend[i] = Blend(magnitude[i], parabola[i]);
        for (int64_t i = 0; i < n; ++i) {
            float value = magnitude[i] < 1.0f ? blend[i] : parabola[i];
            value = magnitude[i] <= kKnee ? magnitude[i] : value;
            out[begin + i] = x[i] < -kKnee ? -value : value;
        }
    }
}

}  // namespace glimmet
