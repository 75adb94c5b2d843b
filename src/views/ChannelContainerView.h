#pragma once

#include <cstdint>
#include <vector>

#include <QPointF>
#include <QPointer>
#include <QMenu>
#include <QWidget>

#include "edit/EditContext.h"
#include "sound/Observer.h"
#include "views/MessageView.h"
#include "views/FrameMapping.h"
#include "views/SampleView.h"
#include "views/ViewRect.h"

class QPainter;

namespace glimmet {

class Channel;
class ChannelManager;
class DocumentWindow;
class ZoomSlider;

/// The editing surface of a document window: one SampleView per channel,
/// stacked, with the zoom slider along the bottom edge. It owns the mapping
/// between frames and pixel columns, the display range, the edit cursor and
/// the play mark, and the mouse interaction: range drags across channels,
/// Shift-extend, double-click, moving a channel in time and the channel
/// context menu.
///
/// Everything it tells the window is posted as a Message to the
/// DocumentWindow: 'rsch'/'rech' at the end of a range drag, 'smmd' at the
/// end of a move, 'pmup' after a play mark update, 'remc' from the context
/// menu. It posts 'dprs' to the zoom slider after a display range change.
///
/// It follows the document: a view comes and goes with each channel the
/// manager announces, and a channel whose data changed is redrawn.
///
/// GUI thread only. The manager, the window and the channels are not owned;
/// the zoom slider and the sample views are child widgets.
class ChannelContainerView : public MessageView, public EditContext, public Observer {
    Q_OBJECT

public:
    /// zoomSlider and window may be null; the slider becomes a child.
    ChannelContainerView(ChannelManager* manager, ZoomSlider* zoomSlider, DocumentWindow* window,
                         QWidget* parent = nullptr);
    ~ChannelContainerView() override;

    // Frame/pixel mapping over the current display range and width.
    float PosAt(int64_t frame) const;
    int64_t FirstFrameAt(float x) const;
    int64_t LastFrameAt(float x) const;
    int64_t FrameAt(float x) const;
    FrameMapping Mapping() const;
    int64_t MaxFrameCount() const;
    /// The first sample view whose frame holds the point (container
    /// coordinates), or null.
    SampleView* SampleViewAt(QPointF point) const;
    /// Null when index is out of range.
    SampleView* SampleViewAtIndex(int32_t index) const;
    int32_t IndexOf(const SampleView* view) const;
    /// Index of the first channel view that has the focus; 0 when none has.
    int32_t FocusedChannel();
    int32_t FocusIndex() override;
    int32_t CountChannelViews();
    ZoomSlider* GetZoomSlider() const { return zoomSlider_; }
    ChannelManager* Manager() const { return manager_; }
    DocumentWindow* Window() const { return window_; }

    // Display range and zoom.
    int64_t FirstDisplayedFrame() const { return firstFrame_; }
    int64_t LastDisplayedFrame() const { return lastFrame_; }
    /// Shows [first, last], widened to at least one frame per column, and
    /// tells the zoom slider.
    void SetDisplayRange(int64_t first, int64_t last);
    /// Shows the range, centred and widened to one frame per column.
    void ZoomRange();
    /// Shows the whole document through the zoom slider.
    void ShowAll();
    /// Places the slider's handles for the display range (no notification).
    void UpdateZoomSlider();
    /// Sets the slider's value limits and minimum range from the document.
    void CheckZoomSlider(bool notify);

    // Cursor, play mark and range.
    int64_t CursorFrame() override { return cursorFrame_; }
    int64_t PlaymarkFrame() const { return playmarkFrame_; }
    void SetCursorFrame(int64_t frame);
    /// Moves the play mark and posts 'pmup' to the window.
    void SetPlaymarkFrame(int64_t frame);
    void SetPlaymarkToCursor();
    int64_t RangeStart() const;
    int64_t RangeEnd() const;
    void SetRangeStart(int64_t frame);
    void SetRangeEnd(int64_t frame);
    void SelectAll();
    void DeselectAll();
    /// Redraws the view of every selected channel.
    void RangeChanged();

    /// Redraws every channel view.
    void UpdateAll();
    /// Views for added and removed channels; a redraw for changed data.
    void ObserverNotified(Observable* source, uint32_t mask, const Message* data) override;

    // Mouse interaction; points are in the coordinates named.
    /// A mouse-down in a sample view (view coordinates).
    void Clicked(SampleView* view, QPointF point, Qt::MouseButton button, Qt::KeyboardModifiers modifiers);
    void DoubleClicked(SampleView* view, QPointF point, Qt::MouseButton button, Qt::KeyboardModifiers modifiers);
    /// Pointer motion while a button is held (container coordinates).
    void MouseMoved(QPointF point);
    void MouseUp(QPointF point);
    void StartDragging(SampleView* view, int64_t anchor);
    void Dragging(SampleView* view, float x);
    void StopDragging();
    bool IsDragging() const { return dragChannel_ >= 0; }
    void StartMoving(SampleView* view, int64_t frame);
    void Moving(float x);
    void StopMoving();
    bool IsMoving() const { return movingChannel_ >= 0; }
    /// Moves channel index by frames in one go, ending like a finished drag:
    /// the window records the move as an undoable action.
    void MoveChannel(int32_t index, int64_t frames);
    /// The channel's context menu; it deletes itself when closed.
    QMenu* ContextMenuFor(Channel* channel);
    int32_t ContextChannel() const { return contextChannel_; }
    /// The context menu of channel index as a secondary click would build
    /// it, without showing it; null when there is no such channel.
    QMenu* ContextMenuForChannel(int32_t index);
    /// The menu opened by the last secondary click, while it exists.
    QMenu* OpenContextMenu() const;

    /// 'much', 'stcl', 'stcm', 'stcr' for the context channel; a bare
    /// 'smmd' (a sample view has drawn) re-allows a move redraw.
    void MessageReceived(const Message& message) override;

    QSize minimumSizeHint() const override;
    QSize sizeHint() const override;

protected:
    void paintEvent(QPaintEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;

private:
    float Width() const;
    void LayoutChildren();
    void DrawEmptyState(QPainter& painter);
    void WidenToOneFramePerColumn();
    void UpdateSizeLimits();
    void AddChannelAt(Channel* channel, int32_t index);
    void RemoveSampleViewAt(int32_t index);
    void InsertSampleView(SampleView* view, int32_t index);
    void RedrawColumns(SampleView* view, float left, float right);
    void RedrawColumnInAll(float x);
    void ShowContextMenu(SampleView* view, QPointF point);
    SampleView* DragTargetAt(QPointF point) const;
    void RedrawDragEdge(SampleView* view, bool endSide, int64_t oldStart, int64_t oldEnd);
    Channel* ContextChannelPointer() const;

    std::vector<SampleView*> sampleViews_;  // children of this widget
    ZoomSlider* zoomSlider_;
    ChannelManager* manager_;
    DocumentWindow* window_;
    float zoomSliderHeight_ = 0;
    int32_t dragChannel_ = -1;
    int64_t dragAnchor_ = -1;
    int64_t firstFrame_ = 0;
    int64_t lastFrame_ = -1;
    int64_t cursorFrame_ = 0;
    int64_t playmarkFrame_ = -1;
    int32_t contextChannel_ = -1;
    int64_t grabOffset_ = 0;
    int64_t moveStartFrame_ = 0;
    int32_t movingChannel_ = -1;
    int32_t moveRedrawPermission_ = 1;
    QPointer<QMenu> openMenu_;  // deletes itself when closed
};

}  // namespace glimmet
