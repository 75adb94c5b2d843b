#pragma once

#include <QFont>
#include <QImage>
#include <QString>
#include <QWidget>

#include <cstdint>
#include <memory>

#include "app/AnimationRunner.h"
#include "app/TextSmear.h"

namespace glimmet {

/// The About box's animation on black: each line condenses out of a wide,
/// dim smear into sharp white, holds for five seconds, dissolves the same
/// way, and the next line follows; the lines repeat until a click closes the
/// window.
///
/// Every frame is drawn into an off-screen image first and reaches the
/// screen in one copy, so nothing flickers. One runner drives it all: a
/// frame at a time while the smear changes, a single five-second wait while
/// a line holds.
class AboutView : public QWidget {
    Q_OBJECT

public:
    /// Smear width of a line that has fully dissolved, and the change per
    /// frame.
    static constexpr int kWidestSmear = 254;
    static constexpr int kSmearStep = 2;
    /// How long a sharp line holds.
    static constexpr int64_t kHoldMicros = 5000000;
    /// Asked of the runner for frames and line changes: as soon as it can.
    static constexpr int64_t kFrameMicros = 100;
    static constexpr int kTitleSize = 16;

    /// With no runner the view paces itself to its screen.
    explicit AboutView(QWidget* parent, std::unique_ptr<AnimationRunner> runner = nullptr);
    ~AboutView() override;

    /// The animation's codes (frame, next line, end of hold), as the runner
    /// delivers them.
    void MessageReceived(uint32_t what);

    int Smear() const { return smear_; }
    int Step() const { return step_; }
    QString Text() const { return text_; }
    /// Which line comes next, -1 to 5.
    int LineIndex() const { return lineIndex_; }
    /// The pixel size of the font the line is drawn in.
    int FontSize() const { return font_.pixelSize(); }
    QFont Font() const { return font_; }
    /// The frame drawn last.
    const QImage& Frame() const { return frame_; }
    /// Where every copy of the line is centred between, horizontally, and
    /// where their baseline is.
    double CenterX() const { return (width() - 1) * 0.5; }
    double BaselineY() const { return (height() - 1) * 0.5; }

    /// The line's text and font size for a line index, and the index after.
    struct Line {
        const char* text;
        int fontSize;  // 0 keeps the size
        int nextIndex;
    };
    static Line LineAfter(int lineIndex);

protected:
    void paintEvent(QPaintEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;

private:
    void DrawFrame();
    void NextLine();
    void Hold();
    void SetLine(const QString& text, int fontSize);

    QImage frame_;
    std::unique_ptr<AnimationRunner> runner_;
    int step_ = -kSmearStep;
    int smear_ = kWidestSmear;
    QString text_;
    int lineIndex_ = -1;
    QFont font_;
    TextSmear smearedLine_;
};

}  // namespace glimmet
