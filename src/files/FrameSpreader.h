#pragma once

#include <cstdint>

namespace glimmet {

/// Spreads interleaved 16-bit frames over one array per channel.
///
/// The arrays are written once and read much later, so long runs are stored
/// past the cache (non-temporal stores): that spares reading every
/// destination line in before it is overwritten, and leaves the cache to the
/// frames still being read. Finish() must be called before another thread
/// reads what was written.
namespace FrameSpreader {

/// Copies frames samples from interleaved (one channel) into to.
void SpreadMono(const int16_t* interleaved, int64_t frames, int16_t* to);

/// Copies the left and right samples of frames stereo frames; either
/// destination may be null, and its samples are then skipped.
void SpreadStereo(const int16_t* interleaved, int64_t frames, int16_t* left, int16_t* right);

/// Makes the stores of the calls before visible to other threads in order.
void Finish();

}  // namespace FrameSpreader

}  // namespace glimmet
