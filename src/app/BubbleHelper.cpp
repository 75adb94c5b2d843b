#include "app/BubbleHelper.h"

#include <QWidget>
#include <QtGlobal>

#include <algorithm>
#include <atomic>

#include "app/BubbleWindow.h"
#include "app/DesktopPointerProbe.h"

namespace glimmet {

namespace {

std::atomic<int32_t> gRunCount{0};
BubbleHelper* gInstance = nullptr;

}  // namespace

BubbleHelper::BubbleHelper(std::unique_ptr<PointerProbe> probe, Polling polling)
    : probe_(probe ? std::move(probe) : std::make_unique<DesktopPointerProbe>())
{
    if (gRunCount.fetch_add(1) != 0)
        qFatal("%s", kSecondInstanceMessage);
    counted_ = true;
    gInstance = this;
    helpList_.reserve(30);
    enabled_ = true;
    if (polling == Polling::Timer) {
        timer_.setInterval(kPollMillis);
        connect(&timer_, &QTimer::timeout, this, &BubbleHelper::Poll);
        timer_.start();
    }
}

BubbleHelper::~BubbleHelper()
{
    timer_.stop();
    bubble_.reset();
    helpList_.clear();
    if (counted_) {
        gInstance = nullptr;
        gRunCount.fetch_sub(1);
    }
}

BubbleHelper* BubbleHelper::Instance()
{
    return gInstance;
}

// ---------------------------------------------------------------------------
// Help texts

void BubbleHelper::SetHelp(QWidget* view, const QString& text)
{
    if (view == nullptr)
        return;
    // Entries of widgets that are gone go too, so that a new widget at the
    // same address never inherits an old text.
    std::erase_if(helpList_, [view](const HelpEntry& entry) { return entry.first.isNull() || entry.first == view; });
    if (!text.isNull())
        helpList_.emplace_back(view, text);
}

void BubbleHelper::RegisterHelp(QWidget* view, const char* text)
{
    if (gInstance != nullptr)
        gInstance->SetHelp(view, QString::fromUtf8(text));
}

QString BubbleHelper::GetHelp(const QWidget* view) const
{
    for (const HelpEntry& entry : helpList_) {
        if (!entry.first.isNull() && entry.first.data() == view)
            return entry.second;
    }
    return QString();
}

QWidget* BubbleHelper::FindView(QPoint where) const
{
    QWidget* view = probe_->WidgetAt(where);
    if (view != nullptr && bubble_ && view->window() == bubble_.get())
        return nullptr;
    return view;
}

QString BubbleHelper::HelpAt(QPoint where) const
{
    for (QWidget* view = FindView(where); view != nullptr; view = view->parentWidget()) {
        const QString text = GetHelp(view);
        if (!text.isNull())
            return text;
        // A dialog's parent is another window; help stays within one.
        if (view->isWindow())
            break;
    }
    return QString();
}

// ---------------------------------------------------------------------------
// The bubble

BubbleWindow& BubbleHelper::EnsureBubble()
{
    if (!bubble_)
        bubble_ = std::make_unique<BubbleWindow>();
    return *bubble_;
}

QPoint BubbleHelper::BubblePosition(QPoint where, int textWidth, int textHeight, QRect screen)
{
    QPoint position = where + QPoint(0, kOffsetBelow);
    // Near the bottom edge the bubble goes above the pointer, clear of the
    // pointer's own picture.
    if (screen.bottom() - 3 < position.y() + textHeight)
        position.ry() -= textHeight + 16 + 8;
    const int overshoot = position.x() + textWidth + 2 * BubbleWindow::kInset - screen.right();
    if (overshoot > 0)
        position.rx() -= overshoot;
    return position;
}

void BubbleHelper::DisplayHelp(const QString& text, QPoint where)
{
    BubbleWindow& bubble = EnsureBubble();
    bubble.SetText(text);
    const int height = bubble.TextHeight() + 2 * BubbleWindow::kInset;
    const int width = bubble.MaxLineWidth();
    bubble.resize(width + 2 * BubbleWindow::kInset, height);
    ShowBubble(BubblePosition(where, width, height, probe_->MainScreen()));
}

void BubbleHelper::ShowBubble(QPoint where)
{
    BubbleWindow& bubble = EnsureBubble();
    bubble.move(where);
    // A tooltip window maps above every other window by itself.
    if (bubble.isHidden())
        bubble.show();
}

void BubbleHelper::HideBubble()
{
    BubbleWindow& bubble = EnsureBubble();
    bubble.move(-1000, -1000);
    if (!bubble.isHidden())
        bubble.hide();
}

bool BubbleHelper::IsBubbleShown() const
{
    return bubble_ && !bubble_->isHidden();
}

// ---------------------------------------------------------------------------
// Polling

void BubbleHelper::Poll()
{
    switch (phase_) {
    case Phase::AwaitingRest:
        PollForRest();
        break;
    case Phase::Showing:
        PollWhileShowing();
        break;
    case Phase::AwaitingMove:
        PollForMove();
        break;
    }
}

// Switching help off only stops new bubbles; one on screen runs its course.
void BubbleHelper::PollForRest()
{
    if (!enabled_)
        return;
    const QPoint position = probe_->Position();
    if (position != lastPosition_ || probe_->Buttons() != Qt::NoButton) {
        restPolls_ = 0;
        lastPosition_ = position;
        return;
    }
    if (restPolls_++ < kRestPolls - 1)
        return;
    restPolls_ = 0;
    const QString text = HelpAt(position);
    if (text.isNull())
        return;
    DisplayHelp(text, position);
    shownAt_ = position;
    displayPolls_ = 0;
    displayLimit_ = std::max(kMinDisplayPolls, int(text.size()));
    phase_ = Phase::Showing;
}

// The bubble stays for displayLimit_ polls and is gone at the one after.
void BubbleHelper::PollWhileShowing()
{
    const QPoint position = probe_->Position();
    const bool disturbed = position != shownAt_ || probe_->Buttons() != Qt::NoButton;
    if (!disturbed && ++displayPolls_ <= displayLimit_)
        return;
    HideBubble();
    EndDisplay(position);
}

void BubbleHelper::EndDisplay(QPoint position)
{
    if (position == shownAt_) {
        phase_ = Phase::AwaitingMove;
        return;
    }
    lastPosition_ = position;
    phase_ = Phase::AwaitingRest;
}

// Buttons do not count here: a click on a widget is no new rest.
void BubbleHelper::PollForMove()
{
    const QPoint position = probe_->Position();
    if (position != shownAt_)
        EndDisplay(position);
}

}  // namespace glimmet
