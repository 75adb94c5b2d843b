#pragma once

#include <QWidget>

#include <memory>

#include "app/AnimationRunner.h"

namespace glimmet {

class AboutView;

/// The About box: a 400 x 50 window without a frame, centred on its screen,
/// holding the AboutView's animation. It blocks the document windows while
/// it is up, closes at a click and deletes itself when closed, so whoever
/// opens it keeps no pointer to it.
class AboutWindow : public QWidget {
    Q_OBJECT

public:
    static constexpr int kWidth = 400;
    static constexpr int kHeight = 50;

    /// Shows itself; a runner given here drives the animation instead of
    /// the screen-paced one.
    explicit AboutWindow(std::unique_ptr<AnimationRunner> runner = nullptr);
    ~AboutWindow() override;

    AboutView* View() const { return view_; }

    /// The top left corner that centres the box on a screen's frame.
    static QPoint CentredOn(const QRect& screen);

private:
    AboutView* view_ = nullptr;
};

}  // namespace glimmet
