#include "views/WaveformRenderer.h"

#include <algorithm>

#include "views/ColumnQuotients.h"
#include "views/FrameMapping.h"

namespace glimmet {

namespace {

constexpr QRgb kEmptyCursorAndPlaymark = qRgb(50, 220, 220);
constexpr QRgb kEmptyPlaymark = qRgb(0, 220, 50);
constexpr QRgb kEmptyCursor = qRgb(0, 0, 220);
constexpr QRgb kEmptyInRange = qRgb(50, 50, 50);
constexpr QRgb kEmptyPlain = qRgb(80, 80, 80);

}  // namespace

WaveformRenderer::WaveformRenderer(QImage& image, const int16_t* rowTable, int32_t rows, const WaveformScene& scene)
    : image_(image), rowTable_(rowTable), rows_(std::min(rows, image.height())), scene_(scene),
      histogram_(size_t(std::max(rows, image.height()) + 1), 0), counter_(rowTable, uint32_t(histogram_.size())),
      pixels_(image.isNull() ? nullptr : image.bits()), stride_(image.bytesPerLine())
{
    int64_t start = 0;
    spanStarts_.reserve(scene_.spans.size());
    for (const SampleSpan& span : scene_.spans) {
        spanStarts_.push_back(start);
        start += std::max<int64_t>(span.count, 0);
    }
    dataCount_ = std::min(start, scene_.channelFrameCount);
}

int32_t WaveformRenderer::RenderColumns(float left, int32_t count, std::vector<RenderedColumn>* memo)
{
    if (rows_ <= 0 || pixels_ == nullptr)
        return 0;
    if (memo != nullptr && memo->size() != size_t(image_.width()))
        memo->assign(size_t(image_.width()), RenderedColumn{});
    int32_t rendered = 0;
    const float fpc = scene_.framesPerColumn;
    for (int32_t k = 0; k < count; ++k) {
        const float x = left + float(k);
        const int32_t column = int32_t(x);
        if (column < 0 || column >= image_.width())
            continue;
        const int64_t f0 = TruncateToFrame(fpc * x) + scene_.firstFrame;
        const int64_t f1 = TruncateToFrame(x * fpc + fpc) + scene_.firstFrame - 1;
        const ColumnState state = StateOf(f0, f1);
        if (Unchanged(memo, column, f0, f1, state))
            continue;
        if (IsOutsideData(f0, f1))
            FillColumn(column, state);
        else
            RenderDataColumn(column, f0, f1, state);
        ++rendered;
    }
    return rendered;
}

// A column's pixels follow from its frames and its state alone, as long as
// the data and the height stay the same; whoever owns the memo clears it
// when they do not.
bool WaveformRenderer::Unchanged(std::vector<RenderedColumn>* memo, int32_t column, int64_t f0, int64_t f1,
                                 ColumnState state) const
{
    if (memo == nullptr)
        return false;
    RenderedColumn& drawn = (*memo)[size_t(column)];
    if (drawn.state == state.Bits() && drawn.firstFrame == f0 && drawn.lastFrame == f1)
        return true;
    drawn = RenderedColumn{f0, f1, state.Bits()};
    return false;
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
    // Frames the spans do not hold are shown as outside the data, never read.
    return f0 - first < 0 || f0 - first >= count || f1 - first >= count || f1 < f0 || f1 - first >= dataCount_;
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
    // The next column most likely starts where this one ends and is as wide.
    PrefetchFrames(f1 + 1, f1 + (f1 - f0 + 1));
    const ColumnQuotients total(f1 - f0 + 1);
    if (state.cursor && state.playmark) {
        ShadeColumn(column, [&](int64_t count, bool) {
            return qRgb(total.Fade(45, count), total.Fade(245, count), total.Fade(255, count));
        });
    } else if (state.playmark) {
        ShadeColumn(column, [&](int64_t count, bool lowerPass) {
            return qRgb(total.Fade(45, count), lowerPass ? total.Fade(245, count) : total.Fade(255, count),
                        total.Fade(45, count));
        });
    } else if (state.cursor) {
        ShadeColumn(column, [&](int64_t count, bool) {
            return qRgb(total.Fade(45, count), total.Fade(45, count), total.Fade(255, count));
        });
    } else if (state.inRange) {
        ShadeColumn(column, [&](int64_t count, bool) {
            const uint8_t grey = total.Rise(255, count);
            return qRgb(grey, grey, grey);
        });
    } else {
        ShadeColumn(column, [&](int64_t count, bool) {
            const uint8_t grey = total.Fade(245, count);
            return qRgb(grey, grey, grey);
        });
    }
}

// Rows whose histogram entry is empty keep the count, and so the colour, of
// the row before them; quiet material leaves most rows empty.
template <typename Shade>
void WaveformRenderer::ShadeColumn(int32_t column, Shade&& shade)
{
    const int32_t half = rows_ / 2;
    for (int pass = 0; pass < 2; ++pass) {
        const bool lowerPass = pass == 0;
        int64_t count = 0;
        QRgb colour = shade(count, lowerPass);
        const int32_t first = lowerPass ? rows_ - 1 : 0;
        const int32_t end = lowerPass ? half - 1 : half;
        const int32_t step = lowerPass ? -1 : 1;
        for (int32_t row = first; row != end; row += step) {
            const uint32_t added = histogram_[size_t(row)];
            if (added != 0) {
                count += added;
                colour = shade(count, lowerPass);
            }
            PixelAt(column, row) = colour;
        }
    }
}

// The column's frames, span by span.
void WaveformRenderer::CountSamples(int64_t f0, int64_t f1)
{
    counter_.Clear();
    ForEachSpanPart(f0, f1, [this](const SampleSpan& span, int64_t from, int64_t to) { counter_.Add(span, from, to); });
    counter_.Finish(histogram_.data());
}

void WaveformRenderer::PrefetchFrames(int64_t f0, int64_t f1)
{
    if (IsOutsideData(f0, f1))
        return;
    ForEachSpanPart(
        f0, f1, [this](const SampleSpan& span, int64_t from, int64_t to) { counter_.Prefetch(span, from, to); });
}

// Calls f(span, from, to) for the part of every span that frames f0..f1
// cover, as offsets inside the span (to may lie past its end).
template <typename F>
void WaveformRenderer::ForEachSpanPart(int64_t f0, int64_t f1, F&& f) const
{
    const int64_t from = f0 - scene_.channelFirstFrame;
    const int64_t to = f1 - scene_.channelFirstFrame + 1;
    auto next = std::upper_bound(spanStarts_.begin(), spanStarts_.end(), from);
    size_t index = size_t(next - spanStarts_.begin()) - 1;
    for (; index < spanStarts_.size() && spanStarts_[index] < to; ++index) {
        const int64_t start = spanStarts_[index];
        f(scene_.spans[index], std::max(from, start) - start, to - start);
    }
}

}  // namespace glimmet
