#include <gtest/gtest.h>

#include <cmath>
#include <vector>

#include <QElapsedTimer>
#include <QTest>

#include "ViewWaveformCheck.h"
#include "sound/BlockBuilder.h"
#include "views/BlockSummary.h"

namespace glimmet::test {
namespace {

// Long enough that a whole-channel column of a 302-pixel view reads more
// than half a block, which is when a block is worth a summary.
constexpr int64_t kBlocks = 160;
constexpr int64_t kFrames = kBlocks * BlockBuilder::kBlockSamples + 1000;

std::vector<int16_t> Tone(int64_t count)
{
    std::vector<int16_t> samples(size_t(count), int16_t(0));
    for (int64_t i = 0; i < count; ++i)
        samples[size_t(i)] = int16_t(std::lround(20000 * std::sin(double(i) / 97.3) * std::sin(double(i) / 90001.0)));
    return samples;
}

class SummaryBuilderTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        samples = Tone(kFrames);
        view = fixture.Add(MakeChannel(samples));
        fixture.Show();
        // Zoomed in, no column reads enough of a block to want a summary;
        // then the same samples in new blocks, which have none yet.
        fixture.container->SetDisplayRange(0, 9999);
        Paint();
        view->Summaries().Finish();
        auto* data = new int16_t[samples.size()];
        std::copy(samples.begin(), samples.end(), data);
        ASSERT_TRUE(view->GetChannel()->SetTo(data, int64_t(samples.size())));
        fixture.container->SetDisplayRange(0, 9998);
        Paint();
        made = view->Summaries().SummariesMade();
    }

    int64_t BlocksWithSummaries() const
    {
        int64_t count = 0;
        view->GetChannel()->ReadSpans(0, kFrames, [&](const SampleSpan& span) {
            if (span.block != nullptr && span.block->Summary() != nullptr)
                ++count;
        });
        return count;
    }

    void ExpectAsFullRender() { ExpectRendered(fixture, 0, samples); }

    /// The view renders what changed when it is painted; asking for its
    /// image does the same at once.
    void Paint() { view->Bitmap(); }

    ViewFixture fixture{302, 120};
    std::vector<int16_t> samples;
    SampleView* view = nullptr;
    int64_t made = 0;
};

TEST_F(SummaryBuilderTest, TheFirstPictureReadsTheSamplesAndTheIdleWindowMakesTheSummaries)
{
    ASSERT_EQ(BlocksWithSummaries(), 0);
    fixture.container->SetDisplayRange(0, kFrames - 1);
    Paint();
    // The picture is complete before any summary exists.
    EXPECT_EQ(BlocksWithSummaries(), 0);
    EXPECT_FALSE(view->Summaries().Idle());
    ExpectAsFullRender();

    QTRY_VERIFY_WITH_TIMEOUT(view->Summaries().Idle(), 20000);
    EXPECT_GE(BlocksWithSummaries(), kBlocks - 2);
    EXPECT_EQ(view->Summaries().SummariesMade() - made, BlocksWithSummaries());

    // Renders from the summaries give the same picture and want no more.
    fixture.container->SetDisplayRange(7, kFrames - 1);
    fixture.container->SetDisplayRange(0, kFrames - 1);
    ExpectAsFullRender();
    EXPECT_TRUE(view->Summaries().Idle());
}

TEST_F(SummaryBuilderTest, TheFirstSummaryWaitsAWhileAfterTheRenderThatAskedForIt)
{
    QElapsedTimer clock;
    clock.start();
    fixture.container->SetDisplayRange(0, kFrames - 1);
    Paint();
    ASSERT_FALSE(view->Summaries().Idle());
    // The messages that settle a new picture are handled meanwhile.
    while (clock.elapsed() < 300 && view->Summaries().SummariesMade() == made) {
        QCoreApplication::processEvents(QEventLoop::AllEvents, 5);
        if (view->Summaries().SummariesMade() != made) {
            EXPECT_GE(clock.elapsed(), 100);
        }
    }
    EXPECT_GT(view->Summaries().SummariesMade(), made);
}

// The play mark renders a column or two at every step, and they ask for
// summaries each time: the builder must not wait for them to stop.
TEST_F(SummaryBuilderTest, RendersThatFollowEachOtherDoNotPutTheSummariesOff)
{
    fixture.container->SetDisplayRange(0, kFrames - 1);
    Paint();
    QElapsedTimer clock;
    clock.start();
    for (int64_t step = 0; clock.elapsed() < 2000 && !view->Summaries().Idle(); ++step) {
        fixture.container->SetDisplayRange(step % 2, kFrames - 1);
        Paint();
        QTest::qWait(20);
    }
    EXPECT_TRUE(view->Summaries().Idle());
    EXPECT_GE(BlocksWithSummaries(), kBlocks - 2);
    fixture.container->SetDisplayRange(0, kFrames - 1);
    ExpectAsFullRender();
}

TEST_F(SummaryBuilderTest, SummariesFitTheHeightTheViewHasWhenTheyAreMade)
{
    fixture.container->SetDisplayRange(0, kFrames - 1);
    Paint();
    ASSERT_FALSE(view->Summaries().Idle());
    fixture.container->resize(302, 77);
    fixture.container->SetDisplayRange(0, kFrames - 2);
    view->Summaries().Finish();
    ExpectAsFullRender();
    fixture.container->SetDisplayRange(0, kFrames - 1);
    ExpectAsFullRender();
    EXPECT_TRUE(view->Summaries().Idle());
}

TEST_F(SummaryBuilderTest, ABlockThatLeftTheChannelBeforeItsTurnIsSkipped)
{
    fixture.container->SetDisplayRange(0, kFrames - 1);
    Paint();
    ASSERT_FALSE(view->Summaries().Idle());
    // Every block moves: the first is rebuilt, the others start 10 frames
    // earlier than the requests say.
    ASSERT_EQ(view->GetChannel()->RemoveFrames(0, 9), B_OK);
    view->Summaries().Finish();
    EXPECT_EQ(view->Summaries().SummariesMade(), made);
    EXPECT_EQ(BlocksWithSummaries(), 0);
}

}  // namespace
}  // namespace glimmet::test
