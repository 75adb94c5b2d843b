#include "views/ChannelContainerView.h"

#include <algorithm>

#include <QPaintEvent>
#include <QPainter>
#include <QWheelEvent>

#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/DocumentChange.h"
#include "sound/DocumentWindow.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"
#include "views/AncestorLayouts.h"
#include "views/ContainerFrames.h"
#include "views/SampleView.h"
#include "views/ViewColors.h"
#include "views/ViewStack.h"
#include "views/WheelNavigator.h"
#include "views/ZoomSlider.h"

namespace glimmet {

namespace {

const QColor kBackground = ViewBackgroundColor();

constexpr int kMinimumHeight = 30;
constexpr int kMaximumSize = 2000;
// Each sample view is framed by one pixel on every side.
constexpr int kFrameAllowance = 2;

}  // namespace

ChannelContainerView::ChannelContainerView(ChannelManager* manager, ZoomSlider* zoomSlider, DocumentWindow* window,
                                           QWidget* parent)
    : MessageView(parent), zoomSlider_(zoomSlider), manager_(manager), window_(window)
{
    setObjectName("sample view");
    setAttribute(Qt::WA_OpaquePaintEvent);
    setSizePolicy(QSizePolicy::Expanding, QSizePolicy::Expanding);
    display_.SetLast(MaxFrameCount() - 1);
    resize(11, 16);
    CheckZoomSlider(true);
    if (zoomSlider_ != nullptr)
        zoomSlider_->setParent(this);
    UpdateSizeLimits();
    if (manager_ != nullptr) {
        for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++)
            AddChannelAt(channel, i);
        manager_->Listeners().Subscribe(static_cast<Observer*>(this), DocumentChange::kAll);
    }
}

ChannelContainerView::~ChannelContainerView()
{
    if (manager_ != nullptr)
        manager_->Listeners().Unsubscribe(static_cast<Observer*>(this));
}

const DisplayRange& ChannelContainerView::Display() const
{
    display_.SetWidth(Bounds().Width());
    return display_;
}

DisplayRange& ChannelContainerView::Display()
{
    display_.SetWidth(Bounds().Width());
    return display_;
}

int64_t ChannelContainerView::MaxFrameCount() const
{
    return manager_ != nullptr ? manager_->FrameCount() : 0;
}

SampleView* ChannelContainerView::SampleViewAt(QPointF point) const
{
    for (SampleView* view : sampleViews_) {
        if (view->Frame().Contains(point.x(), point.y()))
            return view;
    }
    return nullptr;
}

SampleView* ChannelContainerView::SampleViewAtIndex(int32_t index) const
{
    if (index < 0 || size_t(index) >= sampleViews_.size())
        return nullptr;
    return sampleViews_[size_t(index)];
}

int32_t ChannelContainerView::IndexOf(const SampleView* view) const
{
    const auto found = std::find(sampleViews_.begin(), sampleViews_.end(), view);
    return found == sampleViews_.end() ? -1 : int32_t(found - sampleViews_.begin());
}

// Deliberately 0, not -1, when no view has the focus.
int32_t ChannelContainerView::FocusedChannel()
{
    return std::max(FocusIndex(), 0);
}

int32_t ChannelContainerView::FocusIndex()
{
    for (size_t i = 0; i < sampleViews_.size(); ++i) {
        if (sampleViews_[i]->IsFocus())
            return int32_t(i);
    }
    return -1;
}

int32_t ChannelContainerView::CountChannelViews()
{
    return int32_t(sampleViews_.size());
}

void ChannelContainerView::SetDisplayRange(int64_t first, int64_t last)
{
    if (Display().SetWidened(first, last, MaxFrameCount()))
        CheckZoomSlider(false);
    for (SampleView* view : sampleViews_)
        view->Update();
    if (window_ != nullptr && zoomSlider_ != nullptr) {
        Message message(kMsgDisplayRangeChanged);
        message.AddInt64(kFieldLowValue, display_.First());
        message.AddInt64(kFieldHighValue, display_.Last());
        zoomSlider_->PostMessage(message);
    }
}

