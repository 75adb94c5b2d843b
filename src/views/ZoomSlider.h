#pragma once

#include <cstdint>

#include <QImage>
#include <QPointF>

#include "views/MessageView.h"

class QTimer;

namespace glimmet {

/// The horizontal control under the channels that shows and sets which part
/// of the document is on display: a bar between two handles over a groove.
/// Dragging a handle zooms, dragging the bar scrolls, a click beside the bar
/// pages and holding the button there repeats the paging.
///
/// The slider works on two fractions, left <= right in [0, 1], and turns them
/// into frames only for its notification 'stdr' ("when", "source", "first
/// frame", "last frame") to the target. After posting it waits to be
/// re-armed (a mouse-down, a 'dprs', or SetPostMessage(true)).
///
/// GUI thread only.
class ZoomSlider : public MessageView {
    Q_OBJECT

public:
    enum DragMode : int32_t { kDragLeft = 0, kDragRight = 1, kDragBar = 2, kDragNone = 3 };

    /// The target (the document window) is not owned and may be null.
    ZoomSlider(MessageTarget* target, int64_t low, int64_t high, int64_t minRange, QWidget* parent = nullptr);
    ~ZoomSlider() override;

    /// Accepted when v >= 0 and high - v >= the minimum range; else prints
    /// an error line to standard output and keeps the old value.
    void SetLowValue(int64_t value, bool notify);
    /// Accepted when v >= low + the minimum range; else prints an error line.
    void SetHighValue(int64_t value, bool notify);
    /// Accepted when r <= high - low; else prints an error line. Never notifies.
    void SetMinRange(int64_t range);
    /// Stores a changed fraction and repaints; no clamping.
    void SetLeft(float left, bool notify);
    void SetRight(float right, bool notify);
    /// Stores both when either changed, repaints and notifies.
    void SetBoth(float left, float right);
    /// Arms or disarms the notification.
    void SetPostMessage(bool armed);
    /// Posts 'stdr' with the frames of the handles when armed; disarms.
    void SendMessage();

    int64_t LowValue() const { return low_; }
    int64_t HighValue() const { return high_; }
    int64_t MinRange() const { return minRange_; }
    float Left() const { return left_; }
    float Right() const { return right_; }
    int32_t Mode() const { return dragMode_; }
    bool IsArmed() const { return armed_; }
    /// The frames the handles stand for.
    int64_t FirstFrame() const;
    int64_t LastFrame() const;
    /// True while a paging click is held (the first delay or the repeats).
    bool IsAutoRepeating() const;

    /// Geometry in pixels: the handles' travel and the inner edges of the
    /// left and right handle.
    float Track() const;
    float LeftEdge() const;
    float RightEdge() const;

    /// Places the slider, then rebuilds the bitmap for the new size.
    ViewRect Layout(const ViewRect& frame);
    /// Replaces the off-screen bitmap by one of (0, 0, width, height).
    void FrameResized(float width, float height);
    /// Draws the slider into its off-screen bitmap and returns it.
    const QImage& Render();

    /// 'ftck' and 'tick' drive the auto-repeat; 'dprs' re-arms.
    void MessageReceived(const Message& message) override;

    QSize minimumSizeHint() const override;
    QSize sizeHint() const override;

protected:
    void paintEvent(QPaintEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;
    void mouseMoveEvent(QMouseEvent* event) override;
    void mouseReleaseEvent(QMouseEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;

private:
    void MouseDown(QPointF point);
    void MouseMoved(QPointF point);
    void MouseUp();
    float PageStep() const;
    bool PageLeft();
    bool PageRight();
    void StartAutoRepeat();
    void StopAutoRepeat();
    void Tick();
    void DrawFrame();
    void DrawHandles();

    bool armed_ = true;
    /// Times the slider told the window its frames again since a handle
    /// last moved. Bounded: where the window cannot show exactly the frames
    /// the handles stand for (a timeline too long for the handles' float
    /// precision), telling it again would never end.
    int32_t resends_ = 0;
    static const int32_t kMaxResends;
    int32_t dragMode_ = kDragNone;
    bool enabled_ = true;
    int64_t low_;
    int64_t high_;
    int64_t minRange_;
    float left_ = 0.0f;
    float right_ = 1.0f;
    float grabOffset_ = 0.0f;
    QImage bitmap_;
    MessageTarget* target_;
    QTimer* repeatTimer_;  // child of this widget
    bool repeating_ = false;  // from a paging click until the button comes up
    QPointF pointer_;      // last pointer position seen while a button is held
    bool inLayout_ = false;
};

}  // namespace glimmet
