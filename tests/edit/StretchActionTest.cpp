#include <gtest/gtest.h>

#include <cmath>
#include <memory>
#include <vector>

#include "StretchDialogFake.h"
#include "TestDocument.h"
#include "edit/HistoryManager.h"
#include "edit/StretchAction.h"
#include "edit/vocoder/VocoderState.h"
#include "edit/vocoder/VocoderStretch.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet {
namespace {

using test::DocumentState;
using test::StretchDialogFake;
using test::StretchDialogLog;
using test::TestDocument;

std::vector<int16_t> Tone(size_t count, double frequency)
{
    std::vector<int16_t> samples(count);
    for (size_t i = 0; i < count; i++)
        samples[i] = int16_t(std::lround(9000.0 * std::sin(2 * M_PI * frequency * double(i) / 44100.0)));
    return samples;
}

// The stretched samples of one range, from the vocoder's own entry point
// and the conversions written out here.
std::vector<int16_t> ExpectedStretch(const std::vector<int16_t>& range, const StretchParameters& p)
{
    std::vector<float> input(range.size());
    for (size_t i = 0; i < range.size(); i++)
        input[i] = float(range[i]) / 32768.0f;
    const int64_t length = int64_t(float(int64_t(range.size())) * p.stretch);
    std::vector<float> output(size_t(length + 1), 0.0f);
    VocoderStretch::Stretch(input.data(), int64_t(input.size()), output.data(), length + 1, p.fftLength,
        p.windowSize, p.interpolation, float(p.decimation), p.stretch, p.pitch);
    std::vector<int16_t> samples(static_cast<size_t>(length));
    for (size_t i = 0; i < samples.size(); i++)
        samples[i] = int16_t(uint16_t(int64_t(output[i] * 32767.0f) & 0xFFFF));
    return samples;
}

class StretchActionTest : public ::testing::Test {
protected:
    void SetUp() override { VocoderState::Shared().Reset(); }
    void TearDown() override { VocoderState::Shared().Reset(); }

    StretchAction* Make(const StretchParameters& values, bool lockable = true)
    {
        owned_ = std::make_unique<StretchAction>(nullptr, std::make_unique<StretchDialogFake>(log, values, lockable));
        return static_cast<StretchAction*>(owned_.get());
    }

    /// Binds, records and runs the action as the window does on "Ok".
    status_t Run(StretchAction* action)
    {
        EXPECT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
        EXPECT_EQ(history.AddAction(owned_), B_OK);
        DiagnosticsCapture out(Diagnostics::Channel::Output), err(Diagnostics::Channel::Error);
        const status_t status = action->Go();
        printed = out.Finish();
        errors = err.Finish();
        return status;
    }

    std::vector<int16_t> Samples(int32_t channel)
    {
        return TestDocument::StateOf(document.manager.ChannelAt(channel)).samples;
    }

