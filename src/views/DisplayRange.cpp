#include "views/DisplayRange.h"

#include <algorithm>
#include <cmath>

namespace glimmet {

int64_t DisplayRange::WholeColumns() const
{
    return int64_t(std::trunc(width_));
}

void DisplayRange::Set(int64_t first, int64_t last)
{
    first_ = first;
    last_ = last;
}

bool DisplayRange::SetWidened(int64_t first, int64_t last, int64_t frameCount)
{
    first_ = first;
    last_ = last;
    int64_t columns = WholeColumns() - 1;
    if (columns >= frameCount - 1)
        columns = frameCount - 1;
    // Never more than one column per frame.
    if (first + columns - 1 > last) {
        last_ = first + columns - 1;
        return true;
    }
    return false;
}

bool DisplayRange::ZoomTo(int64_t rangeStart, int64_t rangeEnd, int64_t frameCount)
{
    int64_t first = rangeStart;
    int64_t last = rangeEnd;
    if (first < -1 || last < -1 || first > frameCount || last > frameCount)
        return false;
    const int64_t columns = WholeColumns() - 1;
    if (last - first < columns) {
        const int64_t widening = (columns - (last - first)) / 2;
        const int64_t shortfall = first - widening < 0 ? widening - first : 0;
        first = std::max<int64_t>(first - widening, 0);
        last = last + widening + shortfall;
    }
    if (last > frameCount) {
        const int64_t excess = last - frameCount;
        first -= excess;
        last -= excess;
    }
    first_ = first;
    last_ = last;
    return true;
}

void DisplayRange::WidenToOneFramePerColumn(int64_t frameCount)
{
    if (frameCount <= 0)
        return;
    const int64_t n = WholeColumns() - 2;
    if (last_ - first_ < n)
        last_ = first_ + n - 1;
    const int64_t excess = last_ - frameCount + 1;
    if (excess > 0) {
        first_ -= excess;
        last_ -= excess;
    }
}

int64_t DisplayRange::SliderMinRange(int64_t frameCount) const
{
    return std::min(WholeColumns() - 1, frameCount - 1);
}

// These expressions are based on the width and not on the displayed span;
// they place the handles exactly where the slider has always put them.
DisplayRange::SliderFractions DisplayRange::SliderFractionsFor(int64_t frameCount) const
{
    const int64_t n = WholeColumns() - 2;
    if (last_ < frameCount - 1)
        return {float(first_) / float(frameCount - n), float(last_ - n) / float(frameCount - n)};
    return {float(first_) / float(last_ - n), float(last_ - n) / float(last_ - n)};
}

}  // namespace glimmet
