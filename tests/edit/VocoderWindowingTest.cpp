#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include "edit/vocoder/Windowing.h"

namespace glimmet {
namespace {

struct Windows {
    std::vector<double> h, a, s;
};

// The three windows from their definition, in double.
Windows ReferenceWindows(int nw, int n, int hop)
{
    Windows w{std::vector<double>(size_t(nw)), {}, {}};
    for (int i = 0; i < nw; i++)
        w.h[size_t(i)] = 0.54 - 0.46 * std::cos(2.0 * M_PI * i / (nw - 1));
    w.a = w.h;
    w.s = w.h;
    if (nw > n) {
        for (int i = 0; i < nw; i++) {
            const double x = -(nw - 1) / 2.0 + i;
            if (x == 0.0)
                continue;
            w.a[size_t(i)] *= n * std::sin(M_PI * x / n) / (M_PI * x);
            if (hop != 0)
                w.s[size_t(i)] *= hop * std::sin(M_PI * x / hop) / (M_PI * x);
        }
    }
    double sum = 0.0;
    for (double value : w.a)
        sum += value;
    const double afac = 2.0 / sum;
    const double sfac = nw > n ? 1.0 / afac : afac;
    for (int i = 0; i < nw; i++) {
        w.a[size_t(i)] *= afac;
        w.s[size_t(i)] *= sfac;
    }
    if (nw <= n && hop != 0) {
        double squares = 0.0;
        for (int i = 0; i < nw; i += hop)
            squares += w.s[size_t(i)] * w.s[size_t(i)];
        for (double& value : w.s)
            value /= squares;
    }
    return w;
}

void ExpectWindows(int nw, int n, int hop)
{
    const size_t count = static_cast<size_t>(nw);
    std::vector<float> h(count), a(count), s(count);
    makewindows(h.data(), a.data(), s.data(), nw, n, hop);
    const Windows expected = ReferenceWindows(nw, n, hop);
    for (size_t i = 0; i < size_t(nw); i++) {
        EXPECT_NEAR(h[i], expected.h[i], 1e-6) << i;
        EXPECT_NEAR(a[i], expected.a[i], 1e-4 * std::fabs(expected.a[i]) + 1e-7) << i;
        EXPECT_NEAR(s[i], expected.s[i], 1e-4 * std::fabs(expected.s[i]) + 1e-7) << i;
    }
}

TEST(VocoderMakewindows, LongerThanTheFftGetsSincWindows)
{
    ExpectWindows(64, 16, 4);
    ExpectWindows(63, 16, 8);
}

TEST(VocoderMakewindows, LongerThanTheFftWithoutHopLeavesTheSynthesisHamming)
{
    std::vector<float> h(64), a(64), s(64);
    makewindows(h.data(), a.data(), s.data(), 64, 16, 0);
    const Windows expected = ReferenceWindows(64, 16, 0);
    for (size_t i = 0; i < 64; i++)
        EXPECT_NEAR(s[i], expected.s[i], 1e-4 * std::fabs(expected.s[i])) << i;
}

TEST(VocoderMakewindows, NoLongerThanTheFftNormalisesTheSynthesisForTheHop)
{
    ExpectWindows(32, 32, 8);
    ExpectWindows(16, 64, 4);
}

TEST(VocoderFold, RotatesSoThatTheInputTimeLandsAtZero)
{
    const int nw = 12;
    const int n = 8;
    std::vector<float> input(nw), window(nw), output(n, 99.0f);
    for (int i = 0; i < nw; i++) {
        input[size_t(i)] = float(i + 1);
        window[size_t(i)] = 0.5f + float(i) * 0.25f;
    }
    fold(input.data(), window.data(), nw, output.data(), n, -3);
    std::vector<float> expected(n, 0.0f);
    for (int i = 0; i < nw; i++)
        expected[size_t((i + 5) % n)] += input[size_t(i)] * window[size_t(i)];
    EXPECT_EQ(output, expected);
}

TEST(VocoderFold, TimesBeyondTheLengthWrap)
{
    std::vector<float> input{1, 2, 3, 4}, window{1, 1, 1, 1}, output(4);
    fold(input.data(), window.data(), 4, output.data(), 4, 9);
    EXPECT_EQ(output, (std::vector<float>{4, 1, 2, 3}));
}

TEST(VocoderOverlapadd, UnrotatesAndAccumulates)
{
    const int n = 8;
    const int nw = 12;
    std::vector<float> frame(n), window(nw), output(nw);
    for (int i = 0; i < n; i++)
        frame[size_t(i)] = float(10 * i);
    for (int i = 0; i < nw; i++) {
        window[size_t(i)] = float(i % 3 + 1);
        output[size_t(i)] = 1.0f;
    }
    overlapadd(frame.data(), n, window.data(), output.data(), nw, -13);
    for (int i = 0; i < nw; i++)
        EXPECT_EQ(output[size_t(i)], 1.0f + frame[size_t((i + 3) % n)] * window[size_t(i)]) << i;
}

TEST(VocoderOverlapadd, UndoesFold)
{
    const int n = 16;
    std::vector<float> input(n), ones(n, 1.0f), folded(n), output(n, 0.0f);
    for (int i = 0; i < n; i++)
        input[size_t(i)] = float(i * i);
    fold(input.data(), ones.data(), n, folded.data(), n, 5);
    overlapadd(folded.data(), n, ones.data(), output.data(), n, 5);
    EXPECT_EQ(output, input);
}

}  // namespace
}  // namespace glimmet
