#pragma once

#include <cstdint>
#include <vector>

#include <QPointF>
#include <QMenu>
#include <QWidget>

#include "edit/EditContext.h"
#include "sound/Observer.h"
#include "views/ChannelContextMenu.h"
#include "views/ContainerMouseInteraction.h"
#include "views/DisplayRange.h"
#include "views/MessageView.h"
#include "views/FrameMapping.h"
#include "views/LayoutScheduler.h"
#include "views/SampleView.h"
#include "views/ViewRect.h"

namespace glimmet {

class Channel;
class ChannelManager;
class DocumentWindow;
class ZoomSlider;

/// The editing surface of a document window: one SampleView per channel,
/// stacked, with the zoom slider along the bottom edge. It lays out its
/// children and keeps the edit cursor and the play mark; the display range
/// and the frame mapping are a DisplayRange, the mouse a
/// ContainerMouseInteraction and the channel menu a ChannelContextMenu, to
/// which the operations below hand over.
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
    float PosAt(int64_t frame) const { return Display().PosAt(frame); }
    int64_t FirstFrameAt(float x) const { return Display().FirstFrameAt(x); }
    int64_t LastFrameAt(float x) const { return Display().LastFrameAt(x); }
    int64_t FrameAt(float x) const { return Display().FrameAt(x); }
    FrameMapping Mapping() const { return Display().Mapping(); }
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
    int64_t FirstDisplayedFrame() const { return display_.First(); }
    int64_t LastDisplayedFrame() const { return display_.Last(); }
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
    /// Re-renders the columns left .. right of view; null is ignored.
    void RedrawColumns(SampleView* view, float left, float right);
    /// The height the last layout gave the zoom slider.
    float ZoomSliderHeight() const { return zoomSliderHeight_; }

    /// Redraws every channel view.
    void UpdateAll();
    /// Repaints area (container coordinates), children included, together
    /// with every area asked for since the last paint, as one rectangle.
    void RepaintArea(const QRect& area);
    /// Views for added and removed channels; a redraw for changed data.
    void ObserverNotified(Observable* source, uint32_t mask, const Message* data) override;

    // Mouse interaction; points are in the coordinates named.
    /// A mouse-down in a sample view (view coordinates).
    void Clicked(SampleView* view, QPointF point, Qt::MouseButton button, Qt::KeyboardModifiers modifiers)
    {
        interaction_.Clicked(view, point, button, modifiers);
    }
    void DoubleClicked(SampleView* view, QPointF point, Qt::MouseButton button, Qt::KeyboardModifiers)
    {
        interaction_.DoubleClicked(view, point, button);
    }
    /// Pointer motion while a button is held (container coordinates).
    void MouseMoved(QPointF point) { interaction_.MouseMoved(point); }
    void MouseUp(QPointF) { interaction_.MouseUp(); }
    void StartDragging(SampleView* view, int64_t anchor) { interaction_.StartDragging(view, anchor); }
    void Dragging(SampleView* view, float x) { interaction_.Dragging(view, x); }
    void StopDragging() { interaction_.StopDragging(); }
    bool IsDragging() const { return interaction_.IsDragging(); }
    void StartMoving(SampleView* view, int64_t frame) { interaction_.StartMoving(view, frame); }
    void Moving(float x) { interaction_.Moving(x); }
    void StopMoving() { interaction_.StopMoving(); }
    bool IsMoving() const { return interaction_.IsMoving(); }
    /// Moves channel index by frames in one go, ending like a finished drag:
    /// the window records the move as an undoable action.
    void MoveChannel(int32_t index, int64_t frames) { interaction_.MoveChannel(index, frames); }
    /// The channel's context menu; it deletes itself when closed.
    QMenu* ContextMenuFor(Channel* channel) { return contextMenu_.MenuFor(channel); }
    int32_t ContextChannel() const { return contextMenu_.ContextChannel(); }
    /// The context menu of channel index as a secondary click would build
    /// it, without showing it; null when there is no such channel.
    QMenu* ContextMenuForChannel(int32_t index) { return contextMenu_.MenuForChannel(index); }
    /// The menu opened by the last secondary click, while it exists.
    QMenu* OpenContextMenu() const { return contextMenu_.OpenMenu(); }

    /// 'much', 'stcl', 'stcm', 'stcr' for the context channel; a bare
    /// 'smmd' (a sample view has drawn) re-allows a move redraw.
    void MessageReceived(const Message& message) override;

    QSize minimumSizeHint() const override;
    QSize sizeHint() const override;

protected:
    void paintEvent(QPaintEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;
    /// Scrolls and zooms through the zoom slider (WheelNavigator).
    void wheelEvent(QWheelEvent* event) override;

private:
    /// The display range over the current width. The widget's width changes
    /// before its resize event arrives (a hidden widget gets it only when
    /// shown), so the width is taken afresh at every use.
    const DisplayRange& Display() const;
    DisplayRange& Display();
    void LayoutChildren();
    /// Brings the display range and the zoom slider up to a frame count.
    void FollowFrameCount(int64_t count);
    void CheckZoomSlider(bool notify, int64_t count);
    void UpdateZoomSlider(int64_t count);
    /// The document's frame count with added just added (see the .cpp).
    int64_t FrameCountWith(Channel* added);
    /// The batch's layout pass: places every view once.
    void LayOutAfterChanges();
    void UpdateSizeLimits();
    void AddChannelAt(Channel* channel, int32_t index);
    void RemoveSampleViewAt(int32_t index);
    void InsertSampleView(SampleView* view, int32_t index);
    void RedrawMarkInAll(float x);

    std::vector<SampleView*> sampleViews_;  // children of this widget
    ZoomSlider* zoomSlider_;
    ChannelManager* manager_;
    DocumentWindow* window_;
    float zoomSliderHeight_ = 0;
    mutable DisplayRange display_;
    int64_t cursorFrame_ = 0;
    int64_t playmarkFrame_ = -1;
    ChannelContextMenu contextMenu_{*this};
    ContainerMouseInteraction interaction_{*this, contextMenu_};
    // Channels come and go in batches (a file's channels, a document
    // replaced); the views are placed once per batch, by layout_.
    LayoutScheduler layout_{[this] { LayOutAfterChanges(); }};
    int64_t burstCount_ = 0;
    bool burstCountKnown_ = false;
    // Channels were added since the slider was last told of the count.
    bool sliderCheckPending_ = false;
    int64_t layoutPasses_ = 0;  // LayoutChildren runs, to see one in a call
    QRect pendingRepaint_;  // RepaintArea's areas since the last paint
};

}  // namespace glimmet
