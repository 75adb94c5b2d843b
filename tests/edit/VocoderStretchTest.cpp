#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "edit/vocoder/VocoderState.h"
#include "edit/vocoder/VocoderStretch.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet {
namespace {

class VocoderStretchTest : public ::testing::Test {
protected:
    void SetUp() override { VocoderState::Shared().Reset(); }
    void TearDown() override { VocoderState::Shared().Reset(); }
};

// A sum of two tones with a slow swell, like a held chord.
std::vector<float> Music(int64_t frames)
{
    std::vector<float> x(static_cast<size_t>(frames));
    for (int64_t i = 0; i < frames; i++) {
        const double t = double(i) / 44100.0;
        x[size_t(i)] = float(0.3 * std::sin(2 * M_PI * 440.0 * t) + 0.2 * std::sin(2 * M_PI * 661.0 * t))
            * float(0.5 + 0.5 * std::sin(2 * M_PI * 0.5 * t));
    }
    return x;
}

struct StretchRun {
    bool ok;
    std::vector<float> output;
    std::string out;
    std::string err;
};

StretchRun Stretch(const std::vector<float>& input, float stretch, int n, int d, int hop, float p, int64_t outputs)
{
    DiagnosticsCapture out(Diagnostics::Channel::Output);
    DiagnosticsCapture err(Diagnostics::Channel::Error);
    StretchRun run;
    run.output.assign(size_t(outputs), 7.0f);
    run.ok = VocoderStretch::Stretch(
        input.data(), int64_t(input.size()), run.output.data(), outputs, n, d, hop, p, stretch, 0.0f);
    run.out = out.Finish();
    run.err = err.Finish();
    return run;
}

TEST_F(VocoderStretchTest, AFactorOfZeroIsRefused)
{
    const StretchRun run = Stretch(Music(60000), 0.0f, 8192, 8192, 2048, 2048.0f, 100);
    EXPECT_FALSE(run.ok);
    EXPECT_EQ(run.out, "StretchAction::Stretch()\n");
    EXPECT_EQ(run.err, "0.0 not a legal stretch factor\n");
    EXPECT_EQ(run.output, std::vector<float>(100, 7.0f));
}

TEST_F(VocoderStretchTest, NegativeAndVanishingFactorsAreRefusedInsteadOfRunningForever)
{
    EXPECT_FALSE(Stretch(Music(60000), -1.0f, 8192, 8192, 2048, 0.0f, 10).ok);
    EXPECT_FALSE(Stretch(Music(60000), 1e-9f, 8192, 8192, 2048, 0.0f, 10).ok);
    EXPECT_FALSE(Stretch(Music(60000), 2.0f, 1000, 8192, 2048, 0.0f, 10).ok);
}

TEST_F(VocoderStretchTest, InputOfAtMost49152FramesLeavesTheOutputAlone)
{
    const StretchRun run = Stretch(Music(49152), 2.0f, 8192, 8192, 2048, 2048.0f, 98305);
    EXPECT_TRUE(run.ok);
    EXPECT_EQ(run.out, "StretchAction::Stretch()\n");
    EXPECT_EQ(run.err, "STRETCH DONE\n");
    EXPECT_EQ(run.output, std::vector<float>(98305, 7.0f));
}

TEST_F(VocoderStretchTest, OnlyTheFirst16384OutputsAreWritten)
{
    const StretchRun run = Stretch(Music(120000), 2.0f, 8192, 8192, 2048, 0.0f, 240001);
    EXPECT_TRUE(run.ok);
    EXPECT_EQ(run.err, "STRETCH DONE\n");
    double energy = 0.0;
    for (size_t i = 0; i < 16384; i++)
        energy += double(run.output[i]) * run.output[i];
    EXPECT_GT(energy, 0.0);
    for (size_t i = 16384; i < run.output.size(); i++)
        ASSERT_EQ(run.output[i], 7.0f) << i;
}

TEST_F(VocoderStretchTest, AnOutputShorterThanTheAccumulatorGetsWhatFits)
{
    const StretchRun run = Stretch(Music(60000), 2.0f, 8192, 8192, 2048, 0.0f, 100);
    EXPECT_TRUE(run.ok);
    EXPECT_EQ(run.output.size(), 100u);
}

TEST_F(VocoderStretchTest, OscillatorBankIsAnnouncedOnce)
{
    const StretchRun first = Stretch(Music(80000), 2.0f, 8192, 8192, 2048, 2048.0f, 16384);
    EXPECT_EQ(first.err, "USING OSCILLATOR BANK RESYNTHESIS\nSTRETCH DONE\n");
    const StretchRun second = Stretch(Music(80000), 2.0f, 8192, 8192, 2048, 2048.0f, 16384);
    EXPECT_EQ(second.err, "STRETCH DONE\n");
}

TEST_F(VocoderStretchTest, TheSameRunFromTheSameStateGivesTheSameSamples)
{
    const std::vector<float> input = Music(100000);
    const StretchRun first = Stretch(input, 1.5f, 4096, 1024, 1024, 0.0f, 150001);
    VocoderState::Shared().Reset();
    const StretchRun again = Stretch(input, 1.5f, 4096, 1024, 1024, 0.0f, 150001);
    EXPECT_EQ(first.output, again.output);
}

TEST_F(VocoderStretchTest, PhasesCarryOverToTheNextStretch)
{
    const std::vector<float> input = Music(100000);
    const StretchRun first = Stretch(input, 1.5f, 4096, 1024, 1024, 0.0f, 16384);
    const StretchRun second = Stretch(input, 1.5f, 4096, 1024, 1024, 0.0f, 16384);
    EXPECT_NE(first.output, second.output);
}

TEST_F(VocoderStretchTest, ASecondStretchWithAnotherFftLengthKeepsTheFirstSizes)
{
    const std::vector<float> input = Music(80000);
    Stretch(input, 2.0f, 1024, 1024, 256, 0.0f, 16384);
    const StretchRun larger = Stretch(input, 2.0f, 8192, 1024, 256, 0.0f, 16384);
    EXPECT_TRUE(larger.ok);
    const VocoderState& state = VocoderState::Shared();
    EXPECT_EQ(state.convert.lastPhase.Size(), 513);
    EXPECT_EQ(state.convert.fundamental, 44100.0f / 1024.0f);
    EXPECT_EQ(state.unconvert.phase.Size(), 2048);
}

TEST(VocoderStretchFrames, InterpolateCopyAndMax)
{
    const std::vector<float> a{1.0f, 2.0f, -3.0f}, b{3.0f, 6.0f, 5.0f};
    std::vector<float> dst(3);
    VocoderStretch::InterpolateFrame(dst.data(), a.data(), b.data(), 3, 0.25f);
    EXPECT_EQ(dst, (std::vector<float>{1.5f, 3.0f, -1.0f}));
    VocoderStretch::CopyFrame(dst.data(), b.data(), 2);
    EXPECT_EQ(dst, (std::vector<float>{3.0f, 6.0f, -1.0f}));
    EXPECT_EQ(VocoderStretch::MaxOf(a.data(), 3), 2.0f);
}

}  // namespace
}  // namespace glimmet