    TestDocument document;
    HistoryManager history;
    std::shared_ptr<StretchDialogLog> log = std::make_shared<StretchDialogLog>();
    std::unique_ptr<Action> owned_;
    std::string printed;
    std::string errors;
};

TEST_F(StretchActionTest, NameMenuAndDialog)
{
    StretchAction* action = Make(test::DefaultStretchParameters());
    EXPECT_STREQ(action->Name(), "Time Stretch");
    EXPECT_STREQ(action->PreferredMenu(), "Tools");
    EXPECT_TRUE(action->SupportsConfiguration());
    EXPECT_EQ(action->InitCheck(), B_NO_INIT);
}

TEST_F(StretchActionTest, AShortRangeBecomesSilenceOfTheStretchedLength)
{
    document.AddChannel(Tone(2000, 440.0));
    document.SetRange(100, 599);
    StretchAction* action = Make(test::DefaultStretchParameters());
    EXPECT_EQ(Run(action), B_OK);
    EXPECT_EQ(printed, "StretchAction::Stretch()\nstretch on buffer[0] done!\n");
    EXPECT_EQ(errors, "STRETCH DONE\n");
    std::vector<int16_t> expected = Tone(2000, 440.0);
    expected.erase(expected.begin() + 100, expected.begin() + 600);
    expected.insert(expected.begin() + 100, 1000, int16_t(0));
    EXPECT_EQ(Samples(0), expected);
    EXPECT_EQ(log->reads, 1);
    EXPECT_TRUE(log->quit);
    EXPECT_EQ(action->InitCheck(), B_ERROR);
    EXPECT_EQ(action->Go(), B_NO_INIT);
}

TEST_F(StretchActionTest, AFactorOfZeroWritesNothing)
{
    document.AddChannel(Tone(60000, 440.0));
    document.SetRange(0, 59999);
    const DocumentState before = document.State();
    StretchParameters values = test::DefaultStretchParameters();
    values.stretch = 0.0f;
    EXPECT_EQ(Run(Make(values)), B_ERROR);
    EXPECT_EQ(printed, "StretchAction::Stretch()\nError during time stretch!\n");
    EXPECT_EQ(errors, "0.0 not a legal stretch factor\n");
    EXPECT_EQ(document.State(), before);
}

TEST_F(StretchActionTest, TheDefaultsUseTheOscillatorBank)
{
    const std::vector<int16_t> tone = Tone(70000, 440.0);
    document.AddChannel(tone);
    document.SetRange(0, 69999);
    EXPECT_EQ(Run(Make(test::DefaultStretchParameters())), B_OK);
    EXPECT_EQ(errors, "USING OSCILLATOR BANK RESYNTHESIS\nSTRETCH DONE\n");
    VocoderState::Shared().Reset();
    DiagnosticsCapture quiet(Diagnostics::Channel::Error), quietOut;
    EXPECT_EQ(Samples(0), ExpectedStretch(tone, test::DefaultStretchParameters()));
    EXPECT_EQ(Samples(0).size(), 140000u);
}

TEST_F(StretchActionTest, DecimationZeroResynthesisesByOverlapAdd)
{
    const std::vector<int16_t> tone = Tone(90000, 300.0);
    document.AddChannel(tone);
    document.SetRange(0, 89999);
    StretchParameters values{4096, 1024, 0, 512, 1.5f, 0.0f, 0.0f};
    EXPECT_EQ(Run(Make(values)), B_OK);
    EXPECT_EQ(errors, "STRETCH DONE\n");
    VocoderState::Shared().Reset();
    DiagnosticsCapture quiet(Diagnostics::Channel::Error), quietOut;
    const std::vector<int16_t> expected = ExpectedStretch(tone, values);
    EXPECT_EQ(Samples(0), expected);
    int nonzero = 0;
    for (size_t i = 0; i < 16384; i++)
        nonzero += expected[i] != 0;
    EXPECT_GT(nonzero, 1000);
}

TEST_F(StretchActionTest, ALongRangeRunsManyRoundsOverTheSameFirstOutputs)
{
    // About 40 frames of analysis and resynthesis, each copied over the
    // same first 16384 outputs.
    const std::vector<int16_t> tone = Tone(400000, 523.0);
    document.AddChannel(tone);
    document.SetRange(0, 399999);
    StretchParameters values{8192, 8192, 0, 2048, 2.0f, 0.0f, 0.0f};
    EXPECT_EQ(Run(Make(values)), B_OK);
    VocoderState::Shared().Reset();
    DiagnosticsCapture quiet(Diagnostics::Channel::Error), quietOut;
    const std::vector<int16_t> expected = ExpectedStretch(tone, values);
    EXPECT_EQ(Samples(0), expected);
    ASSERT_EQ(expected.size(), 800000u);
    EXPECT_EQ(std::vector<int16_t>(expected.begin() + 16384, expected.end()), std::vector<int16_t>(800000 - 16384, 0));
}

TEST_F(StretchActionTest, PhasesCarryOverFromChannelToChannel)
{
    const std::vector<int16_t> a = Tone(60000, 440.0), b = Tone(60000, 550.0);
    document.AddChannel(a);
    document.AddChannel(b);
    document.SetRange(0, 59999);
    StretchParameters values{2048, 512, 0, 512, 1.25f, 0.0f, 0.0f};
    EXPECT_EQ(Run(Make(values)), B_OK);
    EXPECT_EQ(printed, "StretchAction::Stretch()\nstretch on buffer[0] done!\n"
                       "StretchAction::Stretch()\nstretch on buffer[1] done!\n");
    VocoderState::Shared().Reset();
    DiagnosticsCapture quiet(Diagnostics::Channel::Error), quietOut;
    EXPECT_EQ(Samples(0), ExpectedStretch(a, values));
    EXPECT_EQ(Samples(1), ExpectedStretch(b, values));
}

TEST_F(StretchActionTest, WritesBackByChannelIndexAmongAllChannels)
{
    const std::vector<int16_t> first = Tone(60000, 440.0), second = Tone(60000, 550.0);
    document.AddChannel(first, 0, false);
    document.AddChannel(second, 0, true);
    document.SetRange(0, 59999);
    EXPECT_EQ(Run(Make(test::DefaultStretchParameters())), B_OK);
    EXPECT_EQ(printed, "StretchAction::Stretch()\nstretch on buffer[0] done!\n");
    // The only output belongs to index 0; the selected channel has index 1,
    // beyond the outputs, and is replaced by silence of the stretched length.
    EXPECT_EQ(Samples(0), first);
    EXPECT_EQ(Samples(1), std::vector<int16_t>(120000, 0));
}

TEST_F(StretchActionTest, UndoFailsAndTheHistoryDropsIt)
{
    document.AddChannel(Tone(3000, 440.0));
    document.SetRange(0, 999);
    Run(Make(test::DefaultStretchParameters()));
    const DocumentState stretched = document.State();
    ASSERT_STREQ(history.UndoName(), "Time Stretch");
    EXPECT_EQ(history.Undo(), B_ERROR);
    EXPECT_EQ(history.UndoName(), nullptr);
    EXPECT_EQ(history.RedoName(), nullptr);
    EXPECT_EQ(document.State(), stretched);
}

TEST_F(StretchActionTest, ADialogThatCannotBeReadDoesNothing)
{
    document.AddChannel(Tone(3000, 440.0));
    document.SetRange(0, 999);
    const DocumentState before = document.State();
    StretchAction* action = Make(test::DefaultStretchParameters(), false);
    EXPECT_EQ(Run(action), B_NO_INIT);
    EXPECT_EQ(printed, "");
    EXPECT_EQ(document.State(), before);
    EXPECT_EQ(action->InitCheck(), B_OK);
}

TEST_F(StretchActionTest, DroppingTheActionClosesItsDialog)
{
    Make(test::DefaultStretchParameters());
    owned_.reset();
    EXPECT_TRUE(log->quit);
    EXPECT_TRUE(log->destroyed);
}

TEST(StretchActionSamples, ConversionKeepsTheLow16Bits)
{
    EXPECT_EQ(StretchAction::ToSample(0.5f), 16383);
    EXPECT_EQ(StretchAction::ToSample(-0.5f), -16383);
    EXPECT_EQ(StretchAction::ToSample(1.5f), int16_t(49150 - 65536));
    EXPECT_EQ(StretchAction::ToSample(1e30f), 0);
    EXPECT_EQ(StretchAction::ToSample(std::nanf("")), 0);
    EXPECT_EQ(StretchAction::StretchedLength(1000, 1.5f), 1500);
    EXPECT_EQ(StretchAction::StretchedLength(3, 0.5f), 1);
    EXPECT_EQ(StretchAction::StretchedLength(1000, -2.0f), 0);
}

}  // namespace
}  // namespace glimmet
