#pragma once

#include <cstdint>

#include "support/Status.h"

namespace glimmet {

/// Where saving puts the document's mix: interleaved stereo 16-bit frames,
/// buffer by buffer.
class FrameWriter {
public:
    virtual ~FrameWriter() = default;

    /// Writes count frames (2 * count samples); B_OK or why not.
    virtual status_t WriteFrames(const int16_t* frames, int64_t count) = 0;
};

}  // namespace glimmet
