#pragma once

#include <cstdint>
#include <functional>
#include <memory>

#include "sound/SampleAllocator.h"
#include "support/Status.h"

namespace glimmet {

class Channel;
class ChannelManager;

/// Runs the in-place transforms over one range of every selected channel.
///
/// The transforms are described as: copy the range into one working buffer,
/// rewrite the buffer, write it back over the range; the buffer is shared by
/// all channels and all passes of one run. A channel whose copy fails (a
/// range starting exactly at the end of its data) therefore gets whatever
/// the previous channel left in the buffer.
///
/// Writing back builds new blocks for the range only: the rest of each
/// channel keeps its blocks, and the blocks the range had stay with whoever
/// shares them (the action's undo snapshot).
///
/// Callers hold the document lock for the transformer's whole life.
class RangeTransformer {
public:
    /// Rewrites count samples.
    using Transform = std::function<void(int16_t* samples, int64_t count)>;
    /// Looks at count samples.
    using Inspector = std::function<void(const int16_t* samples, int64_t count)>;

    RangeTransformer(ChannelManager* manager, int64_t start, int64_t end);
    ~RangeTransformer();
    RangeTransformer(const RangeTransformer&) = delete;
    RangeTransformer& operator=(const RangeTransformer&) = delete;

    /// B_OK when the run can go ahead; B_NO_MEMORY when a working buffer is
    /// needed and cannot be had (nothing has been changed then).
    status_t InitCheck() const { return status_; }

    /// One pass writing each selected channel's transformed range back.
    void TransformSelected(const Transform& transform);
    /// One pass that only looks at each selected channel's range.
    void InspectSelected(const Inspector& inspector);

private:
    bool AnySelected() const;

    ChannelManager* manager_;
    int64_t start_;
    int64_t end_;
    int64_t count_;
    /// Silence until the first copy; a failed copy leaves it as it was.
    SampleAllocator::Array buffer_;
    status_t status_ = B_OK;
};

}  // namespace glimmet
