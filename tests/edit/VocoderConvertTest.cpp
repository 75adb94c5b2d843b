#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "edit/vocoder/Convert.h"
#include "edit/vocoder/VocoderState.h"

namespace glimmet {
namespace {

class VocoderConvert : public ::testing::Test {
protected:
    void SetUp() override { VocoderState::Shared().Reset(); }
    void TearDown() override { VocoderState::Shared().Reset(); }
};

std::vector<float> Spectrum(int n2)
{
    std::vector<float> s(size_t(2 * n2));
    for (size_t i = 0; i < s.size(); i++)
        s[i] = float(std::sin(0.7 * double(i) + 0.3)) * float(i % 5 + 1);
    return s;
}

TEST_F(VocoderConvert, GivesAmplitudeAndBinFrequencyOnTheFirstCall)
{
    const int n2 = 8;
    const int r = 44100;
    const int d = 4;
    std::vector<float> s = Spectrum(n2);
    std::vector<float> c(size_t(2 * n2 + 2));
    convert(s.data(), c.data(), n2, d, r);
    const double fundamental = double(r) / (2 * n2);
    const double factor = r / (2 * M_PI * d);
    for (int i = 0; i <= n2; i++) {
        const double re = i == n2 ? s[1] : s[size_t(2 * i)];
        const double im = (i == 0 || i == n2) ? 0.0 : s[size_t(2 * i + 1)];
        EXPECT_NEAR(c[size_t(2 * i)], std::hypot(re, im), 1e-5) << i;
        double phase = -std::atan2(im, re);
        while (phase > M_PI)
            phase -= 2 * M_PI;
        while (phase < -M_PI)
            phase += 2 * M_PI;
        EXPECT_NEAR(c[size_t(2 * i + 1)], i * fundamental + phase * factor, 1e-2) << i;
    }
}

TEST_F(VocoderConvert, ZeroAmplitudeBinKeepsItsPhaseAndReportsItsCentre)
{
    const int n2 = 4;
    std::vector<float> s = Spectrum(n2);
    std::vector<float> c(10);
    convert(s.data(), c.data(), n2, 2, 800);
    std::vector<float> silent = s;
    silent[4] = 0.0f;
    silent[5] = 0.0f;
    convert(silent.data(), c.data(), n2, 2, 800);
    EXPECT_EQ(c[4], 0.0f);
    EXPECT_EQ(c[5], 2 * 100.0f);
    // The third call measures bin 2's step from the first call's phase.
    std::vector<float> again(10);
    convert(s.data(), again.data(), n2, 2, 800);
    EXPECT_EQ(again[5], 2 * 100.0f);
}

TEST_F(VocoderConvert, UnconvertWithTheSameHopGivesTheSpectrumBack)
{
    const int n2 = 16;
    for (int round = 0; round < 3; round++) {
        std::vector<float> s = Spectrum(n2);
        for (float& value : s)
            value *= float(round + 1);
        std::vector<float> c(size_t(2 * n2 + 2)), back(size_t(2 * n2));
        convert(s.data(), c.data(), n2, 64, 44100);
        unconvert(c.data(), back.data(), n2, 64, 44100);
        // The DC and Nyquist bins carry no imaginary part and come back with
        // their sign folded into the phase.
        for (size_t i = 2; i < s.size(); i++)
            EXPECT_NEAR(back[i], s[i], 2e-3 * (round + 1)) << "round " << round << " float " << i;
        EXPECT_NEAR(back[0], s[0], 2e-3 * (round + 1));
        EXPECT_NEAR(back[1], s[1], 2e-3 * (round + 1));
    }
}

TEST_F(VocoderConvert, LaterCallsKeepTheFirstSizesAndFactors)
{
    std::vector<float> s = Spectrum(4);
    std::vector<float> c(10);
    convert(s.data(), c.data(), 4, 2, 800);
    VocoderState& state = VocoderState::Shared();
    const float fundamental = state.convert.fundamental;
    // A larger transform afterwards: its upper bins have no memory and read
    // as phase 0, and nothing outside the first call's memory is written.
    std::vector<float> larger = Spectrum(16);
    std::vector<float> frame(34);
    convert(larger.data(), frame.data(), 16, 8, 44100);
    EXPECT_EQ(state.convert.fundamental, fundamental);
    EXPECT_EQ(state.convert.lastPhase.Size(), 5);
    const float phase = float(-std::atan2(double(larger[21]), double(larger[20])));
    EXPECT_EQ(frame[21], 10.0f * fundamental + phase * state.convert.factor);
}

TEST_F(VocoderConvert, UnconvertPhaseMemoryHasAtLeast2048Bins)
{
    std::vector<float> c(10, 1.0f), s(8);
    unconvert(c.data(), s.data(), 4, 16, 44100);
    EXPECT_EQ(VocoderState::Shared().unconvert.phase.Size(), 2048);
}

}  // namespace
}  // namespace glimmet
