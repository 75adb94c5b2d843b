#include "edit/effects/PeakDistortion.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <random>
#include <string>
#include <vector>

#include "EffectReference.h"
#include "edit/effects/Spline.h"
#include "edit/effects/SplineCurve.h"

namespace glimmet {
namespace {

using effects::NegativeRun;
using effects::PeakDistort;
using effects::PositiveRun;
using effects::SampleRun;

// Peak Distort written out again from its description, one sample at a time,
// with a spare sample past the end for a run that reaches it.
template <typename Curve>
std::vector<int16_t> ReferencePeak(std::vector<int16_t> s, const Curve& f)
{
    const size_t n = s.size();
    s.push_back(0);
    auto scale = [&](size_t begin, size_t length, double position) {
        const double gain = double(float(1.0 - f(position))) / position;
        for (size_t j = begin; j <= begin + length; ++j)
            s[j] = test::ReferenceLow16(gain * s[j]);
    };
    for (size_t i = 0; i < n;) {
        size_t l = 0;
        int peak = 0;
        for (; i + l < n && s[i + l] >= 1; ++l)
            peak = std::max(peak, int(s[i + l]));
        if (l > 1)
            scale(i, l, peak / 32767.0);
        const size_t u = i + l;
        size_t m = 0;
        int low = 0;
        for (; u + m < n && s[u + m] <= -1; ++m)
            low = std::min(low, int(s[u + m]));
        if (m > 1)
            scale(u, m, low * (-1.0 / 32768.0));
        i = u + m + 1;
    }
    s.pop_back();
    return s;
}

template <typename Curve>
std::vector<int16_t> Distorted(std::vector<int16_t> samples, const Curve& curve)
{
    PeakDistort(std::span<int16_t>(samples), curve);
    return samples;
}

// Long runs of each sign (longer than a vector step), extremes, lone
// samples, zeros; ending with a run that reaches the last sample.
std::vector<int16_t> RunSamples(uint32_t seed, size_t count)
{
    std::mt19937 random(seed);
    std::uniform_int_distribution<int> length(1, 40);
    std::uniform_int_distribution<int> magnitude(1, 32767);
    std::vector<int16_t> samples = test::EffectSamples(seed, 200);
    int sign = 1;
    while (samples.size() < count) {
        const int l = length(random);
        for (int k = 0; k < l; ++k) {
            const int m = k == l / 2 && l % 3 == 0 ? 32768 : magnitude(random);
            samples.push_back(int16_t(sign > 0 ? std::min(m, 32767) : -m));
        }
        if (l % 7 == 0)
            samples.insert(samples.end(), size_t(l % 5 + 1), int16_t(0));
        sign = -sign;
    }
    samples.resize(count);
    return samples;
}

TEST(PeakDistortionScanTest, RunsFromEveryStartMatchTheSampleLoop)
{
    const std::vector<int16_t> samples = RunSamples(71, 3000);
    for (size_t begin = 0; begin <= samples.size(); ++begin) {
        size_t l = 0;
        int16_t peak = 0;
        for (; begin + l < samples.size() && samples[begin + l] >= 1; ++l)
            peak = std::max(peak, samples[begin + l]);
        const SampleRun positive = PositiveRun(samples, begin);
        ASSERT_EQ(positive.begin, begin);
        ASSERT_EQ(positive.length, l) << begin;
        ASSERT_EQ(positive.peak, peak) << begin;
        l = 0;
        peak = 0;
        for (; begin + l < samples.size() && samples[begin + l] <= -1; ++l)
            peak = std::min(peak, samples[begin + l]);
        const SampleRun negative = NegativeRun(samples, begin);
        ASSERT_EQ(negative.length, l) << begin;
        ASSERT_EQ(negative.peak, peak) << begin;
    }
}

TEST(PeakDistortionScanTest, RunsEndingAtEveryDistanceFromTheBufferEnd)
{
    for (size_t size = 1; size <= 40; ++size) {
        for (int16_t value : {int16_t(1), int16_t(32767), int16_t(-1), int16_t(-32768)}) {
            const std::vector<int16_t> samples(size, value);
            for (size_t begin = 0; begin < size; ++begin) {
                const SampleRun run = value > 0 ? PositiveRun(samples, begin) : NegativeRun(samples, begin);
                ASSERT_EQ(run.length, size - begin) << size << " " << value;
                ASSERT_EQ(run.peak, value);
            }
        }
    }
}

template <typename Curve>
void ExpectDefinition(const std::vector<int16_t>& samples, const Curve& curve, const std::string& name)
{
    ASSERT_EQ(Distorted(samples, curve), ReferencePeak(samples, curve)) << name << ", " << samples.size();
}

TEST(PeakDistortionScanTest, ShortAndLongBuffersMatchTheDefinitionForEveryCurve)
{
    // Short buffers evaluate the curve per run, long ones look gains up.
    for (size_t count : {size_t(5000), size_t(200000)}) {
        const std::vector<int16_t> samples = RunSamples(72, count);
        for (const test::NamedCurve& curve : test::EffectCurves())
            ExpectDefinition(samples, curve, curve.name);
    }
}

TEST(PeakDistortionScanTest, LongBuffersMatchTheDefinitionForRandomSplines)
{
    std::mt19937 random(73);
    std::uniform_real_distribution<double> value(-1.0, 2.0);
    const std::vector<int16_t> samples = RunSamples(74, 150000);
    for (int32_t n = 1; n <= 12; ++n) {
        std::vector<double> x;
        std::vector<double> y;
        for (int32_t i = 0; i < n; ++i) {
            x.push_back(n == 1 ? 0.5 : double(i) / double(n - 1));
            y.push_back(value(random));
        }
        const effects::SplineCurve curve(Spline(x.data(), y.data(), n));
        ExpectDefinition(samples, curve, std::to_string(n) + " knots");
    }
}

TEST(PeakDistortionScanTest, AlternatingSignsAndExtremesMatchTheDefinition)
{
    std::vector<int16_t> alternating;
    for (size_t i = 0; i < 100000; ++i)
        alternating.push_back(i % 2 == 0 ? int16_t(32767) : int16_t(-32768));
    auto curve = [](double x) { return 0.2 + 0.5 * x; };
    EXPECT_EQ(Distorted(alternating, curve), alternating);
    std::vector<int16_t> extremes;
    for (size_t i = 0; i < 100000; ++i) {
        const int16_t values[] = {32767, 32767, 32767, -32768, -32768, 0, 1, 1, -1, -1, -1, 0, 0};
        extremes.push_back(values[i % 13]);
    }
    ExpectDefinition(extremes, curve, "extremes");
    auto huge = [](double x) { return 1e9 * x - 3.0; };
    ExpectDefinition(extremes, huge, "huge gains");
}

TEST(PeakDistortionScanTest, ARunReachingTheEndOfALongBufferMatchesTheDefinition)
{
    auto curve = [](double x) { return 0.9 - 0.3 * x; };
    for (size_t tail = 1; tail <= 20; ++tail) {
        std::vector<int16_t> samples = RunSamples(75, 70000);
        samples.insert(samples.end(), tail, int16_t(tail % 2 == 0 ? 20000 : -20000));
        ExpectDefinition(samples, curve, "tail " + std::to_string(tail));
    }
}

}  // namespace
}  // namespace glimmet
