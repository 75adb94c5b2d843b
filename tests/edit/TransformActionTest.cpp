#include <gtest/gtest.h>

#include <random>

#include "TestDocument.h"
#include "TransformCases.h"
#include "edit/HistoryManager.h"
#include "sound/ChannelSamples.h"

namespace glimmet {
namespace {

using test::AllTransforms;
using test::DocumentState;
using test::TestDocument;
using test::TransformCase;

class TransformActionTest : public ::testing::TestWithParam<TransformCase> {
protected:
    std::unique_ptr<Action> Bound(TestDocument& document)
    {
        std::unique_ptr<Action> action = GetParam().make();
        EXPECT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
        return action;
    }
};

TEST_P(TransformActionTest, NameMenuAndNoDialog)
{
    std::unique_ptr<Action> action = GetParam().make();
    EXPECT_EQ(action->Name(), GetParam().name);
    EXPECT_STREQ(action->PreferredMenu(), "Tools");
    EXPECT_FALSE(action->SupportsConfiguration());
}

TEST_P(TransformActionTest, UnboundGoFailsWithItsOwnCode)
{
    std::unique_ptr<Action> action = GetParam().make();
    EXPECT_EQ(action->Go(), GetParam().unboundStatus);
    EXPECT_EQ(action->Undo(), B_ERROR);
    EXPECT_EQ(action->Redo(), B_ERROR);
}

TEST_P(TransformActionTest, RangesOfManyLengthsMatchTheReference)
{
    std::mt19937 random(42);
    for (int64_t length : {1, 2, 3, 4, 5, 6, 7, 63, 64, 999, 1000}) {
        TestDocument document;
        document.AddChannel(test::RandomSamples(random, 1200), 0, true);
        document.AddChannel(test::RandomSamples(random, 1200), 0, false);
        document.AddChannel(test::RandomSamples(random, 1100), 0, true);
        // Quieter data lets Maximize scale instead of stopping at full scale.
        if (GetParam().name == "Maximize") {
            for (int32_t i = 0; i < 3; i++) {
                Channel& channel = *document.manager.ChannelAt(i);
                std::vector<int16_t> quieter = test::SamplesOf(channel);
                for (int16_t& sample : quieter)
                    sample = int16_t(sample / 5);
                test::SetSamples(channel, quieter);
            }
        }
        const int64_t start = 50;
        document.SetRange(start, start + length - 1);
        const DocumentState before = document.State();
        std::unique_ptr<Action> action = Bound(document);
        ASSERT_EQ(action->Go(), B_OK);
        const DocumentState after = document.State();
        EXPECT_EQ(after, test::ExpectedAfter(GetParam(), before, start, start + length - 1)) << "length " << length;

        ASSERT_EQ(action->Undo(), B_OK);
        EXPECT_EQ(document.State(), before) << "length " << length;
        ASSERT_EQ(action->Redo(), B_OK);
        EXPECT_EQ(document.State(), after) << "length " << length;
    }
}

TEST_P(TransformActionTest, NoSelectedChannelChangesNothingButIsRecorded)
{
    TestDocument document;
    document.AddChannel({100, 200, 300, 400}, 0, false);
    document.SetRange(0, 3);
    const DocumentState before = document.State();
    HistoryManager history;
    std::unique_ptr<Action> action = Bound(document);
    Action* raw = action.get();
    ASSERT_EQ(history.AddAction(action), B_OK);
    EXPECT_EQ(raw->Go(), B_OK);
    EXPECT_EQ(document.State(), before);
    EXPECT_EQ(history.UndoName(), GetParam().name);
    EXPECT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(document.State(), before);
}

TEST_P(TransformActionTest, UndoAndRedoThroughTheHistory)
{
    std::mt19937 random(7);
    TestDocument document;
    document.AddChannel(test::RandomSamples(random, 300), 0, true);
    document.AddChannel(test::RandomSamples(random, 300), 0, true);
    document.SetRange(10, 210);
    const DocumentState before = document.State();
    HistoryManager history;
    std::unique_ptr<Action> action = Bound(document);
    Action* raw = action.get();
    ASSERT_EQ(history.AddAction(action), B_OK);
    ASSERT_EQ(raw->Go(), B_OK);
    const DocumentState after = document.State();
    // Select otherwise and move the range: undo and redo put them back.
    document.Select({false, false});
    document.SetRange(0, 5);
    ASSERT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(document.State(), before);
    document.Select({false, false});
    ASSERT_EQ(history.Redo(), B_OK);
    EXPECT_EQ(document.State(), after);
}

TEST_P(TransformActionTest, RangeReachingPastTheChannelEndTransformsSilence)
{
    TestDocument document;
    document.AddChannel({1000, 1000, 1000, 1000}, 0, true);
    document.AddChannel({0, 0, 0, 0, 0, 0, 0, 0}, 0, false);
    document.SetRange(2, 5);
    const DocumentState before = document.State();
    std::unique_ptr<Action> action = Bound(document);
    ASSERT_EQ(action->Go(), B_OK);
    // The frames past the data read as silence and are written back: the
    // channel grows to the range end.
    std::vector<std::vector<int16_t>> ranges{{1000, 1000, 0, 0}};
    GetParam().reference(ranges);
    std::vector<int16_t> expected{1000, 1000};
    expected.insert(expected.end(), ranges[0].begin(), ranges[0].end());
    EXPECT_EQ(document.State().channels[0].samples, expected);
    ASSERT_EQ(action->Undo(), B_OK);
    // Undo writes the silent snapshot back over the same range.
    std::vector<int16_t> undone{1000, 1000, 1000, 1000, 0, 0};
    EXPECT_EQ(document.State().channels[0].samples, undone);
    EXPECT_EQ(document.State().channels[1], before.channels[1]);
}

TEST_P(TransformActionTest, ChannelWhoseDataEndsAtTheRangeStartGetsThePreviousBuffer)
{
    // Copying from exactly the end of a channel's data fails and leaves the
    // shared working buffer as the previous channel left it; that buffer is
    // transformed again and written to the short channel.
    TestDocument document;
    document.AddChannel({10, 20, 30, 400, 500, 600}, 0, true);
    document.AddChannel({7, 8, 9}, 0, true);
    document.SetRange(3, 5);
    std::unique_ptr<Action> action = Bound(document);
    ASSERT_EQ(action->Go(), B_OK);
    std::vector<std::vector<int16_t>> first{{400, 500, 600}};
    GetParam().reference(first);
    std::vector<std::vector<int16_t>> second{first[0]};
    if (GetParam().name == "Maximize") {
        // The factor found over the first pass is applied once more.
        const double factor = double(32767.0f / 600.0f);
        for (int16_t& sample : second[0])
            sample = test::TransformReference::Low16(factor * sample);
    } else {
        GetParam().reference(second);
    }
    const DocumentState after = document.State();
    EXPECT_EQ(after.channels[0].samples, (std::vector<int16_t>{10, 20, 30, first[0][0], first[0][1], first[0][2]}));
    EXPECT_EQ(after.channels[1].samples, (std::vector<int16_t>{7, 8, 9, second[0][0], second[0][1], second[0][2]}));
}

INSTANTIATE_TEST_SUITE_P(Transforms, TransformActionTest, ::testing::ValuesIn(AllTransforms()),
    [](const ::testing::TestParamInfo<TransformCase>& info) {
        std::string name = info.param.name;
        name.erase(std::remove(name.begin(), name.end(), ' '), name.end());
        return name;
    });

TEST(TransformEdgeTest, FadeInAndOutOfOneFrameWriteZero)
{
    for (auto make : {test::Maker<FadeInAction>(), test::Maker<FadeOutAction>()}) {
        TestDocument document;
        document.AddChannel({500, 600, 700});
        document.SetRange(1, 1);
        std::unique_ptr<Action> action = make();
        ASSERT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
        ASSERT_EQ(action->Go(), B_OK);
        EXPECT_EQ(document.State().channels[0].samples, (std::vector<int16_t>{500, 0, 700}));
    }
}

TEST(TransformEdgeTest, FadesOverThreeFramesOf1000)
{
    TestDocument document;
    document.AddChannel({1000, 1000, 1000, 1000, 1000, 1000});
    document.SetRange(0, 2);
    FadeInAction fadeIn(nullptr);
    ASSERT_EQ(fadeIn.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(fadeIn.Go(), B_OK);
    document.SetRange(3, 5);
    FadeOutAction fadeOut(nullptr);
    ASSERT_EQ(fadeOut.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(fadeOut.Go(), B_OK);
    EXPECT_EQ(document.State().channels[0].samples, (std::vector<int16_t>{0, 500, 1000, 1000, 500, 0}));
}

TEST(TransformEdgeTest, MaximizeAtFullScaleChangesNothingButCanBeUndone)
{
    for (int16_t peak : {int16_t(32767), int16_t(-32768)}) {
        TestDocument document;
        document.AddChannel({100, peak, -200, 5});
        document.SetRange(0, 3);
        const DocumentState before = document.State();
        HistoryManager history;
        auto* action = new MaximizeAction(nullptr);
        std::unique_ptr<Action> owned(action);
        ASSERT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
        ASSERT_EQ(history.AddAction(owned), B_OK);
        ASSERT_EQ(action->Go(), B_OK);
        EXPECT_EQ(document.State(), before);
        EXPECT_STREQ(history.UndoName(), "Maximize");
        EXPECT_EQ(history.Undo(), B_OK);
        EXPECT_EQ(document.State(), before);
        EXPECT_STREQ(history.RedoName(), "Maximize");
    }
}

TEST(TransformEdgeTest, MaximizeOfSilenceStaysSilent)
{
    TestDocument document;
    document.AddChannel(std::vector<int16_t>(16, 0));
    document.SetRange(0, 15);
    MaximizeAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    EXPECT_EQ(document.State().channels[0].samples, std::vector<int16_t>(16, 0));
}

TEST(TransformEdgeTest, MaximizeSharesOneFactorAcrossChannels)
{
    TestDocument document;
    document.AddChannel({100, -1000, 50});
    document.AddChannel({10, 20, 30});
    document.AddChannel({16000, 16000, 16000}, 0, false);
    document.SetRange(0, 2);
    MaximizeAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    const float factor = 32767.0f / 1000.0f;
    auto scaled = [factor](int s) { return int16_t(std::trunc(double(factor) * s)); };
    const DocumentState after = document.State();
    EXPECT_EQ(after.channels[0].samples, (std::vector<int16_t>{scaled(100), scaled(-1000), scaled(50)}));
    EXPECT_EQ(after.channels[1].samples, (std::vector<int16_t>{scaled(10), scaled(20), scaled(30)}));
    EXPECT_EQ(after.channels[0].samples[1], -32766);  // the float factor falls just short
    EXPECT_EQ(after.channels[2].samples, (std::vector<int16_t>{16000, 16000, 16000}));
}

TEST(TransformEdgeTest, RevertOfAnOddRangeLeavesTheMiddle)
{
    TestDocument document;
    document.AddChannel({1, 2, 3, 4, 5, 6, 7});
    document.SetRange(1, 5);
    RevertAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    EXPECT_EQ(document.State().channels[0].samples, (std::vector<int16_t>{1, 6, 5, 4, 3, 2, 7}));
}

TEST(TransformEdgeTest, RevertPhasesOfTheExtremes)
{
    TestDocument document;
    document.AddChannel({-32768, 32767, 0});
    document.SetRange(0, 2);
    RevertPhasesAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    EXPECT_EQ(document.State().channels[0].samples, (std::vector<int16_t>{-32768, -32767, 0}));
}

TEST(TransformEdgeTest, ChannelsStartingLaterAreTransformedOnTheTimeline)
{
    TestDocument document;
    document.AddChannel({1, 2, 3, 4, 5, 6});
    document.AddChannel({10, 20, 30}, 2);
    document.SetRange(2, 4);
    RevertAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    const DocumentState after = document.State();
    EXPECT_EQ(after.channels[0].samples, (std::vector<int16_t>{1, 2, 5, 4, 3, 6}));
    EXPECT_EQ(after.channels[1].samples, (std::vector<int16_t>{30, 20, 10}));
    EXPECT_EQ(after.channels[1].first, 2);
}

}  // namespace
}  // namespace glimmet

namespace glimmet {
namespace {

using test::TestDocument;

TEST(TransformBufferTest, FirstChannelWhoseCopyFailsGetsSilence)
{
    TestDocument document;
    document.AddChannel({7, 8, 9}, 0, true);
    document.AddChannel({1, 2, 3, 4, 5, 6}, 0, true);
    document.SetRange(3, 5);
    RevertPhasesAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    EXPECT_EQ(document.State().channels[0].samples, (std::vector<int16_t>{7, 8, 9, 0, 0, 0}));
    EXPECT_EQ(document.State().channels[1].samples, (std::vector<int16_t>{1, 2, 3, -4, -5, -6}));
}

TEST(TransformBufferTest, MaximizeCarriesTheBufferAcrossItsPasses)
{
    // The short first channel's copies fail in both passes: in the second it
    // is given what the first pass left, the last channel's unscaled range.
    TestDocument document;
    document.AddChannel({7, 8, 9}, 0, true);
    document.AddChannel({1, 2, 3, 40, -50, 60}, 0, true);
    document.SetRange(3, 5);
    MaximizeAction action(nullptr);
    ASSERT_EQ(action.SetTo(&document.manager, &document.position), B_OK);
    ASSERT_EQ(action.Go(), B_OK);
    const double factor = double(32767.0f / 60.0f);
    auto scaled = [factor](int s) { return test::TransformReference::Low16(factor * s); };
    const std::vector<int16_t> range{scaled(40), scaled(-50), scaled(60)};
    EXPECT_EQ(document.State().channels[0].samples, (std::vector<int16_t>{7, 8, 9, range[0], range[1], range[2]}));
    EXPECT_EQ(document.State().channels[1].samples, (std::vector<int16_t>{1, 2, 3, range[0], range[1], range[2]}));
}

}  // namespace
}  // namespace glimmet
