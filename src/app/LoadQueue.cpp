#include "app/LoadQueue.h"

#include <QLabel>
#include <QWidget>

#include <algorithm>
#include <atomic>
#include <cmath>

#include "files/BackgroundLoad.h"
#include "files/LoadTarget.h"
#include "support/Locker.h"

namespace glimmet {

namespace {

std::atomic<int32_t> gInFlight{0};

constexpr int kLineWidth = 320;
constexpr int kLineHeight = 24;

}  // namespace

LoadQueue::LoadQueue(LoadTarget& target, Locker& windowLock, QWidget* progressParent)
    : target_(target), windowLock_(windowLock)
{
    auto* line = new QLabel(progressParent);
    line->setObjectName(QStringLiteral("LoadProgress"));
    line->setAlignment(Qt::AlignCenter);
    line->setFrameStyle(QFrame::Panel | QFrame::Raised);
    line->setAutoFillBackground(true);
    QPalette palette = line->palette();
    // The bar fill of the zoom slider, so the line reads as a control.
    palette.setColor(QPalette::Window, QColor(232, 232, 232));
    palette.setColor(QPalette::WindowText, Qt::black);
    line->setPalette(palette);
    line->hide();
    line_ = line;
    timer_.setInterval(kPollMilliseconds);
    connect(&timer_, &QTimer::timeout, this, &LoadQueue::Poll);
}

LoadQueue::~LoadQueue()
{
    gInFlight.fetch_sub(int32_t(waiting_.size()) + (running_ != nullptr ? 1 : 0), std::memory_order_relaxed);
    waiting_.clear();
    // Destroying the load cancels it and waits for its worker.
    running_.reset();
    delete line_.data();
}

int32_t LoadQueue::CountInFlight()
{
    return gInFlight.load(std::memory_order_relaxed);
}

void LoadQueue::Open(const std::filesystem::path& file, bool append, bool hasDocument)
{
    gInFlight.fetch_add(1, std::memory_order_relaxed);
    waiting_.push_back(Waiting{file, append, hasDocument});
    if (running_ == nullptr)
        StartNext();
}

void LoadQueue::StartNext()
{
    if (waiting_.empty()) {
        timer_.stop();
        if (line_ != nullptr)
            line_->hide();
        return;
    }
    Waiting next = std::move(waiting_.front());
    waiting_.pop_front();
    // The worker asks for a look as soon as it is done, so a finished file
    // is handed over at once rather than at the next poll. Posted events
    // for this object are dropped if it goes first, and it outlives the
    // worker anyway.
    running_ = std::make_unique<BackgroundLoad>(std::move(next.file), next.append, next.hasDocument, [this] {
        QMetaObject::invokeMethod(this, &LoadQueue::Poll, Qt::QueuedConnection);
    });
    ShowProgress();
    timer_.start();
}

void LoadQueue::Poll()
{
    if (running_ == nullptr) {
        StartNext();
        return;
    }
    if (running_->IsDone())
        HandOver();
    else
        ShowProgress();
}

void LoadQueue::HandOver()
{
    std::unique_ptr<BackgroundLoad> done = std::move(running_);
    windowLock_.Lock();
    done->Finish(target_);
    windowLock_.Unlock();
    done.reset();
    gInFlight.fetch_sub(1, std::memory_order_relaxed);
    StartNext();
}

void LoadQueue::ShowProgress()
{
    if (line_ == nullptr || running_ == nullptr)
        return;
    const QString name = QString::fromStdString(running_->File().filename().string());
    const int percent = int(std::floor(running_->Progress().Fraction() * 100.0));
    line_->setText(tr("Loading %1: %2%").arg(name).arg(percent));
    const QWidget* parent = line_->parentWidget();
    const int width = std::min(kLineWidth, parent->width() - 8);
    line_->setGeometry((parent->width() - width) / 2, (parent->height() - kLineHeight) / 2, width, kLineHeight);
    line_->raise();
    line_->show();
}

}  // namespace glimmet
