#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <vector>

#include "edit/vocoder/Vocoder.h"
#include "edit/vocoder/VocoderStretch.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet {
namespace {

// Exact bit patterns of a few results. They hold only while every
// multiplication and addition is rounded on its own: a build that fuses
// them (contraction into fused multiply-adds) or reorders them (fast-math)
// changes the last bits and fails here (a build of these sources with
// -march=haswell -ffp-contract=fast changes both stretches' values).

uint32_t Bits(float value)
{
    uint32_t bits = 0;
    std::memcpy(&bits, &value, sizeof bits);
    return bits;
}

// Integer-built inputs: no library function between the test and the bits.
std::vector<float> Ramp(int count)
{
    std::vector<float> x(static_cast<size_t>(count));
    uint32_t seed = 12345;
    for (float& value : x) {
        seed = seed * 1103515245u + 12345u;
        value = float(int32_t((seed >> 9) & 0xFFFF) - 32768) / 32768.0f;
    }
    return x;
}

class VocoderExact : public ::testing::Test {
protected:
    void SetUp() override { VocoderState::Shared().Reset(); }
    void TearDown() override { VocoderState::Shared().Reset(); }
};

TEST_F(VocoderExact, RealFftBits)
{
    std::vector<float> x = Ramp(64);
    rfft(x.data(), 32, 1);
    const std::vector<uint32_t> bits{Bits(x[1]), Bits(x[7]), Bits(x[22]), Bits(x[63])};
    EXPECT_EQ(bits, (std::vector<uint32_t>{0x3d119580, 0xbd5d969e, 0xbd2488c1, 0x3d00994e}));
}

TEST_F(VocoderExact, OverlapAddStretchBits)
{
    const std::vector<float> input = Ramp(70000);
    std::vector<float> output(16384);
    DiagnosticsCapture out(Diagnostics::Channel::Output), err(Diagnostics::Channel::Error);
    ASSERT_TRUE(VocoderStretch::Stretch(input.data(), 70000, output.data(), 16384, 1024, 512, 256, 0.0f, 1.5f, 0.0f));
    const std::vector<uint32_t> bits{Bits(output[100]), Bits(output[5000]), Bits(output[16383])};
    EXPECT_EQ(bits, (std::vector<uint32_t>{0xb983c141, 0xbc4fd51d, 0x34c643b5}));
}

TEST_F(VocoderExact, OscillatorBankStretchBits)
{
    const std::vector<float> input = Ramp(70000);
    std::vector<float> output(16384);
    DiagnosticsCapture out(Diagnostics::Channel::Output), err(Diagnostics::Channel::Error);
    ASSERT_TRUE(VocoderStretch::Stretch(input.data(), 70000, output.data(), 16384, 1024, 512, 256, 0.5f, 2.0f, 0.0f));
    const std::vector<uint32_t> bits{Bits(output[1]), Bits(output[128]), Bits(output[255])};
    
    EXPECT_EQ(bits, (std::vector<uint32_t>{0x3cfe7833, 0xbd85413a, 0xbe143572}));
}

}  // namespace
}  // namespace glimmet
