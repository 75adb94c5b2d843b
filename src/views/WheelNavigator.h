#pragma once

#include <cstdint>

#include <QPoint>
#include <QPointF>

namespace glimmet {

class ChannelContainerView;

/// Turns wheel and touchpad input over the channel views into moves of the
/// zoom slider's handles. The slider's notification then changes the display
/// range through the window, exactly as a drag of the handles or the bar
/// does, so the handles, the display range and the window never disagree.
///
/// - Vertical and horizontal wheels scroll; a notch (120 units of angle)
///   moves the view by a tenth of the frames on display. Wheel down or to
///   the right moves towards the end of the document.
/// - Touchpad pixel deltas scroll the waveform along with the fingers:
///   one pixel moves one column's worth of frames.
/// - Ctrl with the wheel zooms around the frame under the pointer: a notch
///   up shows 0.8 times the frames, a notch down 1.25 times.
///
/// Nothing moves past either end of the document, and zooming in stops at
/// the slider's minimum range (one frame per column).
///
/// Holds no state between events, so partial notches of fine-grained wheels
/// simply move by their share. GUI thread only.
class WheelNavigator {
public:
    /// Angle units of one wheel notch.
    static constexpr int kNotch = 120;
    /// Share of the frames on display that one notch scrolls by.
    static constexpr double kScrollPerNotch = 0.1;
    /// Factor the frames on display take per notch of zooming in.
    static constexpr double kZoomInPerNotch = 0.8;

    explicit WheelNavigator(ChannelContainerView& container) : container_(container) {}

    /// One wheel event at position (container coordinates). angleDelta is in
    /// eighths of a degree, pixelDelta is what a touchpad reports (null for
    /// a wheel); ctrl asks for zoom. False when nothing was there to move
    /// (no slider, a document no wider than the view, no delta).
    bool Wheel(QPointF position, QPoint angleDelta, QPoint pixelDelta, bool ctrl);

    /// Scrolls by frames (positive towards the end), clamped to the document.
    bool ScrollBy(int64_t frames);
    /// Zooms by notches (positive zooms in) keeping the frame under the
    /// column x where it is.
    bool ZoomAt(float x, double notches);

    /// The fraction f of the slider's travel with trunc(travel * f) equal to
    /// offset as the slider computes it, or as close as a float allows.
    static float FractionFor(int64_t offset, int64_t travel);

private:
    /// Moves the handles so that the slider stands for span frames from
    /// first on, and lets it notify. False when the handles stay.
    bool MoveHandlesTo(int64_t first, int64_t span);
    /// Frames one pixel column shows at the current display range.
    double FramesPerColumn() const;

    ChannelContainerView& container_;
};

}  // namespace glimmet
