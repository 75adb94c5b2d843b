#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <vector>

#include "ViewWaveformCheck.h"

namespace glimmet::test {
namespace {

// Long enough that a whole picture is rendered on two threads, one half of
// the columns each; the picture must not show where it was cut.
constexpr int64_t kFrames = 6000000;

std::vector<int16_t> ToneWithNoise()
{
    std::mt19937 random(41);
    std::uniform_int_distribution<int> noise(-3000, 3000);
    std::vector<int16_t> samples(size_t(kFrames), int16_t(0));
    for (int64_t i = 0; i < kFrames; ++i) {
        const double swell = 0.2 + 0.7 * double(i) / double(kFrames);
        samples[size_t(i)] =
            int16_t(std::lround(swell * 26000 * std::sin(2 * M_PI * double(i) / 1733)) + noise(random));
    }
    return samples;
}

class SampleViewLongChannel : public ::testing::Test {
protected:
    void SetUp() override
    {
        ASSERT_GE(double(kFrames), SampleView::kFramesWorthASecondThread);
        samples = ToneWithNoise();
        fixture.Add(MakeChannel(samples, 5000));
        fixture.Show();
    }

    int64_t Rendered() const { return fixture.View(0)->RenderedColumns(); }

    ViewFixture fixture{302, 120};
    std::vector<int16_t> samples;
};

TEST_F(SampleViewLongChannel, AWholePictureRenderedInTwoHalvesEqualsTheFullRender)
{
    // Columns before the channel's first frame and past its end, too.
    const int64_t before = Rendered();
    fixture.container->SetDisplayRange(0, kFrames + 60000);
    EXPECT_EQ(Rendered() - before, fixture.View(0)->width());
    ExpectRendered(fixture, 0, samples);
}

TEST_F(SampleViewLongChannel, TheRangeAndTheCursorAcrossTheCutShowAsInOneRender)
{
    fixture.container->SetDisplayRange(0, kFrames + 4999);
    // Around the middle column, where the two halves meet.
    const int64_t middle = fixture.container->FirstFrameAt(float(fixture.View(0)->width() / 2));
    fixture.View(0)->GetChannel()->SetSelected(true);
    fixture.container->SetRangeStart(middle - 30000);
    fixture.container->SetRangeEnd(middle + 45000);
    fixture.container->SetCursorFrame(middle);
    fixture.container->SetPlaymarkFrame(middle - 20000);
    fixture.container->SetDisplayRange(1000, kFrames + 2999);
    ExpectRendered(fixture, 0, samples);
}

}  // namespace
}  // namespace glimmet::test
