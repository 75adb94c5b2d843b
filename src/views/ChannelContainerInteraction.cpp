// The mouse side of ChannelContainerView: range drags, Shift-extend,
// double-click, moving a channel in time and the channel context menu.

#include <algorithm>
#include <mutex>

#include <QMenu>

#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/DocumentWindow.h"
#include "support/MessageCodes.h"
#include "views/ChannelContainerView.h"
#include "views/SampleView.h"

namespace glimmet {

void ChannelContainerView::Clicked(SampleView* view, QPointF point, Qt::MouseButton button,
                                   Qt::KeyboardModifiers modifiers)
{
    const float x = float(point.x());
    const bool command = modifiers.testFlag(Qt::ControlModifier);
    if (button == Qt::LeftButton && !command) {
        if (!modifiers.testFlag(Qt::ShiftModifier)) {
            DeselectAll();
            StartDragging(view, FirstFrameAt(x));
            SetCursorFrame(FrameAt(x));
            return;
        }
        // Shift extends the range from the end farther from the click.
        const float middle = (PosAt(RangeStart()) + PosAt(RangeEnd())) / 2;
        if (x >= middle) {
            if (RangeStart() < 0) {
                StartDragging(view, cursorFrame_);
            } else {
                const int64_t start = RangeStart();
                StartDragging(view, start);
                SetCursorFrame(start);
            }
        } else {
            const int64_t end = RangeEnd();
            StartDragging(view, end);
            SetCursorFrame(end);
        }
        Dragging(view, x);
    } else if (button == Qt::RightButton) {
        ShowContextMenu(view, point);
    } else if (button == Qt::MiddleButton || (button == Qt::LeftButton && command)) {
        StartMoving(view, FirstFrameAt(x));
    }
}

// A double click selects exactly the clicked channel's own data.
void ChannelContainerView::DoubleClicked(SampleView* view, QPointF point, Qt::MouseButton button,
                                         Qt::KeyboardModifiers)
{
    if (button == Qt::RightButton) {
        ShowContextMenu(view, point);
        return;
    }
    if (button != Qt::LeftButton || manager_ == nullptr)
        return;
    const int64_t oldStart = RangeStart();
    const int64_t oldEnd = RangeEnd();
    const int32_t clicked = IndexOf(view);
    for (int32_t i = 0; i < manager_->CountChannels(); ++i) {
        Channel* channel = manager_->ChannelAt(i);
        SampleView* channelView = SampleViewAtIndex(i);
        if (i == clicked) {
            channel->SetSelected(true);
            const int64_t first = channel->FirstFrame();
            SetRangeStart(first);
            SetRangeEnd(first + channel->FrameCount() - 1);
            SetCursorFrame(first);
            const float left = std::min(PosAt(oldStart), PosAt(RangeStart())) - 1;
            const float right = std::max(PosAt(oldEnd), PosAt(RangeEnd())) + 1;
            RedrawColumns(channelView, left, right);
        } else if (channel->IsSelected()) {
            channel->SetSelected(false);
            RedrawColumns(channelView, PosAt(oldStart), PosAt(oldEnd));
        }
    }
}

void ChannelContainerView::ShowContextMenu(SampleView* view, QPointF point)
{
    const int32_t index = IndexOf(view);
    Channel* channel = manager_ != nullptr ? manager_->ChannelAt(index) : nullptr;
    if (channel == nullptr)
        return;
    contextChannel_ = index;
    QMenu* menu = ContextMenuFor(channel);
    openMenu_ = menu;
    menu->popup(view->mapToGlobal(point.toPoint()));
}

QMenu* ChannelContainerView::ContextMenuForChannel(int32_t index)
{
    Channel* channel = manager_ != nullptr ? manager_->ChannelAt(index) : nullptr;
    if (channel == nullptr)
        return nullptr;
    contextChannel_ = index;
    return ContextMenuFor(channel);
}

QMenu* ChannelContainerView::OpenContextMenu() const
{
    return openMenu_.data();
}

QMenu* ChannelContainerView::ContextMenuFor(Channel* channel)
{
    auto* menu = new QMenu(this);
    menu->setObjectName("channel menu");
    menu->setAttribute(Qt::WA_DeleteOnClose);
    const auto addItem = [this, menu](const char* label, uint32_t what, bool marked) {
        QAction* action = menu->addAction(QString::fromUtf8(label));
        action->setCheckable(true);
        action->setChecked(marked);
        connect(action, &QAction::triggered, this, [this, what] { PostMessage(what); });
    };
    addItem("Mute", kMsgToggleMute, channel->IsMuted());
    menu->addSeparator();
    addItem("Left", kMsgPanLeft, channel->PanPosition() == Channel::kPanLeft);
    addItem("Middle", kMsgPanMiddle, channel->PanPosition() == Channel::kPanMiddle);
    addItem("Right", kMsgPanRight, channel->PanPosition() == Channel::kPanRight);
    menu->addSeparator();
    // "Remove" goes to the window, which removes the channel as an action.
    QAction* remove = menu->addAction(QStringLiteral("Remove"));
    connect(remove, &QAction::triggered, this, [this] {
        if (window_ != nullptr)
            window_->PostMessage(kMsgRemoveChannel);
    });
    return menu;
}

void ChannelContainerView::MouseMoved(QPointF point)
{
    if (IsDragging()) {
        SampleView* target = DragTargetAt(point);
        // Clicks are mapped in sample view coordinates, drags in container
        // coordinates plus one.
        if (target != nullptr)
            Dragging(target, float(point.x()) + 1);
    } else if (IsMoving()) {
        Moving(float(point.x()));
    }
}

// Above the first channel, below the last (into the zoom slider) or in the
// gap between two views, the drag still has a channel.
SampleView* ChannelContainerView::DragTargetAt(QPointF point) const
{
    if (SampleView* view = SampleViewAt(point))
        return view;
    if (sampleViews_.empty())
        return nullptr;
    const float y = float(point.y());
    if (y < 0)
        return sampleViews_.front();
    if (y > Bounds().bottom - zoomSliderHeight_)
        return sampleViews_.back();
    for (SampleView* view : sampleViews_) {
        const ViewRect frame = view->Frame();
        if (frame.top - 1 <= y && y <= frame.bottom + 1)
            return view;
    }
    return nullptr;
}

void ChannelContainerView::MouseUp(QPointF)
{
    if (IsDragging())
        StopDragging();
    if (IsMoving())
        StopMoving();
}

void ChannelContainerView::StartDragging(SampleView* view, int64_t anchor)
{
    dragChannel_ = IndexOf(view);
    dragAnchor_ = anchor;
}

void ChannelContainerView::Dragging(SampleView* view, float x)
{
    const int32_t target = IndexOf(view);
    if (target < 0)
        return;
    const int64_t oldStart = RangeStart();
    const int64_t oldEnd = RangeEnd();
    const float anchorX = PosAt(dragAnchor_);
    const float oldStartX = PosAt(oldStart);
    const float oldEndX = PosAt(oldEnd);
    if (x <= anchorX) {
        SetRangeStart(std::max<int64_t>(FirstFrameAt(x), 0));
        SetRangeEnd(dragAnchor_);
    } else {
        SetRangeStart(dragAnchor_);
        // Deliberately the frame count, one past the last frame.
        SetRangeEnd(std::min(LastFrameAt(x), MaxFrameCount()));
    }
    const int32_t low = std::min(dragChannel_, target);
    const int32_t high = std::max(dragChannel_, target);
    for (int32_t i = 0; i < int32_t(sampleViews_.size()); ++i) {
        SampleView* channelView = sampleViews_[size_t(i)];
        Channel* channel = channelView->GetChannel();
        if (channel == nullptr)
            continue;
        if (i < low || i > high) {
            if (channel->IsSelected()) {
                channel->SetSelected(false);
                RedrawColumns(channelView, oldStartX - 1, oldEndX + 2);
            }
        } else if (!channel->IsSelected()) {
            channel->SetSelected(true);
            RedrawColumns(channelView, PosAt(RangeStart()) - 1, PosAt(RangeEnd()) + 1);
        } else {
            RedrawDragEdge(channelView, x > anchorX, oldStart, oldEnd);
        }
    }
}

// Only the strip between the old and the new position of the moving edge
// changes colour; a range that just flipped over the anchor redraws whole.
void ChannelContainerView::RedrawDragEdge(SampleView* view, bool endSide, int64_t oldStart, int64_t oldEnd)
{
    const float oldStartX = PosAt(oldStart);
    const float oldEndX = PosAt(oldEnd);
    const float newStartX = PosAt(RangeStart());
    const float newEndX = PosAt(RangeEnd());
    float left;
    float right;
    if (endSide) {
        left = RangeStart() == oldEnd ? oldStartX : std::min(oldEndX, newEndX);
        right = std::max(oldEndX, newEndX);
    } else {
        left = std::min(oldStartX, newStartX);
        right = RangeEnd() == oldStart ? oldEndX : std::max(oldStartX, newStartX);
    }
    RedrawColumns(view, left - 1, right + 2);
}

void ChannelContainerView::StopDragging()
{
    dragChannel_ = -1;
    dragAnchor_ = -1;
    if (window_ == nullptr)
        return;
    Message start(kMsgRangeStartChanged);
    start.AddInt64("range start", RangeStart());
    window_->PostMessage(start);
    Message end(kMsgRangeEndChanged);
    end.AddInt64("range end", RangeEnd());
    window_->PostMessage(end);
}

void ChannelContainerView::StartMoving(SampleView* view, int64_t frame)
{
    movingChannel_ = IndexOf(view);
    Channel* channel = manager_ != nullptr ? manager_->ChannelAt(movingChannel_) : nullptr;
    if (channel == nullptr) {
        grabOffset_ = 0;
        moveStartFrame_ = 0;
        StopMoving();
        return;
    }
    grabOffset_ = frame - channel->FirstFrame();
    moveStartFrame_ = channel->FirstFrame();
}

// At most one full redraw of the moved channel is queued: the permission
// comes back when the sample view has drawn.
void ChannelContainerView::Moving(float x)
{
    const int64_t frame = FirstFrameAt(x);
    Channel* channel = manager_ != nullptr ? manager_->ChannelAt(movingChannel_) : nullptr;
    if (channel != nullptr) {
        {
            std::lock_guard documentLock(manager_->DocumentLock());
            channel->SetStartFrameOffset(frame - grabOffset_);
        }
        SampleView* view = SampleViewAtIndex(movingChannel_);
        if (view != nullptr && moveRedrawPermission_ != 0) {
            view->PostMessage(kMsgMovingSample);
            moveRedrawPermission_ = 0;
        }
    }
    // The document's length may have changed.
    CheckZoomSlider(false);
    UpdateZoomSlider();
}

void ChannelContainerView::MoveChannel(int32_t index, int64_t frames)
{
    Channel* channel = manager_ != nullptr ? manager_->ChannelAt(index) : nullptr;
    if (channel == nullptr)
        return;
    movingChannel_ = index;
    moveStartFrame_ = channel->FirstFrame();
    grabOffset_ = 0;
    {
        std::lock_guard documentLock(manager_->DocumentLock());
        channel->SetStartFrameOffset(moveStartFrame_ + frames);
    }
    CheckZoomSlider(false);
    UpdateZoomSlider();
    StopMoving();
}

void ChannelContainerView::StopMoving()
{
    Channel* channel = manager_ != nullptr ? manager_->ChannelAt(movingChannel_) : nullptr;
    if (channel != nullptr && window_ != nullptr) {
        // The window records the move as an undoable action; the offset is
        // the opposite of the distance moved.
        Message message(kMsgSampleMoved);
        message.AddPointer("channel", channel);
        message.AddPointer("sample view", SampleViewAtIndex(movingChannel_));
        message.AddInt64("offset", moveStartFrame_ - channel->FirstFrame());
        window_->PostMessage(message);
    }
    movingChannel_ = -1;
}

}  // namespace glimmet
