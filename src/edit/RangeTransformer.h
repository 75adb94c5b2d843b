#pragma once

#include <cstdint>
#include <functional>
#include <memory>

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
/// Where the range lies wholly inside a channel's data, copying out and
/// writing back is the same as rewriting the samples where they are, so
/// that is done instead (the result is identical and the run does no
/// allocation). The buffer's contents are then tracked as a pointer to
/// where they live, and materialised only when a failed copy needs them.
///
/// Callers hold the document lock for the transformer's whole life: it
/// reads and writes channel arrays directly.
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
    /// The range lies inside the channel's data: it can be used in place.
    bool InPlace(Channel* channel) const;
    bool NeedsBuffer() const;
    /// Copies the channel's range into the buffer; when the copy fails the
    /// buffer gets its previous contents instead.
    void Fill(Channel* channel);
    int16_t* RangeOf(Channel* channel) const;

    ChannelManager* manager_;
    int64_t start_;
    int64_t end_;
    int64_t count_;
    std::unique_ptr<int16_t[]> buffer_;
    /// Where the working buffer's contents are: null before anything was
    /// copied (silence), buffer_ itself, or a channel's range in place.
    const int16_t* contents_ = nullptr;
    status_t status_ = B_OK;
};

}  // namespace glimmet
