#pragma once

#include <cstdint>

#include <QPointF>
#include <Qt>

namespace glimmet {

class ChannelContainerView;
class ChannelContextMenu;
class SampleView;

/// What the mouse does in the channel container: a primary click starts a
/// range drag that may reach across channels, Shift extends the range from
/// its far end, a double click selects one channel's data, a middle or
/// Ctrl-click drags a channel in time, and a secondary click opens the
/// channel's context menu.
///
/// At the end of a drag it posts 'rsch' and 'rech' to the window, at the end
/// of a move 'smmd' with the channel, its sample view and the offset.
///
/// GUI thread only. It works through the container's public operations.
class ContainerMouseInteraction {
public:
    ContainerMouseInteraction(ChannelContainerView& container, ChannelContextMenu& contextMenu);

    /// A mouse-down in a sample view (view coordinates).
    void Clicked(SampleView* view, QPointF point, Qt::MouseButton button, Qt::KeyboardModifiers modifiers);
    void DoubleClicked(SampleView* view, QPointF point, Qt::MouseButton button);
    /// Pointer motion while a button is held (container coordinates).
    void MouseMoved(QPointF point);
    void MouseUp();

    void StartDragging(SampleView* view, int64_t anchor);
    void Dragging(SampleView* view, float x);
    void StopDragging();
    bool IsDragging() const { return dragChannel_ >= 0; }

    void StartMoving(SampleView* view, int64_t frame);
    void Moving(float x);
    void StopMoving();
    bool IsMoving() const { return movingChannel_ >= 0; }
    /// Moves channel index by frames in one go, ending like a finished move.
    void MoveChannel(int32_t index, int64_t frames);
    /// A sample view has drawn: a move may ask for the next redraw.
    void AllowMoveRedraw() { moveRedrawPermission_ = true; }

private:
    SampleView* DragTargetAt(QPointF point) const;
    void ExtendRange(SampleView* view, float x);
    void RedrawDragEdge(SampleView* view, bool endSide, int64_t oldStart, int64_t oldEnd);

    ChannelContainerView& container_;
    ChannelContextMenu& contextMenu_;
    int32_t dragChannel_ = -1;
    int64_t dragAnchor_ = -1;
    int64_t grabOffset_ = 0;
    int64_t moveStartFrame_ = 0;
    int32_t movingChannel_ = -1;
    bool moveRedrawPermission_ = true;
};

}  // namespace glimmet
