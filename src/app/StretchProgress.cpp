#include "app/StretchProgress.h"

#include <QWidget>

#include <algorithm>
#include <cmath>

#include "app/ActionRunner.h"

namespace glimmet {

namespace {

const QString kNoteStart = QStringLiteral(" (stretching ");

// Often enough to look alive, rarely enough to cost nothing.
constexpr int kRefreshMilliseconds = 250;

}  // namespace

StretchProgress::StretchProgress(QWidget* window, const ActionRunner& actions) : window_(window), actions_(actions)
{
    timer_.setInterval(kRefreshMilliseconds);
    connect(&timer_, &QTimer::timeout, this, [this] { Refresh(); });
}

QString StretchProgress::PlainTitle(const QString& title)
{
    const qsizetype note = title.lastIndexOf(kNoteStart);
    if (note < 0 || !title.endsWith(QStringLiteral("%)")))
        return title;
    return title.left(note);
}

QString StretchProgress::TitleWithProgress(const QString& title, double share)
{
    const int percent = int(std::floor(std::clamp(share, 0.0, 1.0) * 100.0));
    return PlainTitle(title) + kNoteStart + QString::number(percent) + QStringLiteral("%)");
}

void StretchProgress::Follow()
{
    if (actions_.Stretching() == showing_)
        return;
    showing_ = actions_.Stretching();
    if (showing_)
        timer_.start();
    else
        timer_.stop();
    if (window_ == nullptr)
        return;
    if (showing_)
        window_->setCursor(Qt::BusyCursor);
    else
        window_->unsetCursor();
    Refresh();
}

void StretchProgress::Refresh()
{
    if (window_ == nullptr)
        return;
    // The title is read each time: a save meanwhile may have renamed the
    // document.
    const QString title = window_->windowTitle();
    window_->setWindowTitle(showing_ ? TitleWithProgress(title, actions_.StretchProgress()) : PlainTitle(title));
}

}  // namespace glimmet
