#pragma once

#include <cstdint>
#include <span>
#include <vector>

#include <QImage>

#include "sound/SampleBlock.h"
#include "views/RowCounter.h"

namespace glimmet {

/// What one render of a channel's columns needs to know: the container's
/// display range, range, cursor and play mark, and the channel's data.
struct WaveformScene {
    int64_t firstFrame = 0;
    int64_t lastFrame = -1;
    int64_t rangeStart = -1;
    int64_t rangeEnd = -1;
    int64_t cursorFrame = 0;
    int64_t playmarkFrame = -1;
    bool selected = false;
    int64_t channelFirstFrame = 0;
    int64_t channelFrameCount = 0;
    /// The channel's samples in order from its first frame on; spans over
    /// blocks may be shaded from the blocks' summaries.
    std::span<const SampleSpan> spans;
    /// (last - first + 1) / (view width in pixels), single precision.
    float framesPerColumn = 0;
};

/// What a column of the image shows, so that a later render can tell the
/// columns whose picture would not change.
struct RenderedColumn {
    int64_t firstFrame = 0;
    int64_t lastFrame = -1;
    uint8_t state = 0;  // 0: nothing valid drawn
};

/// Renders pixel columns of a channel into an RGB32 image as a density
/// picture: each row of a column is shaded by how many of the column's
/// samples lie at or beyond it, seen from the nearer edge; whole columns are
/// tinted for the range, the cursor and the play mark, and a column that
/// reaches outside the channel's data is one flat colour.
class WaveformRenderer {
public:
    /// rowTable maps (sample + 32768) >> 3 to a pixel row; rows is the number
    /// of rows to fill (the view's height).
    WaveformRenderer(QImage& image, const int16_t* rowTable, int32_t rows, const WaveformScene& scene);

    /// Renders columns left, left + 1, ..., left + count - 1 and returns how
    /// many it rendered. With a memo of what each column shows (one entry
    /// per image column), a column that would come out the same is skipped
    /// and the memo is brought up to date.
    int32_t RenderColumns(float left, int32_t count, std::vector<RenderedColumn>* memo = nullptr);

    /// Blocks that want a summary are listed in wanted instead of getting
    /// one during the render (see RowCounter::DeferSummaries).
    void DeferSummaries(std::vector<const SampleBlock*>* wanted) { counter_.DeferSummaries(wanted); }

    /// Summaries made for blocks during the renders.
    int64_t SummariesMade() const { return counter_.SummariesMade(); }

private:
    struct ColumnState {
        bool inRange;
        bool cursor;
        bool playmark;

        uint8_t Bits() const { return uint8_t(0x80 | (inRange ? 1 : 0) | (cursor ? 2 : 0) | (playmark ? 4 : 0)); }
    };

    ColumnState StateOf(int64_t f0, int64_t f1) const;
    bool IsOutsideData(int64_t f0, int64_t f1) const;
    void FillColumn(int32_t column, ColumnState state);
    void RenderDataColumn(int32_t column, int64_t f0, int64_t f1, ColumnState state);
    void CountSamples(int64_t f0, int64_t f1);
    void PrefetchFrames(int64_t f0, int64_t f1);
    template <typename F>
    void ForEachSpanPart(int64_t f0, int64_t f1, F&& f) const;
    bool Unchanged(std::vector<RenderedColumn>* memo, int32_t column, int64_t f0, int64_t f1, ColumnState state) const;
    // One detach for the whole render instead of one per pixel.
    QRgb& PixelAt(int32_t column, int32_t row)
    {
        return reinterpret_cast<QRgb*>(pixels_ + ptrdiff_t(row) * stride_)[column];
    }
    template <typename Shade>
    void ShadeColumn(int32_t column, Shade&& shade);

    QImage& image_;
    const int16_t* rowTable_;
    int32_t rows_;
    WaveformScene scene_;
    // 16-bit counters: a column of more than 65535 frames wraps them.
    std::vector<uint16_t> histogram_;
    RowCounter counter_;
    // Where each span starts, counted from the channel's first frame.
    std::vector<int64_t> spanStarts_;
    // Frames the spans hold, at most the channel's frame count.
    int64_t dataCount_ = 0;
    uchar* pixels_;
    qsizetype stride_;
};

}  // namespace glimmet
