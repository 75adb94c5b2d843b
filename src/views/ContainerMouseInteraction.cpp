#include "views/ContainerMouseInteraction.h"

#include <algorithm>
#include <mutex>

#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/DocumentWindow.h"
#include "support/FrameArithmetic.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"
#include "views/ChannelContainerView.h"
#include "views/ChannelContextMenu.h"
#include "views/SampleView.h"

namespace glimmet {

ContainerMouseInteraction::ContainerMouseInteraction(ChannelContainerView& container, ChannelContextMenu& contextMenu)
    : container_(container), contextMenu_(contextMenu)
{
}

void ContainerMouseInteraction::Clicked(SampleView* view, QPointF point, Qt::MouseButton button,
                                        Qt::KeyboardModifiers modifiers)
{
    const float x = float(point.x());
    const bool command = modifiers.testFlag(Qt::ControlModifier);
    if (button == Qt::LeftButton && !command) {
        if (modifiers.testFlag(Qt::ShiftModifier)) {
            ExtendRange(view, x);
            return;
        }
        container_.DeselectAll();
        StartDragging(view, container_.FirstFrameAt(x));
        container_.SetCursorFrame(container_.FrameAt(x));
    } else if (button == Qt::RightButton) {
        contextMenu_.Show(view, point);
    } else if (button == Qt::MiddleButton || (button == Qt::LeftButton && command)) {
        StartMoving(view, container_.FirstFrameAt(x));
    }
}

// Shift extends the range from the end farther from the click.
void ContainerMouseInteraction::ExtendRange(SampleView* view, float x)
{
    const float middle = (container_.PosAt(container_.RangeStart()) + container_.PosAt(container_.RangeEnd())) / 2;
    if (x >= middle) {
        if (container_.RangeStart() < 0) {
            StartDragging(view, container_.CursorFrame());
        } else {
            const int64_t start = container_.RangeStart();
            StartDragging(view, start);
            container_.SetCursorFrame(start);
        }
    } else {
        const int64_t end = container_.RangeEnd();
        StartDragging(view, end);
        container_.SetCursorFrame(end);
    }
    Dragging(view, x);
}

// A double click selects exactly the clicked channel's own data.
void ContainerMouseInteraction::DoubleClicked(SampleView* view, QPointF point, Qt::MouseButton button)
{
    if (button == Qt::RightButton) {
        contextMenu_.Show(view, point);
        return;
    }
    ChannelManager* manager = container_.Manager();
    if (button != Qt::LeftButton || manager == nullptr)
        return;
    const int64_t oldStart = container_.RangeStart();
    const int64_t oldEnd = container_.RangeEnd();
    const int32_t clicked = container_.IndexOf(view);
    for (int32_t i = 0; i < manager->CountChannels(); ++i) {
        Channel* channel = manager->ChannelAt(i);
        SampleView* channelView = container_.SampleViewAtIndex(i);
        if (i == clicked) {
            channel->SetSelected(true);
            const int64_t first = channel->FirstFrame();
            container_.SetRangeStart(first);
            container_.SetRangeEnd(first + channel->FrameCount() - 1);
            container_.SetCursorFrame(first);
            const float left = std::min(container_.PosAt(oldStart), container_.PosAt(container_.RangeStart())) - 1;
            const float right = std::max(container_.PosAt(oldEnd), container_.PosAt(container_.RangeEnd())) + 1;
            container_.RedrawColumns(channelView, left, right);
        } else if (channel->IsSelected()) {
            channel->SetSelected(false);
            container_.RedrawColumns(channelView, container_.PosAt(oldStart), container_.PosAt(oldEnd));
        }
    }
}

void ContainerMouseInteraction::MouseMoved(QPointF point)
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

// The channel a range drag reaches: above the first view the first, below
// the last (into the zoom slider) the last, in the gap around a view that
// view; else none.
SampleView* ContainerMouseInteraction::DragTargetAt(QPointF point) const
{
    if (SampleView* view = container_.SampleViewAt(point))
        return view;
    const int32_t count = container_.CountChannelViews();
    if (count == 0)
        return nullptr;
    const float y = float(point.y());
    if (y < 0)
        return container_.SampleViewAtIndex(0);
    if (y > container_.Bounds().bottom - container_.ZoomSliderHeight())
        return container_.SampleViewAtIndex(count - 1);
    for (int32_t i = 0; i < count; ++i) {
        SampleView* view = container_.SampleViewAtIndex(i);
        const ViewRect frame = view->Frame();
        if (frame.top - 1 <= y && y <= frame.bottom + 1)
            return view;
    }
    return nullptr;
}

void ContainerMouseInteraction::MouseUp()
{
    if (IsDragging())
        StopDragging();
    if (IsMoving())
        StopMoving();
}

void ContainerMouseInteraction::StartDragging(SampleView* view, int64_t anchor)
{
    dragChannel_ = container_.IndexOf(view);
    dragAnchor_ = anchor;
}

void ContainerMouseInteraction::Dragging(SampleView* view, float x)
{
    const int32_t target = container_.IndexOf(view);
    if (target < 0)
        return;
    const int64_t oldStart = container_.RangeStart();
    const int64_t oldEnd = container_.RangeEnd();
    const float anchorX = container_.PosAt(dragAnchor_);
    const float oldStartX = container_.PosAt(oldStart);
    const float oldEndX = container_.PosAt(oldEnd);
    if (x <= anchorX) {
        container_.SetRangeStart(std::max<int64_t>(container_.FirstFrameAt(x), 0));
        container_.SetRangeEnd(dragAnchor_);
    } else {
        container_.SetRangeStart(dragAnchor_);
        // Deliberately the frame count, one past the last frame.
        container_.SetRangeEnd(std::min(container_.LastFrameAt(x), container_.MaxFrameCount()));
    }
    const int32_t low = std::min(dragChannel_, target);
    const int32_t high = std::max(dragChannel_, target);
    const int32_t count = container_.CountChannelViews();
    for (int32_t i = 0; i < count; ++i) {
        SampleView* channelView = container_.SampleViewAtIndex(i);
        Channel* channel = channelView->GetChannel();
        if (channel == nullptr)
            continue;
        if (i < low || i > high) {
            if (channel->IsSelected()) {
                channel->SetSelected(false);
                container_.RedrawColumns(channelView, oldStartX - 1, oldEndX + 2);
            }
        } else if (!channel->IsSelected()) {
            channel->SetSelected(true);
            container_.RedrawColumns(channelView, container_.PosAt(container_.RangeStart()) - 1,
                                     container_.PosAt(container_.RangeEnd()) + 1);
        } else {
            RedrawDragEdge(channelView, x > anchorX, oldStart, oldEnd);
        }
    }
}

// Only the strip between the old and the new position of the moving edge
// changes colour; a range that just flipped over the anchor redraws whole.
void ContainerMouseInteraction::RedrawDragEdge(SampleView* view, bool endSide, int64_t oldStart, int64_t oldEnd)
{
    const float oldStartX = container_.PosAt(oldStart);
    const float oldEndX = container_.PosAt(oldEnd);
    const float newStartX = container_.PosAt(container_.RangeStart());
    const float newEndX = container_.PosAt(container_.RangeEnd());
    float left;
    float right;
    if (endSide) {
        left = container_.RangeStart() == oldEnd ? oldStartX : std::min(oldEndX, newEndX);
        right = std::max(oldEndX, newEndX);
    } else {
        left = std::min(oldStartX, newStartX);
        right = container_.RangeEnd() == oldStart ? oldEndX : std::max(oldStartX, newStartX);
    }
    container_.RedrawColumns(view, left - 1, right + 2);
}

void ContainerMouseInteraction::StopDragging()
{
    dragChannel_ = -1;
    dragAnchor_ = -1;
    DocumentWindow* window = container_.Window();
    if (window == nullptr)
        return;
    Message start(kMsgRangeStartChanged);
    start.AddInt64(kFieldRangeStart, container_.RangeStart());
    window->PostMessage(start);
    Message end(kMsgRangeEndChanged);
    end.AddInt64(kFieldRangeEnd, container_.RangeEnd());
    window->PostMessage(end);
}

void ContainerMouseInteraction::StartMoving(SampleView* view, int64_t frame)
{
    movingChannel_ = container_.IndexOf(view);
    ChannelManager* manager = container_.Manager();
    Channel* channel = manager != nullptr ? manager->ChannelAt(movingChannel_) : nullptr;
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
void ContainerMouseInteraction::Moving(float x)
{
    const int64_t frame = container_.FirstFrameAt(x);
    ChannelManager* manager = container_.Manager();
    Channel* channel = manager != nullptr ? manager->ChannelAt(movingChannel_) : nullptr;
    if (channel != nullptr) {
        {
            std::lock_guard documentLock(manager->DocumentLock());
            channel->SetStartFrameOffset(SaturatingSubtract(frame, grabOffset_));
        }
        SampleView* view = container_.SampleViewAtIndex(movingChannel_);
        if (view != nullptr && moveRedrawPermission_) {
            view->PostMessage(kMsgMovingSample);
            moveRedrawPermission_ = false;
        }
    }
    // The document's length may have changed.
    container_.CheckZoomSlider(false);
    container_.UpdateZoomSlider();
}

void ContainerMouseInteraction::MoveChannel(int32_t index, int64_t frames)
{
    ChannelManager* manager = container_.Manager();
    Channel* channel = manager != nullptr ? manager->ChannelAt(index) : nullptr;
    if (channel == nullptr)
        return;
    movingChannel_ = index;
    moveStartFrame_ = channel->FirstFrame();
    grabOffset_ = 0;
    {
        std::lock_guard documentLock(manager->DocumentLock());
        channel->SetStartFrameOffset(SaturatingAdd(moveStartFrame_, frames));
    }
    container_.CheckZoomSlider(false);
    container_.UpdateZoomSlider();
    StopMoving();
}

void ContainerMouseInteraction::StopMoving()
{
    ChannelManager* manager = container_.Manager();
    Channel* channel = manager != nullptr ? manager->ChannelAt(movingChannel_) : nullptr;
    DocumentWindow* window = container_.Window();
    if (channel != nullptr && window != nullptr) {
        // The window records the move as an undoable action; the offset is
        // the opposite of the distance moved.
        Message message(kMsgSampleMoved);
        message.AddPointer(kFieldChannel, channel);
        message.AddPointer(kFieldSampleView, container_.SampleViewAtIndex(movingChannel_));
        message.AddInt64(kFieldOffset, moveStartFrame_ - channel->FirstFrame());
        window->PostMessage(message);
    }
    movingChannel_ = -1;
}

}  // namespace glimmet
