#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <vector>

#include "CurveDialogFake.h"
#include "EffectReference.h"
#include "TestDocument.h"
#include "edit/EnvelopeAction.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet {
namespace {

using test::CurveDialogFake;
using test::CurveDialogLog;
using test::TestDocument;

// Two selected channels and the range to shape.
struct Geometry {
    int64_t firstA;
    int64_t firstB;
    size_t frames;
    int64_t start;
    int64_t end;
};

// The two channels' states after "Envelope". With `forceBuffer` a selected
// channel without data comes after them, so the action goes through the
// working buffer channel by channel instead of shaping the channels side by
// side; their results must be the same either way. An unselected channel
// spans the range in both documents, so the range is not cut to the data.
std::vector<test::ChannelState> Shaped(const Geometry& g, bool forceBuffer)
{
    DiagnosticsCapture quiet;
    TestDocument document;
    document.AddChannel(test::EffectSamples(91, g.frames), g.firstA, true);
    document.AddChannel(test::EffectSamples(92, g.frames), g.firstB, true);
    const int64_t from = std::min({g.firstA, g.firstB, g.start}) - 100;
    document.AddChannel(std::vector<int16_t>(size_t(g.end + 100 - from), 7), from, false);
    if (forceBuffer)
        document.AddChannel({}, 0, true);
    document.SetRange(g.start, g.end);
    EXPECT_EQ(document.manager.RangeStart(), g.start);
    EXPECT_EQ(document.manager.RangeEnd(), g.end);
    auto log = std::make_shared<CurveDialogLog>();
    auto dialog = std::make_unique<CurveDialogFake>(log, std::vector<double>{0.0, 0.2, 0.5, 0.8, 1.0},
        std::vector<double>{0.75, -0.4, 1.3, 0.1, 0.9});
    EnvelopeAction action(nullptr, std::move(dialog));
    EXPECT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    EXPECT_EQ(action.Go(), B_OK);
    return {TestDocument::StateOf(document.manager.ChannelAt(0)), TestDocument::StateOf(document.manager.ChannelAt(1))};
}

TEST(EnvelopeInPlaceActionTest, ShapingChannelsTogetherGivesWhatTheWorkingBufferGives)
{
    const std::vector<Geometry> geometries = {
        {0, 0, 6000, 0, 5999},      // both whole channels
        {0, 20, 6000, 20, 4000},    // channels starting apart
        {0, 0, 6000, 3000, 3000},   // a single frame
        {0, 3000, 6000, 100, 5000}, // the second channel does not hold the range
        {-50, 0, 6000, 0, 2049},    // frames before 0
    };
    for (const Geometry& g : geometries) {
        EXPECT_EQ(Shaped(g, false), Shaped(g, true)) << "range " << g.start << ".." << g.end;
    }
}

}  // namespace
}  // namespace glimmet
