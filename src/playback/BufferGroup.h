#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace glimmet {

/// A fixed set of equally sized audio buffers, made once per connection so
/// that the audio thread never allocates. A buffer is taken with
/// RequestBuffer and returned with Recycle.
///
/// Thread use: made and destroyed on the window thread while the audio thread
/// does not run the producer; requested and recycled on the audio thread only.
class BufferGroup {
public:
    struct Buffer {
        std::vector<float> data;  // sized for the mixer's widest write
        size_t sizeUsed = 0;      // bytes of valid audio
        bool inUse = false;
    };

    /// count buffers of bufferSize bytes each. The mixer writes stereo
    /// whatever the format's channel count, so each buffer also has room for
    /// spareFloats floats past its size; that room never reaches the device.
    BufferGroup(size_t bufferSize, int32_t count, size_t spareFloats = 0);

    size_t BufferSize() const { return bufferSize_; }
    int32_t CountBuffers() const { return int32_t(buffers_.size()); }

    /// A free buffer of at least size bytes, or null when none is free or
    /// size is larger than the group's buffers.
    Buffer* RequestBuffer(size_t size);
    void Recycle(Buffer* buffer);

private:
    size_t bufferSize_;
    std::vector<Buffer> buffers_;
};

}  // namespace glimmet
