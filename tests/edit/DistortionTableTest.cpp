#include "edit/effects/Distortion.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <random>
#include <vector>

#include "EffectReference.h"
#include "edit/effects/Spline.h"
#include "edit/effects/SplineCurve.h"

namespace glimmet {
namespace {

using effects::Distort;
using effects::DistortionTable;

// One sample written out again from its description.
template <typename Curve>
int16_t ReferenceSample(int16_t s, const Curve& f)
{
    if (s < 0)
        return test::ReferenceOneSided((1 - f(std::fabs(s / 32768.0))) * -32768.0);
    return test::ReferenceOneSided(32767.0 * (1 - f(std::fabs(s / 32767.0))));
}

// Every sample value, then the effect samples: longer than the table, so
// Distort looks the samples up.
std::vector<int16_t> LongSamples()
{
    std::vector<int16_t> samples;
    for (int32_t v = -32768; v <= 32767; ++v)
        samples.push_back(int16_t(v));
    const std::vector<int16_t> more = test::EffectSamples(61, 20000);
    samples.insert(samples.end(), more.begin(), more.end());
    return samples;
}

template <typename Curve>
void ExpectPerSampleResults(const Curve& curve, const std::string& name)
{
    const std::vector<int16_t> input = LongSamples();
    ASSERT_GT(input.size(), DistortionTable::kSize);
    std::vector<int16_t> output = input;
    Distort(output, curve);
    for (size_t i = 0; i < input.size(); ++i)
        ASSERT_EQ(output[i], ReferenceSample(input[i], curve)) << name << " at " << input[i];
}

TEST(DistortionTableTest, LongBuffersGiveThePerSampleResultForEveryCurve)
{
    for (const test::NamedCurve& curve : test::EffectCurves())
        ExpectPerSampleResults(curve, curve.name);
}

TEST(DistortionTableTest, LongBuffersGiveThePerSampleResultForRandomSplines)
{
    std::mt19937 random(62);
    std::uniform_real_distribution<double> unit(0.0, 1.0);
    std::uniform_real_distribution<double> value(-1.0, 2.0);
    for (int32_t n = 1; n <= 12; ++n) {
        std::vector<double> x;
        std::vector<double> y;
        for (int32_t i = 0; i < n; ++i) {
            x.push_back(n == 1 ? 0.5 : double(i) / double(n - 1));
            y.push_back(value(random));
        }
        const effects::SplineCurve curve(Spline(x.data(), y.data(), n));
        ExpectPerSampleResults(curve, std::to_string(n) + " knots");
    }
}

TEST(DistortionTableTest, TheTableHoldsDistortSampleOfEveryValue)
{
    auto curve = [](double x) { return 0.3 + 0.6 * x * x; };
    const DistortionTable table(curve);
    std::vector<int16_t> samples;
    for (int32_t v = -32768; v <= 32767; ++v)
        samples.push_back(int16_t(v));
    table.Apply(samples);
    for (int32_t v = -32768; v <= 32767; ++v)
        ASSERT_EQ(samples[size_t(v + 32768)], effects::DistortSample(int16_t(v), curve)) << v;
}

}  // namespace
}  // namespace glimmet
