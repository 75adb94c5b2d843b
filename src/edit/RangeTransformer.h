#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>

#include "sound/SampleAllocator.h"
#include "sound/SampleSlice.h"
#include "support/Status.h"

namespace glimmet {

class Channel;
class ChannelManager;
class SampleBlock;

/// A transform that can rewrite a range one piece at a time.
struct PieceTransform {
    /// Rewrites count samples that sit at position first of a range of
    /// total samples; given the same samples it must write what a pass over
    /// the whole range would write there.
    using Apply = std::function<void(int16_t* samples, int64_t count, int64_t first, int64_t total)>;
    Apply apply;
    /// What a piece of silence becomes, wherever it sits, when that is one
    /// value throughout (a fade keeps it silent, a distortion curve may lift
    /// it): such pieces are not computed, and their result is shared. Empty
    /// when silence must be computed like anything else.
    std::optional<int16_t> silenceBecomes;
    /// True when the output at position p comes from the input at position
    /// total - 1 - p (a reversal); apply then gets the input piece that
    /// mirrors the output piece and must reverse it.
    bool mirrored = false;
};

/// A transform that builds each channel's new range from the old one as a
/// whole, streaming it (a filter whose output depends on the frames before
/// it, an effect whose runs of samples may span pieces).
struct SliceTransform {
    /// Frames read before the range, with it: a filter's history.
    int64_t lookBehind = 0;
    /// Builds the count frames of the new range from source (lookBehind +
    /// count frames: the history, then the range); false when memory ran
    /// out.
    std::function<bool(const SampleSlice& source, int64_t count, SampleSlice* result)> build;
    /// What a channel whose copy fails is given instead: true for what the
    /// previous channel read (a transform that writes to a buffer of its
    /// own, leaving its input as it was), false for what it wrote back (a
    /// transform that rewrites its working buffer in place).
    bool keepsSource = false;
};

/// Runs the in-place transforms over one range of every selected channel.
///
/// The transforms behave as if the range were copied into one working
/// buffer, rewritten and written back over the range, the buffer being
/// shared by all channels and all passes of one run: a channel whose copy
/// fails (a range starting exactly at the end of its data) gets whatever the
/// previous channel left in the buffer.
///
/// The pieced passes never hold the range in memory: the range is read as
/// shared blocks, rewritten a block at a time into new blocks, and the
/// silence in it (before or past a channel's data, or stored as the shared
/// silence block) is passed through as shared silence when the transform
/// says what silence becomes. A range of a billion frames around a short
/// channel therefore costs references, not gigabytes. The whole-range
/// passes remain for transforms that need every sample at once.
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

    /// B_OK when the run went ahead; B_NO_MEMORY when memory it needed
    /// could not be had (a whole-range buffer refused changes nothing).
    status_t InitCheck() const { return status_; }

    /// One pass writing each selected channel's transformed range back.
    void TransformSelected(const Transform& transform);
    /// The same, a piece at a time.
    void TransformSelected(const PieceTransform& transform);
    /// The same for a transform of the whole slice.
    void TransformSelected(const SliceTransform& transform);
    /// One pass that only looks at each selected channel's range, a piece
    /// at a time; pieces of silence are skipped when skipSilence is true
    /// (the inspector would learn nothing from them).
    void InspectSelected(const Inspector& inspector, bool skipSilence = false);

    /// True when the count samples of source from index on are all known
    /// silence: outside its blocks, or in the shared silence block.
    static bool PieceIsSilent(const SampleSlice& source, int64_t index, int64_t count);
    /// Copies count samples of source from index on into destination.
    static void CopyPiece(const SampleSlice& source, int64_t index, int64_t count, int16_t* destination);

private:
    bool AnySelected() const;
    bool Ready() const;
    /// The channel's range, or what the working buffer holds when the
    /// channel's copy fails; false when memory ran out.
    bool ReadSource(Channel* channel, SampleSlice* source);
    /// Builds the transformed range of source into result.
    bool TransformSlice(const SampleSlice& source, const PieceTransform& transform, SampleSlice* result);

    ChannelManager* manager_;
    int64_t start_;
    int64_t end_;
    int64_t count_;
    /// What the working buffer holds between channels and passes: silence
    /// until the first copy; a failed copy leaves it as it was.
    SampleSlice held_;
    /// The whole-range buffer, made for the first whole-range pass.
    SampleAllocator::Array buffer_;
    status_t status_ = B_OK;
};

}  // namespace glimmet
