#pragma once

#include <vector>

#include "views/ViewRect.h"

class QWidget;

namespace glimmet {

class SampleView;

/// Places a container's sample views one under the other, sharing the
/// container's height above the zoom slider evenly, with two pixels of frame
/// between neighbours.
class ViewStack {
public:
    /// Lays out views inside container, whose bounds they fill but for
    /// sliderHeight at the bottom; returns the bottom of the last view (0
    /// with none).
    static float Place(QWidget& container, const std::vector<SampleView*>& views, const ViewRect& bounds,
                       float sliderHeight);
    /// The height the views need at least, each with frameAllowance.
    static int MinimumHeight(const std::vector<SampleView*>& views, int frameAllowance);
};

}  // namespace glimmet
