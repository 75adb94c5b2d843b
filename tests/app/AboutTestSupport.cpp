#include "AboutTestSupport.h"

#include <QApplication>
#include <QFontMetricsF>
#include <QPainter>
#include <QTransform>

#include <algorithm>
#include <cmath>
#include <numbers>
#include <vector>

namespace glimmet::test {

namespace {

constexpr int kPad = 40;

QFont LineFont(int pixelSize)
{
    QFont font = QApplication::font();
    font.setBold(true);
    font.setPixelSize(pixelSize);
    font.setStyleStrategy(QFont::StyleStrategy(QFont::PreferAntialias | QFont::NoSubpixelAntialias));
    return font;
}

/// The line's coverage, its left end at column kPad.
QImage Glyphs(const QString& text, const QFont& font, double width, double baseline, int height)
{
    QImage glyphs(int(std::ceil(width)) + 2 * kPad, height, QImage::Format_ARGB32_Premultiplied);
    glyphs.fill(Qt::transparent);
    QPainter painter(&glyphs);
    painter.setFont(font);
    painter.setPen(Qt::white);
    QTransform lean;
    lean.translate(0, baseline);
    lean.shear(std::tan(20.0 * std::numbers::pi / 180.0), 0);
    lean.translate(0, -baseline);
    painter.setTransform(lean);
    painter.drawText(QPointF(kPad, baseline), text);
    return glyphs;
}

}  // namespace

QImage ReferenceAboutFrame(const QString& text, int pixelSize, int smear, QSize size)
{
    const QFont font = LineFont(pixelSize);
    const double width = QFontMetricsF(font).horizontalAdvance(text);
    const double centerX = (size.width() - 1) * 0.5;
    const double baseline = (size.height() - 1) * 0.5;
    const QImage glyphs = Glyphs(text, font, width, baseline, size.height());
    const int grey = 255 - smear;

    std::vector<double> light(size_t(size.width()) * size_t(size.height()), 0.0);
    const double x0 = centerX - smear * 0.5;
    const double x1 = centerX + smear * 0.5;
    const double step = smear > 0 ? (x1 - x0) / smear : 1.0;
    for (int copy = 0; copy <= smear; ++copy) {
        const double x = x0 + copy * step;
        const int left = int(std::floor(x - width * 0.5 + 0.5));
        for (int y = 0; y < size.height(); ++y) {
            for (int gx = 0; gx < glyphs.width(); ++gx) {
                const int tx = left - kPad + gx;
                if (tx < 0 || tx >= size.width())
                    continue;
                light[size_t(y) * size_t(size.width()) + size_t(tx)] += grey * qAlpha(glyphs.pixel(gx, y)) / 255.0;
            }
        }
    }
    QImage frame(size, QImage::Format_RGB32);
    for (int y = 0; y < size.height(); ++y) {
        for (int x = 0; x < size.width(); ++x) {
            const int value = std::min(255, int(std::lround(light[size_t(y) * size_t(size.width()) + size_t(x)])));
            frame.setPixel(x, y, qRgb(value, value, value));
        }
    }
    return frame;
}

int DifferingPixels(const QImage& a, const QImage& b, QString* where)
{
    if (a.size() != b.size())
        return std::max(a.width() * a.height(), b.width() * b.height());
    int count = 0;
    for (int y = 0; y < a.height(); ++y) {
        for (int x = 0; x < a.width(); ++x) {
            const QRgb pa = a.pixel(x, y);
            const QRgb pb = b.pixel(x, y);
            if (qRed(pa) == qRed(pb) && qGreen(pa) == qGreen(pb) && qBlue(pa) == qBlue(pb))
                continue;
            if (count++ == 0 && where != nullptr)
                *where = QStringLiteral("(%1, %2): %3 against %4").arg(x).arg(y).arg(qRed(pa)).arg(qRed(pb));
        }
    }
    return count;
}

}  // namespace glimmet::test