void ChannelContainerView::ZoomRange()
{
    if (!Display().ZoomTo(RangeStart(), RangeEnd(), MaxFrameCount()))
        return;
    for (SampleView* view : sampleViews_)
        view->Update();
    UpdateZoomSlider();
}

// The first frame is deliberately left alone: the slider's notification
// through the window sets the display range.
void ChannelContainerView::ShowAll()
{
    display_.SetLast(MaxFrameCount() - 1);
    if (zoomSlider_ != nullptr)
        zoomSlider_->SetBoth(0.0f, 1.0f);
}

void ChannelContainerView::CheckZoomSlider(bool notify)
{
    CheckZoomSlider(notify, MaxFrameCount());
}

void ChannelContainerView::CheckZoomSlider(bool notify, int64_t count)
{
    if (zoomSlider_ == nullptr || count - 1 <= 0)
        return;
    zoomSlider_->SetLowValue(0, notify);
    zoomSlider_->SetHighValue(count - 1, notify);
    zoomSlider_->SetMinRange(Display().SliderMinRange(count));
}

void ChannelContainerView::UpdateZoomSlider()
{
    UpdateZoomSlider(MaxFrameCount());
}

void ChannelContainerView::UpdateZoomSlider(int64_t count)
{
    if (zoomSlider_ == nullptr || count <= 0)
        return;
    const DisplayRange::SliderFractions fractions = Display().SliderFractionsFor(count);
    zoomSlider_->SetLeft(fractions.left, false);
    zoomSlider_->SetRight(fractions.right, false);
}

void ChannelContainerView::RedrawColumns(SampleView* view, float left, float right)
{
    if (view == nullptr)
        return;
    ViewRect rect = view->Bounds();
    rect.left = left;
    rect.right = right;
    view->Update(rect);
}

// A mark at x is drawn in the column whose frames hold it, which can lie one
// column either side of PosAt's x (PosAt scales by span / (width - 1), the
// columns by (span + 1) / width). Redrawing the neighbours too leaves no
// stale mark behind.
void ChannelContainerView::RedrawMarkInAll(float x)
{
    for (SampleView* view : sampleViews_)
        RedrawColumns(view, x - 1, x + 1);
}

void ChannelContainerView::SetCursorFrame(int64_t frame)
{
    if (frame > MaxFrameCount())
        return;
    float oldX = PosAt(cursorFrame_);
    if (oldX == -1)
        oldX = 0;
    cursorFrame_ = frame;
    const float newX = PosAt(frame);
    RedrawMarkInAll(oldX);
    RedrawMarkInAll(newX);
}

void ChannelContainerView::SetPlaymarkFrame(int64_t frame)
{
    if (frame <= MaxFrameCount()) {
        float oldX = PosAt(playmarkFrame_);
        if (oldX == -1)
            oldX = 0;
        const bool oldVisible = display_.Contains(playmarkFrame_);
        playmarkFrame_ = frame;
        const bool newVisible = display_.Contains(frame);
        if (oldVisible)
            RedrawMarkInAll(oldX);
        if (newVisible)
            RedrawMarkInAll(PosAt(frame));
    }
    // The window sends the next play position only after this answer.
    if (window_ != nullptr)
        window_->PostMessage(kMsgPlaymarkUpdated);
}

void ChannelContainerView::SetPlaymarkToCursor()
{
    if (manager_ != nullptr)
        manager_->SetCurrentFrame(cursorFrame_);
}

int64_t ChannelContainerView::RangeStart() const
{
    return manager_ != nullptr ? manager_->RangeStart() : -1;
}

int64_t ChannelContainerView::RangeEnd() const
{
    return manager_ != nullptr ? manager_->RangeEnd() : -1;
}

void ChannelContainerView::SetRangeStart(int64_t frame)
{
    if (manager_ != nullptr)
        manager_->SetRangeStart(frame);
}

void ChannelContainerView::SetRangeEnd(int64_t frame)
{
    if (manager_ != nullptr)
        manager_->SetRangeEnd(frame);
}

