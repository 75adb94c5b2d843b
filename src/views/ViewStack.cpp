#include "views/ViewStack.h"

#include <QWidget>

#include "views/SampleView.h"

namespace glimmet {

float ViewStack::Place(QWidget& container, const std::vector<SampleView*>& views, const ViewRect& bounds,
                       float sliderHeight)
{
    const float count = float(views.size());
    const float channelHeight = (bounds.Height() - sliderHeight - 2 * count) / count;
    // Every view is repainted whole after a layout anyway; with updates off
    // while they are placed, Qt does not gather each moved view's old and
    // new area into one ever larger dirty region, which costs the square of
    // the channel count.
    const bool updatesWereEnabled = container.updatesEnabled();
    if (updatesWereEnabled)
        container.setUpdatesEnabled(false);
    float previousBottom = 0;
    for (size_t i = 0; i < views.size(); ++i) {
        const float top = i == 0 ? 1 : previousBottom + 3;
        const float bottom = i == 0 ? channelHeight : previousBottom + 3 + channelHeight;
        previousBottom = views[i]->Layout({1, top, bounds.right - 1, bottom}).bottom;
    }
    if (updatesWereEnabled)
        container.setUpdatesEnabled(true);
    return previousBottom;
}

int ViewStack::MinimumHeight(const std::vector<SampleView*>& views, int frameAllowance)
{
    int height = 0;
    for (const SampleView* view : views)
        height += view->minimumSizeHint().height() + frameAllowance;
    return height;
}

}  // namespace glimmet
