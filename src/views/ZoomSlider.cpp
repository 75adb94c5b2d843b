#include "views/ZoomSlider.h"

#include <algorithm>
#include <cinttypes>

#include <QMouseEvent>
#include <QPainter>
#include <QTimer>

#include "support/Diagnostics.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"
#include "support/SystemTime.h"
#include "views/FrameMapping.h"
#include "views/PixelCanvas.h"

namespace glimmet {

namespace {

constexpr QRgb kGroove = qRgb(194, 194, 194);
constexpr QRgb kShadow = qRgb(108, 108, 108);
constexpr QRgb kSunken = qRgb(152, 152, 152);
constexpr QRgb kLight = qRgb(255, 255, 255);
constexpr QRgb kBar = qRgb(232, 232, 232);

constexpr int kFixedHeight = 15;
constexpr int kMinimumWidth = 10;
constexpr int kMaximumWidth = 2000;
constexpr int kFirstTickDelayMs = 400;
constexpr int kTickIntervalMs = 10;

}  // namespace

ZoomSlider::ZoomSlider(MessageTarget* target, int64_t low, int64_t high, int64_t minRange, QWidget* parent)
    : MessageView(parent), low_(low), high_(high), minRange_(minRange), target_(target), repeatTimer_(new QTimer(this))
{
    setObjectName("zoom slider");
    setAttribute(Qt::WA_OpaquePaintEvent);
    setSizePolicy(QSizePolicy::Expanding, QSizePolicy::Fixed);
    resize(11, 11);
    connect(repeatTimer_, &QTimer::timeout, this, [this] {
        PostMessage(repeatTimer_->isSingleShot() ? kMsgFirstTick : kMsgTick);
    });
    FrameResized(Bounds().Width(), Bounds().Height());
}

ZoomSlider::~ZoomSlider() = default;

void ZoomSlider::SetLowValue(int64_t value, bool notify)
{
    if (value < 0 || high_ - value < minRange_) {
        Diagnostics::Print("ZoomSlider::SetLowValue() - Error: f=%" PRId64 ", l=%" PRId64 ", r=%" PRId64 "\n",
            value, high_, minRange_);
        return;
    }
    low_ = value;
    update();
    if (notify)
        SendMessage();
}

void ZoomSlider::SetHighValue(int64_t value, bool notify)
{
    if (value < low_ + minRange_) {
        Diagnostics::Print("ZoomSlider::SetHighValue() - Error: f=%" PRId64 ", l=%" PRId64 ", r=%" PRId64 "\n",
            low_, value, minRange_);
        return;
    }
    high_ = value;
    update();
    if (notify)
        SendMessage();
}

void ZoomSlider::SetMinRange(int64_t range)
{
    if (range > high_ - low_) {
        Diagnostics::Print("ZoomSlider::SetMinRange() - Error: f=%" PRId64 ", l=%" PRId64 ", r=%" PRId64 "\n",
            low_, high_, range);
        return;
    }
    minRange_ = range;
}

void ZoomSlider::SetLeft(float left, bool notify)
{
    if (left == left_)
        return;
    left_ = left;
    resends_ = 0;
    update();
    if (notify)
        SendMessage();
}

void ZoomSlider::SetRight(float right, bool notify)
{
    if (right == right_)
        return;
    right_ = right;
    resends_ = 0;
    update();
    if (notify)
        SendMessage();
}

void ZoomSlider::SetBoth(float left, float right)
{
    if (left == left_ && right == right_)
        return;
    left_ = left;
    right_ = right;
    resends_ = 0;
    update();
    SendMessage();
}

void ZoomSlider::SetPostMessage(bool armed)
{
    armed_ = armed;
}

void ZoomSlider::SendMessage()
{
    if (!armed_ || target_ == nullptr)
        return;
    Message message(kMsgSetDisplayRange);
    message.AddInt64(kFieldWhen, system_time());
    message.AddPointer(kFieldSource, this);
    message.AddInt64(kFieldFirstFrame, FirstFrame());
    message.AddInt64(kFieldLastFrame, LastFrame());
    target_->PostMessage(message);
    armed_ = false;
}

// One answer that differs settles a rounding; more mean the window cannot
// take the frames at all.
const int32_t ZoomSlider::kMaxResends = 2;

// Travel is what the handles can move over once the minimum range is set
// aside, so that equal handles select exactly the minimum range.
int64_t ZoomSlider::FirstFrame() const
{
    const int64_t travel = high_ - low_ - minRange_ + 1;
    return low_ + TruncateToFrame(float(travel) * left_);
}

int64_t ZoomSlider::LastFrame() const
{
    const int64_t travel = high_ - low_ - minRange_ + 1;
    return low_ + minRange_ + TruncateToFrame(float(travel) * right_) - 1;
}

bool ZoomSlider::IsAutoRepeating() const
{
    return repeating_;
}

float ZoomSlider::Track() const
{
    return Bounds().Width() - 30 - 4 - 8;
}

float ZoomSlider::LeftEdge() const
{
    return Track() * left_ + 17;
}

float ZoomSlider::RightEdge() const
{
    return Track() * right_ + 17 + 8;
}

ViewRect ZoomSlider::Layout(const ViewRect& frame)
{
    inLayout_ = true;
    PlaceAt(frame);
    inLayout_ = false;
    FrameResized(Bounds().Width(), Bounds().Height());
    return frame;
}

void ZoomSlider::FrameResized(float width, float height)
{
    const int columns = PixelCanvas::RoundToPixel(width) + 1;
    const int rows = PixelCanvas::RoundToPixel(height) + 1;
    if (columns > 0 && rows > 0)
        bitmap_ = QImage(columns, rows, QImage::Format_RGB32);
    else
        bitmap_ = QImage();
    update();
}

void ZoomSlider::resizeEvent(QResizeEvent* event)
{
    MessageView::resizeEvent(event);
    if (!inLayout_ && bitmap_.size() != size())
        FrameResized(Bounds().Width(), Bounds().Height());
}

QSize ZoomSlider::minimumSizeHint() const
{
    return {kMinimumWidth, kFixedHeight};
}

QSize ZoomSlider::sizeHint() const
{
    return {kMaximumWidth / 10, kFixedHeight};
}

void ZoomSlider::MessageReceived(const Message& message)
{
    switch (message.what) {
    case kMsgFirstTick:
        if (repeating_) {
            repeatTimer_->setSingleShot(false);
            repeatTimer_->start(kTickIntervalMs);
        }
        break;
    case kMsgTick:
        Tick();
        break;
    case kMsgDisplayRangeChanged: {
        armed_ = true;
        int64_t low = 0;
        int64_t high = 0;
        if (!enabled_ || message.FindInt64(kFieldLowValue, &low) != B_OK || message.FindInt64(kFieldHighValue, &high) != B_OK)
            break;
        // The display follows the slider: tell the window again when the
        // frames it applied are not the ones the handles stand for.
        if ((FirstFrame() != low || LastFrame() != high) && resends_ < kMaxResends) {
            resends_++;
            SendMessage();
        }
        break;
    }
    default:
        break;
    }
}

// Half the bar's width, or, for a bar of no width, half the minimum range
// as a fraction of the values.
float ZoomSlider::PageStep() const
{
    const float step = (right_ - left_) / 2;
    if (step != 0)
        return step;
    if (high_ == low_)
        return 0;
    return float(minRange_) / float(2 * (high_ - low_));
}

bool ZoomSlider::PageLeft()
{
    const float step = std::min(PageStep(), left_);
    if (!(step > 0 && step < 1 && left_ > 0))
        return false;
    left_ -= step;
    right_ -= step;
    return true;
}

bool ZoomSlider::PageRight()
{
    const float step = std::min(PageStep(), 1 - right_);
    if (!(step > 0 && step < 1 && right_ < 1))
        return false;
    left_ += step;
    right_ += step;
    return true;
}

void ZoomSlider::MouseDown(QPointF point)
{
    if (!enabled_)
        return;
    armed_ = true;
    if (!Bounds().InsetBy(2, 2).Contains(point.x(), point.y())) {
        update();
        return;
    }
    pointer_ = point;
    const float x = point.x();
    const float left = LeftEdge();
    const float right = RightEdge();
    if (x < left - 15) {
        // A page cut short at the start is the last one: no repeat.
        const bool cutShort = left_ < PageStep();
        if (PageLeft()) {
            SendMessage();
            if (!cutShort)
                StartAutoRepeat();
        }
    } else if (x <= left) {
        dragMode_ = kDragLeft;
        grabOffset_ = x - left;
    } else if (x < right) {
        dragMode_ = kDragBar;
        grabOffset_ = (x - left) - 7.5f;
    } else if (x <= right + 15) {
        dragMode_ = kDragRight;
        grabOffset_ = right - x;
    } else {
        const bool cutShort = PageStep() > 1 - right_;
        if (PageRight()) {
            SendMessage();
            if (!cutShort)
                StartAutoRepeat();
        }
    }
    update();
}

void ZoomSlider::MouseMoved(QPointF point)
{
    pointer_ = point;
    const float track = Track();
    if (!enabled_ || track <= 0)
        return;
    const float x = point.x();
    switch (dragMode_) {
    case kDragLeft:
        SetLeft(std::clamp((x - grabOffset_ - 2 - 15) / track, 0.0f, right_), true);
        break;
    case kDragRight:
        SetRight(std::clamp((x + grabOffset_ - 2 - 15 - 8) / track, left_, 1.0f), true);
        break;
    case kDragBar: {
        float left = std::max((x - grabOffset_ - 2 - 15 - 8) / track, 0.0f);
        float right = right_ - (left_ - left);
        if (right > 1) {
            left -= right - 1;
            right = 1;
        }
        SetBoth(left, right);
        break;
    }
    default:
        break;
    }
}

void ZoomSlider::MouseUp()
{
    dragMode_ = kDragNone;
    StopAutoRepeat();
    update();
}

void ZoomSlider::StartAutoRepeat()
{
    repeating_ = true;
    repeatTimer_->setSingleShot(true);
    repeatTimer_->start(kFirstTickDelayMs);
}

void ZoomSlider::StopAutoRepeat()
{
    repeating_ = false;
    repeatTimer_->stop();
}

// One repeat of a held paging click, towards the side the pointer is on.
void ZoomSlider::Tick()
{
    // A tick still queued when the button came up pages no more.
    if (!repeating_)
        return;
    const float x = pointer_.x();
    bool paged = false;
    if (x < LeftEdge() - 15)
        paged = PageLeft();
    else if (x > RightEdge() + 15)
        paged = PageRight();
    if (paged) {
        SendMessage();
        update();
    }
}

void ZoomSlider::mousePressEvent(QMouseEvent* event)
{
    MouseDown(event->position());
}

void ZoomSlider::mouseMoveEvent(QMouseEvent* event)
{
    MouseMoved(event->position());
}

void ZoomSlider::mouseReleaseEvent(QMouseEvent* event)
{
    pointer_ = event->position();
    MouseUp();
}

const QImage& ZoomSlider::Render()
{
    if (bitmap_.isNull())
        return bitmap_;
    PixelCanvas canvas(bitmap_);
    canvas.FillRect({0, 0, float(bitmap_.width() - 1), float(bitmap_.height() - 1)}, kGroove);
    DrawFrame();
    DrawHandles();
    return bitmap_;
}

// The sunken groove, the bar's outline and the bar itself.
void ZoomSlider::DrawFrame()
{
    PixelCanvas canvas(bitmap_);
    const float l = 0;
    const float t = 0;
    const float r = float(bitmap_.width() - 1);
    const float b = float(bitmap_.height() - 1);
    const float L = LeftEdge();
    const float R = RightEdge();
    canvas.StrokeLine(l, b, l, t, kGroove);
    canvas.StrokeLine(l + 1, t, r, t, kGroove);
    canvas.StrokeLine(r, t + 1, r, b, kLight);
    canvas.StrokeLine(r - 1, b, l + 1, b, kLight);
    canvas.StrokeLine(l + 1, b - 1, l + 1, t + 1, kShadow);
    canvas.StrokeLine(l + 2, t + 1, r - 1, t + 1, kShadow);
    canvas.StrokeLine(l + 2, b - 2, l + 2, t + 2, kSunken);
    canvas.StrokeLine(l + 3, t + 2, r - 2, t + 2, kSunken);
    canvas.StrokeLine(r - 1, t + 2, r - 1, b - 1, kSunken);
    canvas.StrokeLine(r - 2, b - 1, l + 2, b - 1, kSunken);
    canvas.StrokeLine(L - 16, b - 2, L - 16, t + 2, kSunken);
    canvas.StrokeLine(R + 16, t + 2, R + 16, b - 1, kShadow);
    canvas.StrokeLine(R + 15, b - 1, L - 15, b - 1, kShadow);
    canvas.StrokeLine(L - 15, b - 3, L - 15, t + 2, kLight);
    canvas.StrokeLine(L - 14, t + 2, R + 15, t + 2, kLight);
    canvas.StrokeLine(R + 15, t + 3, R + 15, b - 2, kGroove);
    canvas.StrokeLine(R + 14, b - 2, L - 15, b - 2, kGroove);
    canvas.FillRect({L - 14, t + 3, R + 14, b - 3}, kBar);
}

// A handle being dragged looks pressed: its light and dark edges swap.
void ZoomSlider::DrawHandles()
{
    PixelCanvas canvas(bitmap_);
    const float t = 0;
    const float b = float(bitmap_.height() - 1);
    const float L = LeftEdge();
    const float R = RightEdge();
    const bool leftPressed = dragMode_ == kDragLeft || dragMode_ == kDragBar;
    const bool rightPressed = dragMode_ == kDragRight || dragMode_ == kDragBar;
    const QRgb leftFirst = leftPressed ? kGroove : kLight;
    const QRgb leftLast = leftPressed ? kLight : kGroove;
    const QRgb rightFirst = rightPressed ? kGroove : kLight;
    const QRgb rightLast = rightPressed ? kLight : kGroove;
    canvas.StrokeLine(L - 14, b - 4, L - 14, t + 3, leftFirst);
    canvas.StrokeLine(L - 13, t + 3, L - 1, t + 3, leftFirst);
    canvas.StrokeLine(L - 1, t + 4, L - 1, b - 3, leftLast);
    canvas.StrokeLine(L - 2, b - 3, L - 14, b - 3, leftLast);
    canvas.StrokeLine(R + 1, b - 4, R + 1, t + 3, rightFirst);
    canvas.StrokeLine(R + 2, t + 3, R + 14, t + 3, rightFirst);
    canvas.StrokeLine(R + 14, t + 4, R + 14, b - 3, rightLast);
    canvas.StrokeLine(R + 13, b - 3, R + 1, b - 3, rightLast);
}

void ZoomSlider::paintEvent(QPaintEvent*)
{
    Render();
    if (bitmap_.isNull())
        return;
    QPainter painter(this);
    painter.drawImage(QPoint(0, 0), bitmap_);
}

}  // namespace glimmet