void ChannelContainerView::SelectAll()
{
    const int64_t count = MaxFrameCount();
    SetRangeStart(0);
    SetRangeEnd(count - 1);
    SetCursorFrame(count - 1);
    if (manager_ != nullptr) {
        for (int32_t i = 0; i < manager_->CountChannels(); ++i)
            manager_->ChannelAt(i)->SetSelected(true);
    }
    // Only the columns whose range state changed are rendered again.
    for (SampleView* view : sampleViews_)
        view->Update(view->Bounds());
}

void ChannelContainerView::DeselectAll()
{
    const float startX = PosAt(RangeStart());
    const float endX = PosAt(RangeEnd());
    for (SampleView* view : sampleViews_) {
        Channel* channel = view->GetChannel();
        if (channel == nullptr || !channel->IsSelected())
            continue;
        channel->SetSelected(false);
        RedrawColumns(view, startX - 2, endX + 1);
    }
    SetRangeStart(-1);
    SetRangeEnd(-1);
}

void ChannelContainerView::RangeChanged()
{
    for (SampleView* view : sampleViews_) {
        if (view->GetChannel() != nullptr && view->GetChannel()->IsSelected())
            view->Update(view->Bounds());
    }
}

void ChannelContainerView::ObserverNotified(Observable*, uint32_t mask, const Message* data)
{
    int32_t index = -1;
    if (data != nullptr)
        data->FindInt32(kFieldIndex, &index);
    if (mask != DocumentChange::kChannelAdded)
        burstCountKnown_ = false;
    if (mask & DocumentChange::kChannelRemoved)
        RemoveSampleViewAt(index);
    if (mask & DocumentChange::kChannelAdded)
        AddChannelAt(manager_->ChannelAt(index), index);
    if (mask & DocumentChange::kChannelData) {
        if (SampleView* view = SampleViewAtIndex(index))
            view->Update();
        else if (index < 0)
            UpdateAll();
    }
}

void ChannelContainerView::AddChannelAt(Channel* channel, int32_t index)
{
    InsertSampleView(new SampleView(channel, this, this), index);
}

// An index outside the list appends, so that every view made here is laid
// out and drawn. What follows from the frame count is brought up to date
// channel by channel, since the display range depends on the order of the
// changes; placing the views waits for the one layout pass of the batch.
void ChannelContainerView::InsertSampleView(SampleView* view, int32_t index)
{
    const size_t position = (index < 0 || size_t(index) > sampleViews_.size()) ? sampleViews_.size() : size_t(index);
    sampleViews_.insert(sampleViews_.begin() + std::ptrdiff_t(position), view);
    view->show();
    const int64_t count = FrameCountWith(view->GetChannel());
    if (display_.Last() <= 0)
        display_.SetLast(count - 1);
    CheckZoomSlider(true, count);
    sliderCheckPending_ = true;
    UpdateSizeLimits();
    FollowFrameCount(count);
    layout_.Schedule();
    update();
}

void ChannelContainerView::RemoveSampleViewAt(int32_t index)
{
    SampleView* view = SampleViewAtIndex(index);
    if (view == nullptr)
        return;
    sampleViews_.erase(sampleViews_.begin() + index);
    delete view;
    burstCountKnown_ = false;
    // The slider heard of this change as the last one of the batch.
    sliderCheckPending_ = false;
    UpdateSizeLimits();
    FollowFrameCount(MaxFrameCount());
    layout_.Schedule();
    update();
}

// A channel added to a batch can only raise the frame count, so the count
// is taken from the document once per batch and kept up from the channels
// added since; any other change to the document takes it afresh.
int64_t ChannelContainerView::FrameCountWith(Channel* added)
{
    burstCount_ = burstCountKnown_ && added != nullptr ? std::max(burstCount_, added->EndFrame()) : MaxFrameCount();
    burstCountKnown_ = true;
    return burstCount_;
}

void ChannelContainerView::LayOutAfterChanges()
{
    burstCountKnown_ = false;
    if (sliderCheckPending_) {
        sliderCheckPending_ = false;
        CheckZoomSlider(true);
    }
    // Views added make the container taller than the window's layout has
    // made it yet; that layout would resize it only from an event still
    // queued. Placed in the old height first, every view, the old ones too,
    // would get a height it loses again at once, and so two pictures per
    // batch. A resize on the way up to date places the views itself.
    const int64_t passes = layoutPasses_;
    if (height() < minimumSizeHint().height())
        AncestorLayouts::Activate(this);
    if (layoutPasses_ == passes)
        LayoutChildren();
    update();
}

