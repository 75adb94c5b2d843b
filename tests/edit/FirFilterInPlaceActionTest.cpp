#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <vector>

#include "CurveDialogFake.h"
#include "EffectReference.h"
#include "TestDocument.h"
#include "edit/FilterAction.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet {
namespace {

using test::CurveDialogFake;
using test::CurveDialogLog;
using test::TestDocument;

// Where a channel lies and which range is filtered.
struct Geometry {
    int64_t first;
    size_t frames;
    int64_t start;
    int64_t end;
};

// The channel's state after "FIR Filter" over the geometry. With `forceCopy`
// a selected channel without data comes after it, so the action takes its
// working buffers instead of filtering in place; the first channel's result
// must be the same either way. An unselected channel spans the range in both
// documents, so the range is not cut to the first channel's data.
test::ChannelState Filtered(const Geometry& g, int32_t taps, bool forceCopy)
{
    DiagnosticsCapture quiet;
    TestDocument document;
    document.AddChannel(test::EffectSamples(81, g.frames), g.first, true);
    const int64_t from = std::min(g.first, g.start) - 100;
    document.AddChannel(std::vector<int16_t>(size_t(g.end + 100 - from), 7), from, false);
    if (forceCopy)
        document.AddChannel({}, 0, true);
    document.SetRange(g.start, g.end);
    EXPECT_EQ(document.manager.RangeStart(), g.start);
    EXPECT_EQ(document.manager.RangeEnd(), g.end);
    auto log = std::make_shared<CurveDialogLog>();
    // A curve that dips below 0 and rises above 1, so coefficients of both
    // signs and sums that saturate occur.
    auto dialog = std::make_unique<CurveDialogFake>(log, std::vector<double>{0.0, 0.3, 0.6, 1.0},
        std::vector<double>{-0.8, 1.4, 0.2, 0.9}, taps);
    FilterAction action(nullptr, std::move(dialog));
    EXPECT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    EXPECT_EQ(action.Go(), B_OK);
    return TestDocument::StateOf(document.manager.ChannelAt(0));
}

TEST(FirFilterInPlaceActionTest, FilteringInPlaceGivesWhatTheWorkingBuffersGive)
{
    const std::vector<Geometry> geometries = {
        {0, 6000, 0, 5999},      // the whole channel, history before its first frame
        {0, 6000, 3, 4000},      // history partly before the first frame
        {20, 6000, 20, 3020},    // starting on a first frame other than 0
        {20, 6000, 500, 6019},   // ending on the last frame
        {-50, 6000, 0, 2500},    // history from frames before 0
        {-50, 6000, -10, 2500},  // a range starting before frame 0
        {0, 6000, 0, 0},         // one frame on the first frame, read as silence
        {0, 6000, 1, 1},         // one frame after it
        {100, 3000, 50, 2000},   // a range starting before the data
        {0, 3000, 2000, 3500},   // a range running past the data
    };
    for (const Geometry& g : geometries) {
        for (int32_t taps : {1, 2, 10, 33}) {
            EXPECT_EQ(Filtered(g, taps, false), Filtered(g, taps, true))
                << "first " << g.first << ", range " << g.start << ".." << g.end << ", " << taps << " taps";
        }
    }
}

}  // namespace
}  // namespace glimmet
