#pragma once

#include <cstdint>
#include <vector>

#include <QImage>

#include "sound/SampleBlock.h"

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
    /// The channel's data in order, one span per block; empty without data.
    std::vector<SampleSpan> spans;
    /// (last - first + 1) / (view width in pixels), single precision.
    float framesPerColumn = 0;
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

    /// Renders columns left, left + 1, ..., left + count - 1.
    void RenderColumns(float left, int32_t count);

private:
    struct ColumnState {
        bool inRange;
        bool cursor;
        bool playmark;
    };

    ColumnState StateOf(int64_t f0, int64_t f1) const;
    bool IsOutsideData(int64_t f0, int64_t f1) const;
    void FillColumn(int32_t column, ColumnState state);
    void RenderDataColumn(int32_t column, int64_t f0, int64_t f1, ColumnState state);
    void CountSamples(int64_t f0, int64_t f1);
    QRgb& PixelAt(int32_t column, int32_t row);
    void ShadeRow(int32_t column, int32_t row, int64_t count, int64_t total, ColumnState state, bool lowerPass);

    QImage& image_;
    const int16_t* rowTable_;
    int32_t rows_;
    WaveformScene scene_;
    // 16-bit counters: a column of more than 65535 frames wraps them.
    std::vector<uint16_t> histogram_;
    std::vector<uint32_t> partials_;  // scratch of CountSamples
    uchar* pixels_;
    qsizetype stride_;
};

}  // namespace glimmet
