#include "views/WheelNavigator.h"

#include <algorithm>
#include <cmath>

#include "views/ChannelContainerView.h"
#include "views/FrameMapping.h"
#include "views/ZoomSlider.h"

namespace glimmet {

namespace {

/// A float nudge is one ulp; a handful of them always reaches the nearest
/// fraction the slider can tell apart, this only bounds the search.
constexpr int kMaxNudges = 64;

int64_t SliderOffset(float fraction, int64_t travel)
{
    // The very product the slider truncates when it turns a handle into a
    // frame.
    return TruncateToFrame(float(travel) * fraction);
}

}  // namespace

bool WheelNavigator::Wheel(QPointF position, QPoint angleDelta, QPoint pixelDelta, bool ctrl)
{
    if (ctrl) {
        // A touchpad pinch arrives elsewhere; Ctrl with a wheel zooms by its
        // vertical notches, or the horizontal ones of a tilt wheel.
        const int delta = angleDelta.y() != 0 ? angleDelta.y() : angleDelta.x();
        if (delta == 0)
            return false;
        return ZoomAt(float(position.x()), double(delta) / kNotch);
    }
    if (!pixelDelta.isNull()) {
        // The content follows the fingers: moving them left shows later
        // frames.
        const int pixels = pixelDelta.x() != 0 ? pixelDelta.x() : pixelDelta.y();
        return ScrollBy(std::llround(-double(pixels) * FramesPerColumn()));
    }
    const int delta = angleDelta.y() != 0 ? angleDelta.y() : angleDelta.x();
    if (delta == 0)
        return false;
    const ZoomSlider* slider = container_.GetZoomSlider();
    if (slider == nullptr)
        return false;
    const double span = double(slider->LastFrame() - slider->FirstFrame() + 1);
    const double frames = -double(delta) / kNotch * kScrollPerNotch * span;
    // However far out the view is zoomed, a notch moves at least one frame.
    int64_t step = std::llround(frames);
    if (step == 0)
        step = frames > 0 ? 1 : -1;
    return ScrollBy(step);
}

bool WheelNavigator::ScrollBy(int64_t frames)
{
    const ZoomSlider* slider = container_.GetZoomSlider();
    if (slider == nullptr || frames == 0)
        return false;
    // From where the handles stand, not from what is drawn: a notch that
    // comes before the window has applied the previous one adds to it.
    const int64_t first = slider->FirstFrame();
    const int64_t span = slider->LastFrame() - first + 1;
    const int64_t lastStart = slider->HighValue() - span + 1;
    const int64_t moved = std::clamp(first + frames, slider->LowValue(), std::max(slider->LowValue(), lastStart));
    return MoveHandlesTo(moved, span);
}

bool WheelNavigator::ZoomAt(float x, double notches)
{
    const ZoomSlider* slider = container_.GetZoomSlider();
    if (slider == nullptr || notches == 0.0 || !std::isfinite(notches))
        return false;
    const int64_t first = slider->FirstFrame();
    const int64_t last = slider->LastFrame();
    if (last <= first)
        return false;
    const int64_t span = last - first + 1;
    const int64_t whole = slider->HighValue() - slider->LowValue() + 1;
    const double scaled = double(span) * std::pow(kZoomInPerNotch, notches);
    const int64_t newSpan = std::clamp(int64_t(std::llround(std::clamp(scaled, 1.0, double(whole)))),
        std::min(slider->MinRange(), whole), whole);
    if (newSpan == span)
        return false;

    // The frame under the pointer keeps its share of the view's width.
    const FrameMapping mapping(container_.Bounds().Width(), first, last);
    const int64_t anchor = mapping.FrameAt(x);
    const double share = double(anchor - first) / double(span);
    const int64_t wanted = anchor - std::llround(share * double(newSpan));
    const int64_t lastStart = slider->HighValue() - newSpan + 1;
    const int64_t newFirst = std::clamp(wanted, slider->LowValue(), std::max(slider->LowValue(), lastStart));
    return MoveHandlesTo(newFirst, newSpan);
}

float WheelNavigator::FractionFor(int64_t offset, int64_t travel)
{
    if (travel <= 0 || offset <= 0)
        return 0.0f;
    if (offset >= travel)
        return 1.0f;
    float fraction = float(double(offset) / double(travel));
    for (int nudge = 0; nudge < kMaxNudges && SliderOffset(fraction, travel) < offset && fraction < 1.0f; ++nudge)
        fraction = std::nextafter(fraction, 2.0f);
    for (int nudge = 0; nudge < kMaxNudges && SliderOffset(fraction, travel) > offset && fraction > 0.0f; ++nudge)
        fraction = std::nextafter(fraction, -1.0f);
    return std::clamp(fraction, 0.0f, 1.0f);
}

bool WheelNavigator::MoveHandlesTo(int64_t first, int64_t span)
{
    ZoomSlider* slider = container_.GetZoomSlider();
    if (slider == nullptr)
        return false;
    const int64_t low = slider->LowValue();
    const int64_t travel = slider->HighValue() - low - slider->MinRange() + 1;
    if (travel <= 0)
        return false;
    span = std::max(span, slider->MinRange());
    const float left = FractionFor(first - low, travel);
    const float right = std::max(left, FractionFor(first + span - low - slider->MinRange(), travel));
    if (left == slider->Left() && right == slider->Right())
        return false;
    // Each notch is a gesture of its own, as each press on the slider is.
    slider->SetPostMessage(true);
    slider->SetBoth(left, right);
    return true;
}

double WheelNavigator::FramesPerColumn() const
{
    const ZoomSlider* slider = container_.GetZoomSlider();
    const double columns = double(container_.Bounds().Width()) - 1.0;
    if (slider == nullptr || columns <= 0.0)
        return 0.0;
    return double(slider->LastFrame() - slider->FirstFrame() + 1) / columns;
}

}  // namespace glimmet
