#include "app/TextSmear.h"

#include <QFontMetricsF>
#include <QPainter>
#include <QTransform>

#include <algorithm>
#include <cmath>
#include <numbers>

namespace glimmet {

QFont TextSmear::MaskFont(const QFont& font)
{
    QFont maskFont = font;
    maskFont.setStyleStrategy(QFont::StyleStrategy(QFont::PreferAntialias | QFont::NoSubpixelAntialias));
    return maskFont;
}

void TextSmear::SetText(const QString& text, const QFont& font, double baselineY, int height)
{
    const QFont maskFont = MaskFont(font);
    width_ = QFontMetricsF(maskFont).horizontalAdvance(text);
    maskWidth_ = int(std::ceil(width_)) + 2 * kMaskPad;
    maskHeight_ = std::max(height, 0);

    QImage image(std::max(maskWidth_, 1), std::max(maskHeight_, 1), QImage::Format_ARGB32_Premultiplied);
    image.fill(Qt::transparent);
    {
        QPainter painter(&image);
        painter.setFont(maskFont);
        painter.setPen(Qt::white);
        // Lean back around the baseline: a point h pixels above it moves h *
        // tan(20 degrees) to the left.
        const double lean = std::tan(kLeanDegrees * std::numbers::pi / 180.0);
        painter.setTransform(QTransform(1, 0, lean, 1, -lean * baselineY, 0));
        painter.drawText(QPointF(kMaskPad, baselineY), text);
    }
    mask_.assign(size_t(maskWidth_) * size_t(maskHeight_), 0);
    for (int y = 0; y < maskHeight_; ++y) {
        const QRgb* line = reinterpret_cast<const QRgb*>(image.constScanLine(y));
        for (int x = 0; x < maskWidth_; ++x)
            mask_[size_t(y) * size_t(maskWidth_) + size_t(x)] = uint8_t(qAlpha(line[x]));
    }
}

int TextSmear::FirstLeft(double centerX, int smear) const
{
    return int(std::floor(centerX - smear * 0.5 - width_ * 0.5 + 0.5));
}

void TextSmear::Draw(QImage& target, double centerX, int smear, int grey) const
{
    // Mask column c lands in target column base + c for the first copy and
    // one column further right for each copy after it.
    const int base = FirstLeft(centerX, smear) - kMaskPad;
    const int rows = std::min(target.height(), maskHeight_);
    for (int y = 0; y < target.height(); ++y) {
        QRgb* row = reinterpret_cast<QRgb*>(target.scanLine(y));
        if (y < rows)
            DrawRow(row, target.width(), y, base, smear, grey);
        else
            std::fill(row, row + target.width(), qRgb(0, 0, 0));
    }
}

// All copies over one pixel together cover a run of smear + 1 mask columns,
// so a running sum gives each pixel's total coverage in one step.
void TextSmear::DrawRow(QRgb* row, int targetWidth, int maskRow, int base, int smear, int grey) const
{
    const uint8_t* coverage = mask_.data() + size_t(maskRow) * size_t(maskWidth_);
    prefix_.assign(size_t(maskWidth_) + 1, 0);
    for (int c = 0; c < maskWidth_; ++c)
        prefix_[size_t(c) + 1] = prefix_[size_t(c)] + coverage[c];
    const auto prefixAt = [this](int index) { return prefix_[size_t(std::clamp(index, 0, maskWidth_))]; };
    for (int x = 0; x < targetWidth; ++x) {
        const int last = x - base;  // the mask column under x of the first copy
        const int32_t sum = prefixAt(last + 1) - prefixAt(last - smear);
        const int value = std::min(255, (grey * sum + 127) / 255);
        row[x] = qRgb(value, value, value);
    }
}

}  // namespace glimmet
