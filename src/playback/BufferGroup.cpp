#include "playback/BufferGroup.h"

namespace glimmet {

BufferGroup::BufferGroup(size_t bufferSize, int32_t count, size_t spareFloats) : bufferSize_(bufferSize)
{
    if (count < 0)
        count = 0;
    buffers_.resize(size_t(count));
    for (Buffer& buffer : buffers_)
        buffer.data.assign(bufferSize / sizeof(float) + spareFloats, 0.0f);
}

BufferGroup::Buffer* BufferGroup::RequestBuffer(size_t size)
{
    if (size > bufferSize_)
        return nullptr;
    for (Buffer& buffer : buffers_) {
        if (!buffer.inUse) {
            buffer.inUse = true;
            buffer.sizeUsed = 0;
            return &buffer;
        }
    }
    return nullptr;
}

void BufferGroup::Recycle(Buffer* buffer)
{
    if (buffer != nullptr)
        buffer->inUse = false;
}

}  // namespace glimmet
