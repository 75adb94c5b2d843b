#include <gtest/gtest.h>

#include <chrono>
#include <functional>
#include <memory>
#include <vector>

#include "CurveDialogFake.h"
#include "MemoryLimit.h"
#include "TestDocument.h"
#include "StretchDialogFake.h"
#include "edit/CompressorAction.h"
#include "edit/DistortAction.h"
#include "edit/EnvelopeAction.h"
#include "edit/FadeInAction.h"
#include "edit/FadeOutAction.h"
#include "edit/FilterAction.h"
#include "edit/MaximizeAction.h"
#include "edit/RevertAction.h"
#include "edit/RevertPhasesAction.h"
#include "edit/StretchAction.h"
#include "edit/vocoder/VocoderState.h"

// Ranges typed far beyond a short document: every transform must finish in
// memory bounded by the document's data (a billion frames of silence would
// be 2 GB as samples) and quickly, and undo must give the document back.

namespace glimmet {
namespace {

using test::TestDocument;

// Far less than any of the ranges below would take as samples.
constexpr int64_t kAllowance = int64_t(200) << 20;

struct Maker {
    const char* name;
    std::function<std::unique_ptr<Action>()> make;
};

std::vector<Maker> Transforms()
{
    const auto dialog = [] {
        auto fake = std::make_unique<test::CurveDialogFake>(std::make_shared<test::CurveDialogLog>(),
            std::vector<double>{0.0, 1.0}, std::vector<double>{0.2, 0.7});
        fake->SetReadable(false);  // the gain-of-zero envelope: every frame 0
        return fake;
    };
    // A drawn curve that lifts 0: silence becomes a constant.
    const auto drawn = [](int32_t passes) {
        auto fake = std::make_unique<test::CurveDialogFake>(std::make_shared<test::CurveDialogLog>(),
            std::vector<double>{0.0, 0.4, 1.0}, std::vector<double>{0.3, 0.9, 0.6});
        fake->SetPasses(passes);
        return fake;
    };
    return {
        {"FadeIn", [] { return std::make_unique<FadeInAction>(nullptr); }},
        {"FadeOut", [] { return std::make_unique<FadeOutAction>(nullptr); }},
        {"Revert", [] { return std::make_unique<RevertAction>(nullptr); }},
        {"RevertPhases", [] { return std::make_unique<RevertPhasesAction>(nullptr); }},
        {"Maximize", [] { return std::make_unique<MaximizeAction>(nullptr); }},
        {"Distort", [dialog] { return std::make_unique<DistortAction>(nullptr, dialog()); }},
        {"Envelope", [dialog] { return std::make_unique<EnvelopeAction>(nullptr, dialog()); }},
        {"DrawnEnvelope", [drawn] { return std::make_unique<EnvelopeAction>(nullptr, drawn(0)); }},
        {"DrawnDistort", [drawn] { return std::make_unique<DistortAction>(nullptr, drawn(0)); }},
        {"PeakDistort", [drawn] { return std::make_unique<CompressorAction>(nullptr, drawn(0)); }},
        {"UnreadablePeakDistort", [dialog] { return std::make_unique<CompressorAction>(nullptr, dialog()); }},
        {"Filter", [drawn] { return std::make_unique<FilterAction>(nullptr, drawn(64)); }},
    };
}

struct Range {
    int64_t start;
    int64_t end;
};

const Range kRanges[] = {
    {-1000000000, 100},
    {-2147483648, -2147483648},
    {0, 2147483647},
    {100, 1000000000},
    {22050, 1500000000},  // starts exactly at the end of the first channel
    {2147483647, -2147483648},  // reversed
};

// Exit codes of the child, so that a failure says what went wrong.
enum Outcome { kOk = 0, kGoFailed = 1, kUndoWrong = 2, kTooSlow = 3 };

int RunOne(const Maker& maker, const Range& range)
{
    TestDocument document;
    document.AddChannel(test::Ramp(-11025, 22050), 0, true);
    document.AddChannel(test::Ramp(-500, 1000), 300, true);
    document.AddChannel(test::Ramp(7, 22050), 0, false);
    document.SetRange(range.start, range.end);
    const test::DocumentState before = document.State();
    const auto started = std::chrono::steady_clock::now();
    std::unique_ptr<Action> action = maker.make();
    action->SetTo(&document.manager, &document.position);
    if (action->Go() != B_OK)
        return kGoFailed;
    action->Undo();
    action->Redo();
    action->Undo();
    if (std::chrono::steady_clock::now() - started > std::chrono::seconds(20))
        return kTooSlow;
    // Only where the data lies may legitimately differ after undo (a channel
    // grown by a range outside its data keeps its new extent); the timeline
    // reads as before where the channel had data. Read through FillBuffer:
    // a grown channel may be too long to hold in one array.
    for (size_t c = 0; c < before.channels.size(); c++) {
        const test::ChannelState& was = before.channels[c];
        Channel* channel = document.manager.ChannelAt(int32_t(c));
        std::vector<int16_t> is(was.samples.size());
        channel->FillBuffer(is.data(), was.first, int64_t(is.size()));
        if (is != was.samples)
            return kUndoWrong;
    }
    return kOk;
}

TEST(AbsurdRangeTest, TransformsOverHugeRangesStayWithinMemoryAndUndo)
{
    for (const Maker& maker : Transforms()) {
        for (const Range& range : kRanges) {
            const int result = test::RunUnderMemoryLimit(kAllowance, [&] { return RunOne(maker, range); });
            EXPECT_EQ(result, kOk) << maker.name << " over " << range.start << ".." << range.end;
        }
    }
}

// The stretch cannot be undone; it must finish in bounded memory and leave
// the stretched range's length behind it.
int RunStretch(const Range& range)
{
    VocoderState::Shared().Reset();
    TestDocument document;
    document.AddChannel(test::Ramp(-11025, 22050), 0, true);
    document.AddChannel(test::Ramp(7, 22050), 0, false);
    document.SetRange(range.start, range.end);
    const int64_t start = document.manager.RangeStart();
    const int64_t end = document.manager.RangeEnd();
    StretchParameters values = test::DefaultStretchParameters();
    values.stretch = 1.5f;
    const auto started = std::chrono::steady_clock::now();
    StretchAction action(nullptr, std::make_unique<test::StretchDialogFake>(
        std::make_shared<test::StretchDialogLog>(), values));
    action.SetTo(&document.manager, &document.position);
    if (action.Go() != B_OK)
        return kGoFailed;
    if (std::chrono::steady_clock::now() - started > std::chrono::seconds(60))
        return kTooSlow;
    Channel* stretched = document.manager.ChannelAt(0);
    const int64_t length = StretchAction::StretchedLength(end - start + 1, values.stretch);
    // The range's frames become the stretched ones, at most the channel's
    // own frames beside them; a range starting before frame 0 cannot be
    // written back and leaves the channel as it was.
    const int64_t frames = stretched->FrameCount();
    const bool written = frames >= length && frames <= length + 22050;
    if (start >= 0 ? !written : frames != 22050)
        return kUndoWrong;
    return kOk;
}

// The stretch's time grows with its range, about 5 s per billion frames;
// the sanitizers make it many times slower, so there the ranges are a tenth
// as long (still far beyond what memory may be sized by).
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr int64_t kStretchRangeDivisor = 10;
#else
constexpr int64_t kStretchRangeDivisor = 1;
#endif

TEST(AbsurdRangeTest, TimeStretchOverHugeRangesStaysWithinMemory)
{
    constexpr int64_t kBillion = 1000000000 / kStretchRangeDivisor;
    for (const Range& range : {Range{-kBillion, 100}, Range{100, kBillion}, Range{0, kBillion * 2 / 5}}) {
        const int result = test::RunUnderMemoryLimit(kAllowance, [&] { return RunStretch(range); });
        EXPECT_EQ(result, kOk) << "Time Stretch over " << range.start << ".." << range.end;
    }
}

}  // namespace
}  // namespace glimmet