void ChannelContainerView::UpdateAll()
{
    for (SampleView* view : sampleViews_)
        view->Update();
    CheckZoomSlider(true);
}

// Qt keeps a dirty region as a list of rectangles and cuts each child's
// share out of it, so many small areas cost the square of their number;
// the one rectangle around them costs a repaint of the views between,
// whose pictures are up to date.
void ChannelContainerView::RepaintArea(const QRect& area)
{
    pendingRepaint_ = pendingRepaint_.united(area);
    update(pendingRepaint_);
}

void ChannelContainerView::MessageReceived(const Message& message)
{
    if (message.what == kMsgSampleMoved) {
        // A sample view finished drawing: a move may ask for the next redraw.
        interaction_.AllowMoveRedraw();
        return;
    }
    contextMenu_.Apply(message.what);
}

// Layout

QSize ChannelContainerView::minimumSizeHint() const
{
    int height = kMinimumHeight;
    if (zoomSlider_ != nullptr)
        height += zoomSlider_->minimumSizeHint().height();
    return {0, height + ViewStack::MinimumHeight(sampleViews_, kFrameAllowance)};
}

QSize ChannelContainerView::sizeHint() const
{
    return minimumSizeHint().expandedTo(QSize(400, 200));
}

void ChannelContainerView::UpdateSizeLimits()
{
    const int maximumHeight = kMaximumSize + int(sampleViews_.size()) * (kMaximumSize + kFrameAllowance);
    setMaximumSize(kMaximumSize, std::min(maximumHeight, QWIDGETSIZE_MAX));
    updateGeometry();
}

void ChannelContainerView::resizeEvent(QResizeEvent* event)
{
    MessageView::resizeEvent(event);
    if (!layout_.Flush()) {
        LayoutChildren();
        update();
    }
}

// A view wider than the display range shows one frame per column; the
// slider follows the frame count.
void ChannelContainerView::FollowFrameCount(int64_t count)
{
    Display().WidenToOneFramePerColumn(count);
    UpdateZoomSlider(count);
    CheckZoomSlider(false, count);
}

void ChannelContainerView::LayoutChildren()
{
    layoutPasses_++;
    const int64_t frames = MaxFrameCount();
    Display().WidenToOneFramePerColumn(frames);
    UpdateZoomSlider(frames);
    const ViewRect bounds = Bounds();
    if (zoomSlider_ != nullptr)
        zoomSliderHeight_ = float(zoomSlider_->minimumSizeHint().height());
    const float previousBottom = ViewStack::Place(*this, sampleViews_, bounds, zoomSliderHeight_);
    if (zoomSlider_ != nullptr) {
        const float top = sampleViews_.empty() ? bounds.bottom - zoomSliderHeight_ + 1 : previousBottom + 2;
        zoomSlider_->Layout({0, top, bounds.right, bounds.bottom});
    }
    CheckZoomSlider(false, frames);
}

// Drawing: only the frames around the sample views and the empty state;
// the waveforms are the sample views' own.
void ChannelContainerView::paintEvent(QPaintEvent* event)
{
    pendingRepaint_ = QRect();
    QPainter painter(this);
    painter.fillRect(event->rect(), kBackground);
    // A frame lies one pixel outside its view; frames wholly outside the
    // exposed area are left out.
    const QRect exposed = event->rect().adjusted(-1, -1, 1, 1);
    for (SampleView* view : sampleViews_) {
        if (view->geometry().intersects(exposed))
            ContainerFrames::DrawViewFrame(painter, view->Frame(), view->IsFocus());
    }
    if (sampleViews_.empty())
        ContainerFrames::DrawEmptyState(painter, Bounds(), zoomSliderHeight_, font());
}

void ChannelContainerView::wheelEvent(QWheelEvent* event)
{
    const bool ctrl = (event->modifiers() & Qt::ControlModifier) != 0;
    WheelNavigator(*this).Wheel(event->position(), event->angleDelta(), event->pixelDelta(), ctrl);
    event->accept();
}

}  // namespace glimmet
