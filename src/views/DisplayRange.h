#pragma once

#include <cstdint>

#include "views/FrameMapping.h"

namespace glimmet {

/// Which frames the channel container shows, [First(), Last()], across a
/// container Width() wide (right edge minus left edge), and the arithmetic
/// that keeps at least one frame per pixel column and places the zoom
/// slider. No widget: the container sets the width before it asks.
///
/// Most rules take the document's frame count, which is the container's to
/// know. Columns are counted from the width truncated to whole pixels.
class DisplayRange {
public:
    /// The zoom slider's handle positions for the displayed frames.
    struct SliderFractions {
        float left;
        float right;
    };

    int64_t First() const { return first_; }
    int64_t Last() const { return last_; }
    float Width() const { return width_; }
    void SetWidth(float width) { width_ = width; }
    /// Stores the frames as they are, without any rule.
    void Set(int64_t first, int64_t last);
    void SetLast(int64_t last) { last_ = last; }
    /// Whether frame is on display.
    bool Contains(int64_t frame) const { return first_ <= frame && frame <= last_; }

    FrameMapping Mapping() const { return FrameMapping(width_, first_, last_); }
    float PosAt(int64_t frame) const { return Mapping().PosAt(frame); }
    int64_t FirstFrameAt(float x) const { return Mapping().FirstFrameAt(x); }
    int64_t LastFrameAt(float x) const { return Mapping().LastFrameAt(x); }
    int64_t FrameAt(float x) const { return Mapping().FrameAt(x); }

    /// Shows [first, last], moving last out so that no column shows less
    /// than a frame. True when last was moved.
    bool SetWidened(int64_t first, int64_t last, int64_t frameCount);
    /// Shows the range [rangeStart, rangeEnd] centred and widened to one
    /// frame per column, shifted left rather than past the document's end.
    /// False, changing nothing, when the range lies outside -1 .. frameCount.
    bool ZoomTo(int64_t rangeStart, int64_t rangeEnd, int64_t frameCount);
    /// After a resize: widens a display range narrower than the columns and
    /// shifts it left rather than past the document's end.
    void WidenToOneFramePerColumn(int64_t frameCount);

    /// The smallest span the zoom slider may select: one frame per column,
    /// but no more than the document.
    int64_t SliderMinRange(int64_t frameCount) const;
    /// Where the zoom slider's handles go; frameCount must be positive.
    SliderFractions SliderFractionsFor(int64_t frameCount) const;

private:
    int64_t WholeColumns() const;

    float width_ = 0;
    int64_t first_ = 0;
    int64_t last_ = -1;
};

}  // namespace glimmet
