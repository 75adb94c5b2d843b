#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <cstdint>
#include <vector>

#include "edit/vocoder/Fft.h"

namespace glimmet {
namespace {

using Complex = std::complex<double>;

// Deterministic test data without a library generator, so every build sees
// the same values.
std::vector<float> Signal(int count, uint32_t seed)
{
    std::vector<float> values(static_cast<size_t>(count));
    for (float& value : values) {
        seed = seed * 1664525u + 1013904223u;
        value = float(int32_t(seed >> 8) % 20001 - 10000) / 10000.0f;
    }
    return values;
}

// The plain DFT with the kernel e^{+2 pi i n k / count}, in double.
std::vector<Complex> Dft(const std::vector<Complex>& x, double sign)
{
    const size_t n = x.size();
    std::vector<Complex> result(n);
    for (size_t k = 0; k < n; k++) {
        Complex sum = 0.0;
        for (size_t j = 0; j < n; j++)
            sum += x[j] * std::polar(1.0, sign * 2.0 * M_PI * double(j * k % n) / double(n));
        result[k] = sum;
    }
    return result;
}

std::vector<Complex> AsComplex(const std::vector<float>& pairs)
{
    std::vector<Complex> values;
    for (size_t i = 0; i + 1 < pairs.size(); i += 2)
        values.emplace_back(pairs[i], pairs[i + 1]);
    return values;
}

class VocoderCfft : public ::testing::TestWithParam<int> {};

TEST_P(VocoderCfft, ForwardIsThePositiveKernelDividedByTheFloatCount)
{
    const int nc = GetParam();
    std::vector<float> x = Signal(2 * nc, 7);
    std::vector<Complex> expected = Dft(AsComplex(x), +1.0);
    cfft(x.data(), nc, 1);
    for (int k = 0; k < nc; k++) {
        EXPECT_NEAR(x[size_t(2 * k)], expected[size_t(k)].real() / (2 * nc), 2e-6) << "bin " << k;
        EXPECT_NEAR(x[size_t(2 * k + 1)], expected[size_t(k)].imag() / (2 * nc), 2e-6) << "bin " << k;
    }
}

TEST_P(VocoderCfft, InverseIsTheNegativeKernelTimesTwo)
{
    const int nc = GetParam();
    std::vector<float> x = Signal(2 * nc, 11);
    std::vector<Complex> expected = Dft(AsComplex(x), -1.0);
    cfft(x.data(), nc, 0);
    for (int k = 0; k < nc; k++) {
        EXPECT_NEAR(x[size_t(2 * k)], 2.0 * expected[size_t(k)].real(), 2e-4 * nc) << "bin " << k;
        EXPECT_NEAR(x[size_t(2 * k + 1)], 2.0 * expected[size_t(k)].imag(), 2e-4 * nc) << "bin " << k;
    }
}

TEST_P(VocoderCfft, ForwardThenInverseGivesTheInputBack)
{
    const int nc = GetParam();
    const std::vector<float> original = Signal(2 * nc, 13);
    std::vector<float> x = original;
    cfft(x.data(), nc, 1);
    cfft(x.data(), nc, 0);
    for (size_t i = 0; i < x.size(); i++)
        EXPECT_NEAR(x[i], original[i], 1e-5) << i;
}

INSTANTIATE_TEST_SUITE_P(Sizes, VocoderCfft, ::testing::Values(1, 2, 4, 8, 64, 256));

class VocoderRfft : public ::testing::TestWithParam<int> {};

TEST_P(VocoderRfft, PacksTheNyquistRealPartIntoTheSecondFloat)
{
    const int n = GetParam();  // half the real length
    std::vector<float> x = Signal(2 * n, 17);
    std::vector<Complex> input;
    for (float value : x)
        input.emplace_back(value, 0.0);
    const std::vector<Complex> expected = Dft(input, +1.0);
    rfft(x.data(), n, 1);
    const double scale = 1.0 / (2 * n);
    EXPECT_NEAR(x[0], expected[0].real() * scale, 2e-6);
    EXPECT_NEAR(x[1], expected[size_t(n)].real() * scale, 2e-6);
    for (int k = 1; k < n; k++) {
        EXPECT_NEAR(x[size_t(2 * k)], expected[size_t(k)].real() * scale, 2e-6) << "bin " << k;
        EXPECT_NEAR(x[size_t(2 * k + 1)], expected[size_t(k)].imag() * scale, 2e-6) << "bin " << k;
    }
}

TEST_P(VocoderRfft, InverseReadsTheNyquistFromTheSecondFloat)
{
    const int n = GetParam();
    const std::vector<float> original = Signal(2 * n, 19);
    std::vector<float> x = original;
    rfft(x.data(), n, 1);
    rfft(x.data(), n, 0);
    for (size_t i = 0; i < x.size(); i++)
        EXPECT_NEAR(x[i], original[i], 1e-5) << i;
}

TEST_P(VocoderRfft, AlternatingSignalIsAllNyquist)
{
    const int n = GetParam();
    std::vector<float> x(size_t(2 * n));
    for (size_t i = 0; i < x.size(); i++)
        x[i] = i % 2 == 0 ? 1.0f : -1.0f;
    rfft(x.data(), n, 1);
    EXPECT_NEAR(x[0], 0.0, 1e-6);
    EXPECT_NEAR(x[1], 1.0, 1e-6);
    for (size_t i = 2; i < x.size(); i++)
        EXPECT_NEAR(x[i], 0.0, 1e-6) << i;
}

INSTANTIATE_TEST_SUITE_P(Sizes, VocoderRfft, ::testing::Values(2, 4, 16, 128, 512));

TEST(VocoderBitreverse, ReversesTheIndexBitsOfThePairs)
{
    const int pairs = 16;
    std::vector<float> x(2 * pairs);
    for (int i = 0; i < pairs; i++) {
        x[size_t(2 * i)] = float(i);
        x[size_t(2 * i + 1)] = float(-i);
    }
    bitreverse(x.data(), 2 * pairs);
    for (int i = 0; i < pairs; i++) {
        int reversed = 0;
        for (int bit = 0; bit < 4; bit++)
            reversed |= ((i >> bit) & 1) << (3 - bit);
        EXPECT_EQ(x[size_t(2 * i)], float(reversed)) << i;
        EXPECT_EQ(x[size_t(2 * i + 1)], float(-reversed)) << i;
    }
}

}  // namespace
}  // namespace glimmet
