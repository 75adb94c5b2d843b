#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstring>
#include <vector>

#include "edit/vocoder/OscillatorBank.h"
#include "edit/vocoder/VocoderState.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet {
namespace {

constexpr int L = 8192;

// The oscillator bank written out from its description, bin by bin.
struct ReferenceBank {
    std::vector<float> amplitude, frequency, index, table;
    float inverseHop, increment;
    int bins;

    ReferenceBank(int n2, int r, int nw, int hop, float p)
        : amplitude(size_t(n2 + 1)), frequency(size_t(n2 + 1)), index(size_t(n2 + 1)), table(L)
    {
        const float scale = nw < n2 ? float(8 * n2) : float(n2);
        for (int n = 0; n < L; n++)
            table[size_t(n)] = float(scale * std::cos(2.0 * M_PI * n / L));
        inverseHop = 1.0f / float(hop);
        increment = p * float(L) / float(r);
        bins = p > 1.0f ? int(float(n2) / p) : n2;
    }

    void Run(std::vector<float>& c, int hop, std::vector<float>& out)
    {
        for (int b = 0; b < bins; b++) {
            if (!(c[size_t(2 * b)] >= synt))
                continue;
            c[size_t(2 * b + 1)] *= increment;
            float f = frequency[size_t(b)];
            float a = amplitude[size_t(b)];
            const float finc = (c[size_t(2 * b + 1)] - f) * inverseHop;
            const float ainc = (c[size_t(2 * b)] - a) * inverseHop;
            float address = index[size_t(b)];
            for (int n = 0; n < hop; n++) {
                out[size_t(n)] += a * table[size_t(int(address))];
                address += f;
                while (address >= float(L))
                    address -= float(L);
                while (address < 0.0f)
                    address += float(L);
                a += ainc;
                f += finc;
            }
            frequency[size_t(b)] = c[size_t(2 * b + 1)];
            amplitude[size_t(b)] = c[size_t(2 * b)];
            index[size_t(b)] = address;
        }
    }
};

class VocoderNoscbank : public ::testing::Test {
protected:
    void SetUp() override { VocoderState::Shared().Reset(); }
    void TearDown() override { VocoderState::Shared().Reset(); }
};

std::vector<float> Frame(int n2, float scale)
{
    std::vector<float> c(size_t(2 * n2 + 2));
    for (int b = 0; b <= n2; b++) {
        c[size_t(2 * b)] = scale * float(b % 3) * 0.25f;  // every third bin silent
        c[size_t(2 * b + 1)] = float(b) * 172.265625f + scale * 3.0f;
    }
    return c;
}

TEST_F(VocoderNoscbank, AccumulatesGatesAndRewritesFrequenciesAsIncrements)
{
    const int n2 = 16, hop = 32, nw = 64, r = 44100;
    const float p = 1.0f;
    ReferenceBank reference(n2, r, nw, hop, p);
    std::vector<float> out(hop, 0.5f), expectedOut(hop, 0.5f);
    DiagnosticsCapture errors(Diagnostics::Channel::Error);
    for (int call = 1; call <= 3; call++) {
        std::vector<float> c = Frame(n2, float(call));
        std::vector<float> expected = c;
        noscbank(c.data(), n2, r, nw, hop, p, out.data());
        reference.Run(expected, hop, expectedOut);
        EXPECT_EQ(c, expected) << "call " << call;
        EXPECT_EQ(out, expectedOut) << "call " << call;
    }
    EXPECT_EQ(errors.Finish(), "USING OSCILLATOR BANK RESYNTHESIS\n");
}

TEST_F(VocoderNoscbank, SilentBinsKeepTheirFrequency)
{
    std::vector<float> c = Frame(8, 1.0f);
    std::vector<float> out(16);
    noscbank(c.data(), 8, 44100, 32, 16, 1.0f, out.data());
    EXPECT_EQ(c[1], Frame(8, 1.0f)[1]);  // bin 0 is below the gate
    EXPECT_NE(c[3], Frame(8, 1.0f)[3]);
}

TEST_F(VocoderNoscbank, APitchAboveOneSoundsOnlyTheBinsBelowNyquist)
{
    const int n2 = 16;
    std::vector<float> c = Frame(n2, 1.0f);
    const std::vector<float> before = c;
    std::vector<float> out(8);
    noscbank(c.data(), n2, 44100, 64, 8, 4.0f, out.data());
    EXPECT_EQ(VocoderState::Shared().oscillators.bins, 4);
    for (int b = 4; b <= n2; b++)
        EXPECT_EQ(c[size_t(2 * b + 1)], before[size_t(2 * b + 1)]) << b;
}

TEST_F(VocoderNoscbank, ATableOfEightTimesTheBinsWhenTheWindowIsShorter)
{
    std::vector<float> c(10, 0.0f), out(4);
    noscbank(c.data(), 4, 44100, 2, 4, 1.0f, out.data());
    EXPECT_EQ(VocoderState::Shared().oscillators.table[0], 32.0f);
}

TEST(VocoderSynt, StartsAsTheFloatWithBits322BCC77)
{
    uint32_t bits = 0;
    std::memcpy(&bits, &synt, sizeof bits);
    EXPECT_EQ(bits, 0x322BCC77u);
}

}  // namespace
}  // namespace glimmet
