#pragma once

#include <cmath>
#include <cstdint>
#include <vector>

#include <QImage>

namespace glimmet::test {

/// Everything a rendered sample view depends on.
struct WaveformCase {
    std::vector<int16_t> samples;
    int64_t channelFirst = 0;
    int64_t first = 0;
    int64_t last = 0;
    int64_t rangeStart = -1;
    int64_t rangeEnd = -1;
    int64_t cursor = 0;
    int64_t playmark = -1;
    bool selected = false;
    int width = 0;
    int height = 0;
};

/// The picture a sample view must show, computed here from the rules
/// directly: each row's shade counts the samples lying at or beyond it from
/// the nearer edge, by counting them, without the running sums of the view.
inline QImage ReferenceWaveform(const WaveformCase& c)
{
    QImage image(c.width, c.height, QImage::Format_RGB32);
    const int rows = c.height;
    const uint32_t divisor = 65535u / uint32_t(rows) + 1;
    const auto rowOf = [&](int16_t s) { return int((uint32_t(s + 32768) & ~7u) / divisor); };
    const float perColumn = float(c.last - c.first + 1) / float(c.width);
    const int64_t count = int64_t(c.samples.size());
    for (int x = 0; x < c.width; ++x) {
        const float fx = float(x);
        const int64_t f0 = int64_t(std::trunc(perColumn * fx)) + c.first;
        const int64_t f1 = int64_t(std::trunc(fx * perColumn + perColumn)) + c.first - 1;
        const bool cursor = f0 <= c.cursor && c.cursor <= f1;
        const bool mark = f0 <= c.playmark && c.playmark <= f1;
        const bool holdsStart = f0 <= c.rangeStart && c.rangeStart <= f1;
        const bool holdsEndOnly = f0 <= c.rangeStart && c.rangeEnd <= f1;
        const bool inside = c.rangeStart <= f0 && f1 <= c.rangeEnd;
        const bool range = c.selected && (holdsStart || holdsEndOnly || inside);
        const int64_t a = f0 - c.channelFirst;
        const int64_t b = f1 - c.channelFirst;
        if (a < 0 || a >= count || b >= count || b < a) {
            QRgb flat = qRgb(80, 80, 80);
            if (cursor && mark)
                flat = qRgb(50, 220, 220);
            else if (mark)
                flat = qRgb(0, 220, 50);
            else if (cursor)
                flat = qRgb(0, 0, 220);
            else if (range)
                flat = qRgb(50, 50, 50);
            for (int y = 0; y < rows; ++y)
                image.setPixel(x, y, flat);
            continue;
        }
        const int64_t n = b - a + 1;
        // Samples per row, kept in 16 bits as the view keeps them.
        std::vector<int64_t> perRow(size_t(rows), 0);
        for (int64_t i = a; i <= b; ++i)
            ++perRow[size_t(rowOf(c.samples[size_t(i)]))];
        for (auto& inRow : perRow)
            inRow %= 65536;
        for (int y = 0; y < rows; ++y) {
            const bool lower = y >= rows / 2;
            int64_t beyond = 0;
            for (int r = 0; r < rows; ++r) {
                if (lower ? (r >= y) : (r <= y))
                    beyond += perRow[size_t(r)];
            }
            const auto fade = [&](int k) { return (k - int((int64_t(k) * beyond) / n)) & 0xff; };
            int red;
            int green;
            int blue;
            if (cursor && mark) {
                red = fade(45);
                green = fade(245);
                blue = fade(255);
            } else if (mark) {
                red = fade(45);
                green = lower ? fade(245) : fade(255);
                blue = fade(45);
            } else if (cursor) {
                red = fade(45);
                green = fade(45);
                blue = fade(255);
            } else if (range) {
                red = green = blue = int((255 * beyond) / n);
            } else {
                red = green = blue = fade(245);
            }
            image.setPixel(x, y, qRgb(red, green, blue));
        }
    }
    return image;
}

/// The first pixel where two images differ, as text, or "" when equal.
inline std::string FirstDifference(const QImage& actual, const QImage& expected)
{
    if (actual.size() != expected.size())
        return "size " + std::to_string(actual.width()) + "x" + std::to_string(actual.height()) + " vs " +
               std::to_string(expected.width()) + "x" + std::to_string(expected.height());
    for (int y = 0; y < actual.height(); ++y) {
        for (int x = 0; x < actual.width(); ++x) {
            const QRgb a = actual.pixel(x, y) & 0xffffff;
            const QRgb e = expected.pixel(x, y) & 0xffffff;
            if (a != e) {
                char text[128];
                std::snprintf(text, sizeof text, "pixel (%d, %d): %06x, expected %06x", x, y, a, e);
                return text;
            }
        }
    }
    return "";
}

}  // namespace glimmet::test
