#include "views/WaveformRenderer.h"

#include <algorithm>

#include "views/FrameMapping.h"

namespace glimmet {

namespace {

constexpr QRgb kEmptyCursorAndPlaymark = qRgb(50, 220, 220);
constexpr QRgb kEmptyPlaymark = qRgb(0, 220, 50);
constexpr QRgb kEmptyCursor = qRgb(0, 0, 220);
constexpr QRgb kEmptyInRange = qRgb(50, 50, 50);
constexpr QRgb kEmptyPlain = qRgb(80, 80, 80);

// k - k * count / total in byte arithmetic.
inline uint8_t Fade(int64_t k, int64_t count, int64_t total)
{
    return uint8_t(k - (k * count) / total);
}

inline uint8_t Rise(int64_t k, int64_t count, int64_t total)
{
    return uint8_t((k * count) / total);
}

}  // namespace

WaveformRenderer::WaveformRenderer(QImage& image, const int16_t* rowTable, int32_t rows, const WaveformScene& scene)
    : image_(image), rowTable_(rowTable), rows_(std::min(rows, image.height())), scene_(scene),
      histogram_(size_t(std::max(rows, image.height()) + 1), 0),
      pixels_(image.isNull() ? nullptr : image.bits()), stride_(image.bytesPerLine())
{
}

// One detach for the whole render instead of one per pixel.
QRgb& WaveformRenderer::PixelAt(int32_t column, int32_t row)
{
    return reinterpret_cast<QRgb*>(pixels_ + ptrdiff_t(row) * stride_)[column];
}

void WaveformRenderer::RenderColumns(float left, int32_t count)
{
    if (rows_ <= 0 || pixels_ == nullptr)
        return;
    const float fpc = scene_.framesPerColumn;
    for (int32_t k = 0; k < count; ++k) {
        const float x = left + float(k);
        const int32_t column = int32_t(x);
        if (column < 0 || column >= image_.width())
            continue;
        const int64_t f0 = TruncateToFrame(fpc * x) + scene_.firstFrame;
        const int64_t f1 = TruncateToFrame(x * fpc + fpc) + scene_.firstFrame - 1;
        const ColumnState state = StateOf(f0, f1);
        if (IsOutsideData(f0, f1))
            FillColumn(column, state);
        else
            RenderDataColumn(column, f0, f1, state);
    }
}

// A column holding the range's end but reaching past it is deliberately not
// in the range unless it also holds the start.
WaveformRenderer::ColumnState WaveformRenderer::StateOf(int64_t f0, int64_t f1) const
{
    const int64_t start = scene_.rangeStart;
    const int64_t end = scene_.rangeEnd;
    ColumnState state;
    state.inRange = scene_.selected && ((f0 <= start && (start <= f1 || end <= f1)) || (start <= f0 && f1 <= end));
    state.cursor = f0 <= scene_.cursorFrame && scene_.cursorFrame <= f1;
    state.playmark = f0 <= scene_.playmarkFrame && scene_.playmarkFrame <= f1;
    return state;
}

bool WaveformRenderer::IsOutsideData(int64_t f0, int64_t f1) const
{
    const int64_t first = scene_.channelFirstFrame;
    const int64_t count = scene_.channelFrameCount;
    return f0 - first < 0 || f0 - first >= count || f1 - first >= count || f1 < f0 || scene_.spans.empty();
}

void WaveformRenderer::FillColumn(int32_t column, ColumnState state)
{
    QRgb colour = kEmptyPlain;
    if (state.cursor && state.playmark)
        colour = kEmptyCursorAndPlaymark;
    else if (state.playmark)
        colour = kEmptyPlaymark;
    else if (state.cursor)
        colour = kEmptyCursor;
    else if (state.inRange)
        colour = kEmptyInRange;
    for (int32_t row = 0; row < rows_; ++row)
        PixelAt(column, row) = colour;
}

// The lower half is accumulated from the bottom row up, the upper half from
// the top row down, so each row's count is the number of samples at or
// beyond it as seen from the nearer edge.
void WaveformRenderer::RenderDataColumn(int32_t column, int64_t f0, int64_t f1, ColumnState state)
{
    CountSamples(f0, f1);
    const int64_t total = f1 - f0 + 1;
    const int32_t half = rows_ / 2;
    int64_t count = 0;
    for (int32_t row = rows_ - 1; row >= half; --row) {
        count += histogram_[size_t(row)];
        ShadeRow(column, row, count, total, state, true);
    }
    count = 0;
    for (int32_t row = 0; row < half; ++row) {
        count += histogram_[size_t(row)];
        ShadeRow(column, row, count, total, state, false);
    }
    std::fill(histogram_.begin(), histogram_.end(), uint16_t(0));
}

// Four interleaved partial counts keep consecutive samples of the same row
// from waiting on each other; their 16-bit sum is exactly what one wrapping
// 16-bit counter per row would hold.
void WaveformRenderer::CountSamples(int64_t f0, int64_t f1)
{
    const size_t rowSlots = histogram_.size();
    const size_t lastSlot = rowSlots - 1;
    partials_.assign(4 * rowSlots, 0);
    uint32_t* partial = partials_.data();
    const auto slotOf = [&](int16_t value) {
        return std::min(size_t(rowTable_[(int32_t(value) + 32768) >> 3]), lastSlot);
    };
    // The column's samples may lie in several blocks; which partial counts
    // a sample does not matter to the sum.
    int64_t index = f0 - scene_.channelFirstFrame;
    int64_t remaining = f1 - f0 + 1;
    for (const SampleSpan& span : scene_.spans) {
        if (remaining <= 0)
            break;
        if (index >= span.count) {
            index -= span.count;
            continue;
        }
        const int16_t* sample = span.samples + index;
        const int64_t count = std::min(span.count - index, remaining);
        index = 0;
        remaining -= count;
        int64_t i = 0;
        for (; i + 4 <= count; i += 4) {
            ++partial[slotOf(sample[i])];
            ++partial[rowSlots + slotOf(sample[i + 1])];
            ++partial[2 * rowSlots + slotOf(sample[i + 2])];
            ++partial[3 * rowSlots + slotOf(sample[i + 3])];
        }
        for (; i < count; ++i)
            ++partial[slotOf(sample[i])];
    }
    for (size_t row = 0; row < rowSlots; ++row)
        histogram_[row] = uint16_t(partial[row] + partial[rowSlots + row] + partial[2 * rowSlots + row] + partial[3 * rowSlots + row]);
}

void WaveformRenderer::ShadeRow(int32_t column, int32_t row, int64_t count, int64_t total, ColumnState state,
                                bool lowerPass)
{
    uint8_t red;
    uint8_t green;
    uint8_t blue;
    if (state.cursor && state.playmark) {
        red = Fade(45, count, total);
        green = Fade(245, count, total);
        blue = Fade(255, count, total);
    } else if (state.playmark) {
        red = Fade(45, count, total);
        green = lowerPass ? Fade(245, count, total) : Fade(255, count, total);
        blue = Fade(45, count, total);
    } else if (state.cursor) {
        red = Fade(45, count, total);
        green = Fade(45, count, total);
        blue = Fade(255, count, total);
    } else if (state.inRange) {
        red = green = blue = Rise(255, count, total);
    } else {
        red = green = blue = Fade(245, count, total);
    }
    PixelAt(column, row) = qRgb(red, green, blue);
}

}  // namespace glimmet
