#pragma once

#include <vector>

#include <gtest/gtest.h>

#include "ViewFixture.h"
#include "WaveformReference.h"

namespace glimmet::test {

/// The reference case for view index as the container shows it now.
inline WaveformCase CaseFor(const ViewFixture& fixture, int index, const std::vector<int16_t>& samples)
{
    SampleView* view = fixture.View(index);
    WaveformCase c;
    c.samples = samples;
    c.channelFirst = view->GetChannel()->FirstFrame();
    c.first = fixture.container->FirstDisplayedFrame();
    c.last = fixture.container->LastDisplayedFrame();
    c.rangeStart = fixture.manager.RangeStart();
    c.rangeEnd = fixture.manager.RangeEnd();
    c.cursor = fixture.container->CursorFrame();
    c.playmark = fixture.container->PlaymarkFrame();
    c.selected = view->GetChannel()->IsSelected();
    c.width = view->width();
    c.height = view->height();
    return c;
}

/// View index's picture equals a full render of samples from the reference.
inline void ExpectRendered(const ViewFixture& fixture, int index, const std::vector<int16_t>& samples)
{
    const QImage expected = ReferenceWaveform(CaseFor(fixture, index, samples));
    EXPECT_EQ(FirstDifference(fixture.View(index)->Bitmap(), expected), "");
}

}  // namespace glimmet::test
