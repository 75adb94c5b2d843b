#include "app/AboutView.h"

#include <QApplication>
#include <QMouseEvent>
#include <QPaintEvent>
#include <QPainter>
#include <QPointer>

#include "app/PacedRunner.h"
#include "support/MessageCodes.h"

namespace glimmet {

namespace {

constexpr const char* kTitle = "G l i m m e t";

}  // namespace

AboutView::Line AboutView::LineAfter(int lineIndex)
{
    // Blanks are doubled between words, as the title's letters are spaced.
    switch (lineIndex) {
    case -1:
        return {"waveform editing  for  Linux", 11, 0};
    case 0:
        return {"by", 9, 1};
    case 1:
        return {"Glimmet  developers", 12, 2};
    case 2:
        return {"and", 9, 3};
    case 3:
        return {"all  contributors", 12, 4};
    case 4:
        return {"", 0, 5};  // a pause with nothing shown
    default:
        return {kTitle, kTitleSize, -1};
    }
}

AboutView::AboutView(QWidget* parent, std::unique_ptr<AnimationRunner> runner)
    : QWidget(parent), runner_(std::move(runner))
{
    setObjectName(QStringLiteral("about view"));
    // The off-screen frame covers every pixel; there is nothing to erase.
    setAttribute(Qt::WA_OpaquePaintEvent);
    resize(parent != nullptr ? parent->size() : QSize(400, 50));
    frame_ = QImage(size(), QImage::Format_RGB32);
    frame_.fill(Qt::black);

    font_ = QApplication::font();
    font_.setBold(true);
    SetLine(QString::fromLatin1(kTitle), kTitleSize);

    if (!runner_)
        runner_ = std::make_unique<PacedRunner>(PacedRunner::FramePeriodFor(screen()));
    runner_->SetTarget([this](uint32_t what) { MessageReceived(what); });
    runner_->Replace(kMsgAboutDraw, kFrameMicros);
}

AboutView::~AboutView() = default;

void AboutView::MessageReceived(uint32_t what)
{
    switch (what) {
    case kMsgAboutDraw:
        DrawFrame();
        break;
    case kMsgAboutNext:
        NextLine();
        break;
    case kMsgAboutWait:
        Hold();
        break;
    default:
        break;
    }
}

void AboutView::DrawFrame()
{
    smear_ += step_;
    if (smear_ == kWidestSmear) {
        // The line has dissolved; the next one is taken.
        step_ = -kSmearStep;
        runner_->Replace(kMsgAboutNext, kFrameMicros);
    }
    if (smear_ == 0) {
        // The line is sharp; it holds before it dissolves.
        step_ = kSmearStep;
        runner_->Replace(kMsgAboutWait, kHoldMicros);
    }
    const int grey = 255 - smear_;
    if (!frame_.isNull())
        smearedLine_.Draw(frame_, CenterX(), smear_, grey);
    update();
}

void AboutView::NextLine()
{
    const Line line = LineAfter(lineIndex_);
    SetLine(QString::fromLatin1(line.text), line.fontSize);
    lineIndex_ = line.nextIndex;
    runner_->Replace(kMsgAboutDraw, kFrameMicros);
}

// The hold is over: frames again, and since the step now widens the smear,
// the line dissolves.
void AboutView::Hold()
{
    runner_->Replace(kMsgAboutDraw, kFrameMicros);
}

void AboutView::SetLine(const QString& text, int fontSize)
{
    text_ = text;
    if (fontSize > 0)
        font_.setPixelSize(fontSize);
    smearedLine_.SetText(text_, font_, BaselineY(), height());
}

void AboutView::paintEvent(QPaintEvent* event)
{
    QPainter painter(this);
    painter.drawImage(event->rect(), frame_, event->rect());
}

void AboutView::mousePressEvent(QMouseEvent* event)
{
    event->accept();
    // Closing from inside the view's own event would delete it under its
    // feet; the window closes as soon as control is back in the event loop.
    QPointer<QWidget> window = this->window();
    QMetaObject::invokeMethod(
        window,
        [window] {
            if (window)
                window->close();
        },
        Qt::QueuedConnection);
}

}  // namespace glimmet
