#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <memory>
#include <vector>

#include "CurveDialogFake.h"
#include "EffectReference.h"
#include "TestDocument.h"
#include "edit/CompressorAction.h"
#include "edit/DistortAction.h"
#include "edit/EnvelopeAction.h"
#include "edit/FilterAction.h"
#include "edit/HistoryManager.h"
#include "edit/effects/PeakDistortion.h"
#include "support/DiagnosticsCapture.h"
#include "sound/ChannelSamples.h"

namespace glimmet {
namespace {

using test::CurveDialogFake;
using test::CurveDialogLog;
using test::DocumentState;
using test::TestDocument;

using MakeCurveAction = std::function<std::unique_ptr<Action>(std::unique_ptr<CurveDialog>)>;

struct CurveActionCase {
    const char* name;
    MakeCurveAction make;
};

template <typename T>
MakeCurveAction Maker()
{
    return [](std::unique_ptr<CurveDialog> dialog) { return std::make_unique<T>(nullptr, std::move(dialog)); };
}

std::vector<CurveActionCase> AllCurveActions()
{
    return {{"FIR Filter", Maker<FilterAction>()}, {"Distortion", Maker<DistortAction>()},
        {"Peak Distort", Maker<CompressorAction>()}, {"Envelope", Maker<EnvelopeAction>()}};
}

/// A straight curve from (0, y0) to (1, y1), as the control's two end points
/// draw it.
double Line(double y0, double y1, double x)
{
    return test::ControlValue(x, [&](double t) { return y0 + (y1 - y0) * t; });
}

struct EffectDocument {
    TestDocument document;
    std::shared_ptr<CurveDialogLog> log = std::make_shared<CurveDialogLog>();
    CurveDialogFake* dialog = nullptr;
    HistoryManager history;

    /// Two selected channels around an unselected one, range 100..1099.
    EffectDocument()
    {
        document.AddChannel(test::EffectSamples(1, 1500), 0, true);
        document.AddChannel(test::EffectSamples(2, 1500), 0, false);
        document.AddChannel(test::EffectSamples(3, 1500), 20, true);
        document.SetRange(100, 1099);
    }

    std::unique_ptr<CurveDialog> Dialog(double y0, double y1, int32_t passes = 0)
    {
        auto fake = std::make_unique<CurveDialogFake>(log, std::vector<double>{0.0, 1.0},
            std::vector<double>{y0, y1}, passes);
        dialog = fake.get();
        return fake;
    }

    /// Binds, records and runs the action, as the window does on "Ok".
    Action* Run(std::unique_ptr<Action> owned)
    {
        Action* action = owned.get();
        EXPECT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
        EXPECT_EQ(history.AddAction(owned), B_OK);
        action->Go();
        return action;
    }

