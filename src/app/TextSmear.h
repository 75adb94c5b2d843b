#pragma once

#include <QFont>
#include <QImage>
#include <QString>

#include <cstdint>
#include <vector>

namespace glimmet {

/// One line of the About box's text, smeared sideways: smear + 1 copies of
/// the line, one pixel apart, added on top of each other in one grey level,
/// so that the overlap builds a bright core that sharpens as the smear
/// narrows.
///
/// The line is rendered once, leaning back, as a coverage mask; each frame
/// sums shifted copies of the mask. Each copy adds grey * coverage / 255 to
/// a pixel, and the sum is rounded once and stops at white.
class TextSmear {
public:
    /// The lean of the letters: their stems lean back by 20 degrees from
    /// upright.
    static constexpr double kLeanDegrees = 20.0;
    /// Room on either side of the line in the mask for the leaning letters.
    static constexpr int kMaskPad = 32;

    /// Renders text in font with its baseline at baselineY in a mask of the
    /// given height. The font is used without subpixel antialiasing, so the
    /// coverage is one value per pixel.
    void SetText(const QString& text, const QFont& font, double baselineY, int height);

    /// The width of the line in its font, as it advances (lean not counted).
    double Width() const { return width_; }
    /// Coverage of the line, 0 to 255, pixel (x, y) at index y * MaskWidth()
    /// + x; the line's left end is at x = kMaskPad.
    const std::vector<uint8_t>& Mask() const { return mask_; }
    int MaskWidth() const { return maskWidth_; }
    int MaskHeight() const { return maskHeight_; }

    /// The pixel column of the first copy's left end for copies centred
    /// from centerX - smear / 2 to centerX + smear / 2.
    int FirstLeft(double centerX, int smear) const;

    /// Fills target (Format_RGB32) with the smeared line in grey on black.
    void Draw(QImage& target, double centerX, int smear, int grey) const;

    /// The font with the lean and the antialiasing the mask uses.
    static QFont MaskFont(const QFont& font);

private:
    void DrawRow(QRgb* row, int targetWidth, int maskRow, int base, int smear, int grey) const;

    double width_ = 0;
    std::vector<uint8_t> mask_;
    int maskWidth_ = 0;
    int maskHeight_ = 0;
    mutable std::vector<int32_t> prefix_;
};

}  // namespace glimmet
