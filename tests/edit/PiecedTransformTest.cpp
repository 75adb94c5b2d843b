#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <random>
#include <span>
#include <vector>

#include "CurveDialogFake.h"
#include "TestDocument.h"
#include "edit/CompressorAction.h"
#include "edit/DistortAction.h"
#include "edit/EnvelopeAction.h"
#include "edit/FadeInAction.h"
#include "edit/FadeOutAction.h"
#include "edit/FilterAction.h"
#include "edit/MaximizeAction.h"
#include "edit/RevertAction.h"
#include "edit/RevertPhasesAction.h"
#include "edit/SampleTransform.h"
#include "edit/effects/Distortion.h"
#include "edit/effects/EnvelopeShape.h"
#include "edit/effects/FirFilter.h"
#include "edit/effects/PeakDistortion.h"
#include "sound/BlockBuilder.h"

// The transforms run a block at a time; these tests hold them to a plain
// whole-range run over one array buffer shared by all channels and passes,
// for ranges before, across and past channels of several blocks, with
// silence stored as shared blocks inside the data too.

namespace glimmet {
namespace {

using test::CurveDialogFake;
using test::CurveDialogLog;
using test::TestDocument;

using WholeTransform = std::function<void(int16_t*, int64_t)>;

/// The array algorithm: copy the range into the buffer, rewrite it, write
/// it back; a failed copy leaves the buffer as it was.
void ReferencePass(ChannelManager& manager, int64_t start, int64_t end, std::vector<int16_t>& buffer,
    const WholeTransform& transform, bool writeBack)
{
    const int64_t count = end - start + 1;
    for (int32_t i = 0; Channel* channel = manager.ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        channel->FillBuffer(buffer.data(), start, count);
        transform(buffer.data(), count);
        if (writeBack)
            channel->ReplaceFrames(buffer.data(), count, start, end);
    }
}

struct Case {
    const char* name;
    std::function<std::unique_ptr<Action>()> make;
    /// Runs the reference over the document's range with a shared buffer.
    std::function<void(ChannelManager&, int64_t, int64_t, std::vector<int16_t>&)> reference;
};

std::function<void(ChannelManager&, int64_t, int64_t, std::vector<int16_t>&)> Simple(WholeTransform transform)
{
    return [transform](ChannelManager& m, int64_t s, int64_t e, std::vector<int16_t>& b) {
        ReferencePass(m, s, e, b, transform, true);
    };
}

void MaximizeReference(ChannelManager& m, int64_t s, int64_t e, std::vector<int16_t>& b)
{
    int16_t peak = 0;
    ReferencePass(m, s, e, b, [&peak](int16_t* x, int64_t n) { peak = SampleTransform::Peak(x, n, peak); }, false);
    if (std::abs(int32_t(peak)) <= 32766) {
        const float factor = SampleTransform::MaximizeFactor(peak);
        ReferencePass(m, s, e, b, [factor](int16_t* x, int64_t n) { SampleTransform::Scale(x, n, factor); }, true);
    }
}

const std::vector<double> kKnotsX{0.0, 0.3, 0.7, 1.0};
const std::vector<double> kKnotsY{0.1, 0.6, 0.2, 0.9};

std::unique_ptr<CurveDialogFake> Dialog()
{
    return std::make_unique<CurveDialogFake>(std::make_shared<CurveDialogLog>(), kKnotsX, kKnotsY);
}

constexpr int32_t kTaps = 37;

std::unique_ptr<CurveDialogFake> FilterDialog()
{
    std::unique_ptr<CurveDialogFake> dialog = Dialog();
    dialog->SetPasses(kTaps);
    return dialog;
}

/// The filter's array algorithm: its input buffer holds the taps frames
/// before the range and the range, its output buffer the filtered range;
/// both serve every channel, and a failed copy leaves the input as it was.
void FilterReference(const std::vector<double>& kernel, ChannelManager& manager, int64_t start, int64_t end)
{
    const int64_t count = end - start + 1;
    const int64_t taps = int64_t(kernel.size());
    std::vector<int16_t> input(size_t(count + taps), 0);
    std::vector<int16_t> output(static_cast<size_t>(count));
    for (int32_t i = 0; Channel* channel = manager.ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        channel->FillBuffer(input.data(), start - taps, count + taps);
        effects::FirFilter(input, kernel, output);
        channel->ReplaceFrames(output.data(), count, start, end);
    }
}

std::vector<Case> Cases()
{
    const effects::SplineCurve curve = Dialog()->Curve();
    return {
        {"FadeIn", [] { return std::make_unique<FadeInAction>(nullptr); }, Simple(SampleTransform::FadeIn)},
        {"FadeOut", [] { return std::make_unique<FadeOutAction>(nullptr); }, Simple(SampleTransform::FadeOut)},
        {"Revert", [] { return std::make_unique<RevertAction>(nullptr); }, Simple(SampleTransform::Revert)},
        {"RevertPhases", [] { return std::make_unique<RevertPhasesAction>(nullptr); },
            Simple(SampleTransform::RevertPhases)},
        {"Maximize", [] { return std::make_unique<MaximizeAction>(nullptr); }, MaximizeReference},
        {"Distort", [] { return std::make_unique<DistortAction>(nullptr, Dialog()); },
            Simple([curve](int16_t* x, int64_t n) { effects::Distort(std::span<int16_t>(x, size_t(n)), curve); })},
        {"Envelope", [] { return std::make_unique<EnvelopeAction>(nullptr, Dialog()); },
            Simple([curve](int16_t* x, int64_t n) {
                effects::ApplyEnvelope(std::span<int16_t>(x, size_t(n)), curve);
            })},
        {"PeakDistort", [] { return std::make_unique<CompressorAction>(nullptr, Dialog()); },
            Simple([curve](int16_t* x, int64_t n) {
                effects::PeakDistort(std::span<int16_t>(x, size_t(n)), curve);
            })},
        {"Filter", [] { return std::make_unique<FilterAction>(nullptr, FilterDialog()); },
            [kernel = effects::FirKernel(curve, kTaps)](ChannelManager& m, int64_t s, int64_t e,
                std::vector<int16_t>&) { FilterReference(kernel, m, s, e); }},
    };
}

/// Channels of up to a few blocks at random places, some quiet enough for
/// Maximize to scale, some holding shared silence in the middle.
void MakeChannels(std::mt19937& random, TestDocument& a, TestDocument& b)
{
    std::uniform_int_distribution<int64_t> length(1, 3 * BlockBuilder::kBlockSamples);
    std::uniform_int_distribution<int64_t> first(0, 2 * BlockBuilder::kBlockSamples);
    std::uniform_int_distribution<int> coin(0, 2);
    const int channels = 1 + coin(random);
    for (int c = 0; c < channels; c++) {
        std::vector<int16_t> samples = test::RandomSamples(random, size_t(length(random)));
        if (coin(random) == 0) {
            for (int16_t& s : samples)
                s = int16_t(s / 7);
        }
        if (coin(random) == 0) {
            // Long runs of one sign, crossing blocks, with a few zeros.
            for (size_t k = 0; k < samples.size(); k++) {
                const int32_t sign = (k / 40000) % 2 == 0 ? 1 : -1;
                const int32_t magnitude = std::abs(int32_t(samples[k])) % 30000 + (k % 50000 == 7 ? -1 : 1);
                samples[k] = int16_t(sign * magnitude);
            }
        }
        const int64_t at = first(random);
        const bool selected = coin(random) != 0;
        Channel* ca = a.AddChannel(samples, at, selected);
        Channel* cb = b.AddChannel(samples, at, selected);
        if (coin(random) == 0) {
            SampleSlice silence;
            silence.leading = BlockBuilder::kBlockSamples * 2 + 17;
            const int64_t where = at + int64_t(samples.size()) / 2;
            ca->InsertFrames(silence, where);
            cb->InsertFrames(silence, where);
        }
    }
}

/// A range before, across, past or exactly at the end of a channel's data.
std::pair<int64_t, int64_t> RandomRange(std::mt19937& random, TestDocument& document)
{
    std::uniform_int_distribution<int32_t> kind(0, 5);
    Channel* channel = document.manager.ChannelAt(0);
    const int64_t first = channel->FirstFrame();
    const int64_t end = channel->EndFrame();
    std::uniform_int_distribution<int64_t> span(1, 4 * BlockBuilder::kBlockSamples);
    std::uniform_int_distribution<int64_t> anywhere(0, end + BlockBuilder::kBlockSamples);
    int64_t start = anywhere(random);
    switch (kind(random)) {
    case 0:
        start = end;  // the copy fails: the buffer's old content is used
        break;
    case 1:
        start = std::max<int64_t>(0, first - span(random));
        break;
    case 2:
        start = end + span(random);
        break;
    default:
        break;
    }
    return {start, start + span(random) - 1};
}

TEST(PiecedTransformTest, EveryTransformMatchesTheWholeRangeArrayRun)
{
    std::mt19937 random(20261123);
    for (const Case& transform : Cases()) {
        for (int round = 0; round < 25; round++) {
            TestDocument pieced;
            TestDocument whole;
            MakeChannels(random, pieced, whole);
            const auto [wantedStart, wantedEnd] = RandomRange(random, pieced);
            pieced.SetRange(wantedStart, wantedEnd);
            whole.SetRange(wantedStart, wantedEnd);
            // The document may clamp what was asked for.
            const int64_t start = pieced.manager.RangeStart();
            const int64_t end = pieced.manager.RangeEnd();

            // A redo computes again on what the undo left, which differs
            // from the first run when the range reached outside a channel.
            bool inside = true;
            for (int32_t c = 0; Channel* channel = pieced.manager.ChannelAt(c); c++) {
                if (channel->IsSelected())
                    inside = inside && channel->FirstFrame() <= start && end < channel->EndFrame();
            }
            std::unique_ptr<Action> action = transform.make();
            ASSERT_EQ(action->SetTo(&pieced.manager, &pieced.position), B_OK);
            ASSERT_EQ(action->Go(), B_OK);
            std::vector<int16_t> buffer(size_t(end - start + 1), 0);
            transform.reference(whole.manager, start, end, buffer);
            ASSERT_EQ(pieced.State(), whole.State())
                << transform.name << " round " << round << " range " << start << ".." << end;

            ASSERT_EQ(action->Undo(), B_OK);
            ASSERT_EQ(action->Redo(), B_OK);
            if (inside) {
                ASSERT_EQ(pieced.State(), whole.State()) << transform.name << " redo, round " << round;
            }
        }
    }
}

}  // namespace
}  // namespace glimmet