    std::vector<int16_t> Samples(int32_t channel) { return TestDocument::StateOf(document.manager.ChannelAt(channel)).samples; }
};

/// Applies sample to every frame of the range of channel in expected.
void MapRange(DocumentState& expected, int32_t channel, int64_t start, int64_t end,
    const std::function<int16_t(int16_t, int64_t)>& sample)
{
    test::ChannelState& state = expected.channels[size_t(channel)];
    for (int64_t frame = start; frame <= end; frame++) {
        const int64_t index = frame - state.first;
        if (index >= 0 && index < int64_t(state.samples.size()))
            state.samples[size_t(index)] = sample(state.samples[size_t(index)], frame - start);
    }
}

TEST(CurveActionTest, NamesMenusAndDialogs)
{
    for (const CurveActionCase& entry : AllCurveActions()) {
        auto log = std::make_shared<CurveDialogLog>();
        std::unique_ptr<Action> action = entry.make(std::make_unique<CurveDialogFake>(log,
            std::vector<double>{0.0, 1.0}, std::vector<double>{0.5, 0.5}));
        EXPECT_STREQ(action->Name(), entry.name);
        EXPECT_STREQ(action->PreferredMenu(), "Tools");
        EXPECT_TRUE(action->SupportsConfiguration());
        EXPECT_EQ(action->Go(), B_ERROR) << entry.name << " ran unbound";
        action.reset();
        EXPECT_EQ(log->quits, 1) << entry.name << " did not close its dialog";
        EXPECT_TRUE(log->destroyed);
    }
}

TEST(CurveActionTest, CurveActionsWithoutADialogRefuseToRun)
{
    for (const CurveActionCase& entry : AllCurveActions()) {
        if (std::string(entry.name) == "FIR Filter")
            continue;
        EffectDocument setup;
        const DocumentState before = setup.document.State();
        std::unique_ptr<Action> action = entry.make(nullptr);
        ASSERT_EQ(action->SetTo(&setup.document.manager, &setup.document.position), B_OK);
        EXPECT_EQ(action->Go(), B_ERROR) << entry.name;
        EXPECT_EQ(setup.document.State(), before) << entry.name;
    }
}

/// Distort of one sample through the straight curve from (0, y0) to (1, y1),
/// written out from the description.
int16_t ReferenceDistort(int16_t s, double y0, double y1)
{
    if (s < 0)
        return test::ReferenceOneSided((1.0 - Line(y0, y1, std::fabs(s / 32768.0))) * -32768.0);
    return test::ReferenceOneSided(32767.0 * (1.0 - Line(y0, y1, std::fabs(s / 32767.0))));
}

DocumentState DistortedRanges(DocumentState state, double y0, double y1)
{
    const auto distort = [=](int16_t s, int64_t) { return ReferenceDistort(s, y0, y1); };
    MapRange(state, 0, 100, 1099, distort);
    MapRange(state, 2, 100, 1099, distort);
    return state;
}

TEST(CurveActionTest, DistortMapsSelectedRangesThroughTheCurve)
{
    EffectDocument setup;
    const DocumentState expected = DistortedRanges(setup.document.State(), 0.2, 0.6);
    setup.Run(std::make_unique<DistortAction>(nullptr, setup.Dialog(0.2, 0.6)));
    EXPECT_EQ(setup.document.State(), expected);
    EXPECT_EQ(setup.log->hides, 1);
    EXPECT_EQ(setup.log->quits, 0) << "the dialog must stay for redo";
}

TEST(CurveActionTest, RedoReadsTheKeptDialogAgain)
{
    EffectDocument setup;
    const DocumentState before = setup.document.State();
    setup.Run(std::make_unique<DistortAction>(nullptr, setup.Dialog(0.2, 0.6)));
    ASSERT_EQ(setup.history.Undo(), B_OK);
    EXPECT_EQ(setup.document.State(), before);
    setup.dialog->SetKnots({0.0, 1.0}, {0.9, 0.1});
    ASSERT_EQ(setup.history.Redo(), B_OK);
    EXPECT_EQ(setup.document.State(), DistortedRanges(before, 0.9, 0.1));
    EXPECT_EQ(setup.log->hides, 1) << "an already hidden dialog is not hidden again";
    EXPECT_EQ(setup.log->locks, 2);
}

TEST(CurveActionTest, UnreadableDialogSilencesDistortAndEnvelope)
{
    for (bool envelope : {false, true}) {
        EffectDocument setup;
        DocumentState expected = setup.document.State();
        std::unique_ptr<CurveDialog> dialog = setup.Dialog(0.3, 0.3);
        setup.dialog->SetReadable(false);
        if (envelope)
            setup.Run(std::make_unique<EnvelopeAction>(nullptr, std::move(dialog)));
        else
            setup.Run(std::make_unique<DistortAction>(nullptr, std::move(dialog)));
        const auto silence = [](int16_t, int64_t) { return int16_t(0); };
        MapRange(expected, 0, 100, 1099, silence);
        MapRange(expected, 2, 100, 1099, silence);
        EXPECT_EQ(setup.document.State(), expected) << (envelope ? "Envelope" : "Distort");
        EXPECT_EQ(setup.log->hides, 0);
    }
}

TEST(CurveActionTest, UnreadableDialogLeavesPeakDistortRunsAlone)
{
    EffectDocument setup;
    const DocumentState before = setup.document.State();
    std::unique_ptr<CurveDialog> dialog = setup.Dialog(0.9, 0.0);
    setup.dialog->SetReadable(false);
    setup.Run(std::make_unique<CompressorAction>(nullptr, std::move(dialog)));
    EXPECT_EQ(setup.document.State(), before);
}

TEST(CurveActionTest, PeakDistortScalesEachRunsPeak)
{
    EffectDocument setup;
    Channel& first = *setup.document.manager.ChannelAt(0);
    test::SetSampleAt(first, 100, 1000);
    test::SetSampleAt(first, 101, 2000);
    test::SetSampleAt(first, 102, 1000);
    test::SetSampleAt(first, 103, -7);
    DocumentState expected = setup.document.State();
    setup.Run(std::make_unique<CompressorAction>(nullptr, setup.Dialog(0.5, 0.5)));
    // The first run's peak 2000 goes to half of full scale: gain
    // (1 - 0.5) / (2000 / 32767), applied to the run and the sample after it.
    const double gain = double(float(0.5)) / (2000.0 / 32767.0);
    EXPECT_EQ(setup.Samples(0)[100], test::ReferenceLow16(gain * 1000));
    EXPECT_EQ(setup.Samples(0)[101], test::ReferenceLow16(gain * 2000));
    EXPECT_EQ(setup.Samples(0)[103], test::ReferenceLow16(gain * -7));
    // Beyond that, every selected range is what the arithmetic gives.
    for (int32_t channel : {0, 2}) {
        std::vector<int16_t> range(expected.channels[size_t(channel)].samples.begin() + 100
                - expected.channels[size_t(channel)].first,
            expected.channels[size_t(channel)].samples.begin() + 1100 - expected.channels[size_t(channel)].first);
        effects::PeakDistort(range, [](double x) { return Line(0.5, 0.5, x); });
        MapRange(expected, channel, 100, 1099, [&](int16_t, int64_t i) { return range[size_t(i)]; });
    }
    EXPECT_EQ(setup.document.State(), expected);
}

TEST(CurveActionTest, UntouchedEnvelopeLeavesTheDataAlone)
{
    EffectDocument setup;
    const DocumentState before = setup.document.State();
    setup.Run(std::make_unique<EnvelopeAction>(nullptr, setup.Dialog(0.75, 0.75)));
    EXPECT_EQ(setup.document.State(), before);
    EXPECT_EQ(setup.log->hides, 1);
}

TEST(CurveActionTest, EnvelopeFollowsTheSelection)
{
    EffectDocument setup;
    test::SetSampleAt(*setup.document.manager.ChannelAt(0), 100, -10000);
    DocumentState expected = setup.document.State();
    setup.Run(std::make_unique<EnvelopeAction>(nullptr, setup.Dialog(0.0, 1.0)));
    // 400 % at the first frame: -10000 becomes -40000, stored as 32767.
    EXPECT_EQ(setup.Samples(0)[100], 32767);
    const auto envelope = [](int16_t s, int64_t i) {
        return test::ReferenceOneSided((1.0 - Line(0.0, 1.0, double(i) / 1000.0)) * 4.0 * s);
    };
    MapRange(expected, 0, 100, 1099, envelope);
    MapRange(expected, 2, 100, 1099, envelope);
    EXPECT_EQ(setup.document.State(), expected);
}

/// The causal FIR of the description, written out: running clamp after
/// every term, history before the range from the channel's timeline.
std::vector<int16_t> ReferenceFir(const std::vector<int16_t>& timeline, int64_t first, int64_t start, int64_t count,
    const std::vector<double>& kernel)
{
    const auto at = [&](int64_t frame) -> double {
        const int64_t index = frame - first;
        return index >= 0 && index < int64_t(timeline.size()) ? timeline[size_t(index)] : 0.0;
    };
    std::vector<int16_t> out;
    for (int64_t i = 0; i < count; i++) {
        int64_t acc = test::ReferenceInt32(kernel[0] * at(start + i));
        for (size_t k = 1; k < kernel.size(); k++)
            acc = std::clamp<int64_t>(acc + test::ReferenceInt32(kernel[k] * at(start + i - int64_t(k))), -32768, 32767);
        out.push_back(int16_t(acc));
    }
    return out;
}

TEST(CurveActionTest, FirWithAFlatZeroCurveSumsTenFrames)
{
    EffectDocument setup;
    // A range at the very start: the history is the silence before frame 0.
    setup.document.manager.ChannelAt(2)->SetStartFrameOffset(0);
    setup.document.SetRange(0, 1099);
    DocumentState expected = setup.document.State();
    FilterAction* action = static_cast<FilterAction*>(
        setup.Run(std::make_unique<FilterAction>(nullptr, setup.Dialog(0.0, 0.0, 10))));
    EXPECT_EQ(action->Kernel(), std::vector<double>(10, 1.0));
    for (int32_t channel : {0, 2}) {
        const test::ChannelState& state = expected.channels[size_t(channel)];
        const std::vector<int16_t> filtered = ReferenceFir(state.samples, state.first, 0, 1100, std::vector<double>(10, 1.0));
        MapRange(expected, channel, 0, 1099, [&](int16_t, int64_t i) { return filtered[size_t(i)]; });
    }
    EXPECT_EQ(setup.document.State(), expected);
    EXPECT_EQ(setup.log->quits, 1);
    EXPECT_TRUE(setup.log->destroyed) << "the first run closes the FIR dialog";
}

TEST(CurveActionTest, FirTakesItsHistoryFromBeforeTheRangeAndRedoKeepsTheKernel)
{
    EffectDocument setup;
    DocumentState expected = setup.document.State();
    const DocumentState before = expected;
    FilterAction* action = static_cast<FilterAction*>(
        setup.Run(std::make_unique<FilterAction>(nullptr, setup.Dialog(0.1, 0.9, 7))));
    std::vector<double> kernel;
    for (int i = 0; i < 7; i++)
        kernel.push_back(1.0 - Line(0.1, 0.9, i / 7.0));
    EXPECT_EQ(action->Kernel(), kernel);
    for (int32_t channel : {0, 2}) {
        const test::ChannelState& state = expected.channels[size_t(channel)];
        const std::vector<int16_t> filtered = ReferenceFir(state.samples, state.first, 100, 1000, kernel);
        MapRange(expected, channel, 100, 1099, [&](int16_t, int64_t i) { return filtered[size_t(i)]; });
    }
    EXPECT_EQ(setup.document.State(), expected);
    ASSERT_EQ(setup.history.Undo(), B_OK);
    EXPECT_EQ(setup.document.State(), before);
    ASSERT_EQ(setup.history.Redo(), B_OK);
    EXPECT_EQ(setup.document.State(), expected);
}

TEST(CurveActionTest, FirOfOneTapIsAClampedGain)
{
    EffectDocument setup;
    DocumentState expected = setup.document.State();
    setup.Run(std::make_unique<FilterAction>(nullptr, setup.Dialog(-1.5, 0.0, 1)));
    const auto gain = [](int16_t s, int64_t) {
        return int16_t(std::clamp<int64_t>(test::ReferenceInt32(2.5 * s), -32768, 32767));
    };
    MapRange(expected, 0, 100, 1099, gain);
    MapRange(expected, 2, 100, 1099, gain);
    EXPECT_EQ(setup.document.State(), expected);
}

TEST(CurveActionTest, FirWithoutTapsLeavesTheChannelsAlone)
{
    for (int32_t passes : {0, -3, FilterAction::kMaxTaps + 1}) {
        EffectDocument setup;
        const DocumentState before = setup.document.State();
        DiagnosticsCapture output;
        setup.Run(std::make_unique<FilterAction>(nullptr, setup.Dialog(0.0, 0.0, passes)));
        EXPECT_EQ(setup.document.State(), before) << passes;
        EXPECT_EQ(output.Text().empty(), passes <= 0) << output.Text();
        EXPECT_EQ(setup.log->quits, 1);
    }
}

TEST(CurveActionTest, FirWhoseDialogCannotBeReadFiltersLater)
{
    EffectDocument setup;
    const DocumentState before = setup.document.State();
    std::unique_ptr<Action> owned = std::make_unique<FilterAction>(nullptr, setup.Dialog(0.0, 0.0, 3));
    FilterAction* action = static_cast<FilterAction*>(owned.get());
    ASSERT_EQ(action->SetTo(&setup.document.manager, &setup.document.position), B_OK);
    setup.dialog->SetReadable(false);
    EXPECT_EQ(action->Go(), B_OK);
    EXPECT_EQ(setup.document.State(), before);
    EXPECT_EQ(setup.log->quits, 0) << "an unread dialog stays open";
    setup.dialog->SetReadable(true);
    action->Go();
    EXPECT_EQ(action->Kernel(), std::vector<double>(3, 1.0));
    EXPECT_NE(setup.document.State(), before);
}

}  // namespace
}  // namespace glimmet
