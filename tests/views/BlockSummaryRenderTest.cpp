#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <memory>
#include <random>
#include <vector>

#include "WaveformReference.h"
#include "sound/SampleBlock.h"
#include "views/BlockSummary.h"
#include "views/WaveformRenderer.h"

namespace glimmet::test {
namespace {

using RowTable = std::array<int16_t, 8192>;

RowTable TableFor(int rows)
{
    RowTable table{};
    const uint32_t divisor = 65535u / uint32_t(rows) + 1;
    for (uint32_t i = 0; i < table.size(); ++i)
        table[i] = int16_t((8 * i) / divisor);
    return table;
}

/// A channel's samples cut into blocks, with the spans over them.
struct BlockChannel {
    std::vector<int16_t> samples;
    std::vector<std::shared_ptr<SampleBlock>> blocks;
    std::vector<SampleSpan> spans;

    /// Cuts samples into blocks of the sizes (the last takes the rest) and
    /// spans that may show only part of each block.
    void Cut(const std::vector<int64_t>& sizes, std::mt19937& random)
    {
        int64_t at = 0;
        for (size_t i = 0; at < int64_t(samples.size()); ++i) {
            const int64_t size = std::min(i < sizes.size() ? sizes[i] : int64_t(samples.size()), int64_t(samples.size()) - at);
            // Some blocks hold samples before and after the part shown.
            const int64_t before = random() % 3 == 0 ? int64_t(random() % 700) : 0;
            const int64_t after = random() % 3 == 0 ? int64_t(random() % 700) : 0;
            std::shared_ptr<SampleBlock> block = SampleBlock::Allocate(before + size + after);
            ASSERT_NE(block, nullptr);
            for (int64_t k = 0; k < before + size + after; ++k)
                block->MutableSamples()[k] = int16_t(random());
            std::copy(samples.begin() + at, samples.begin() + at + size, block->MutableSamples() + before);
            spans.push_back({block->Samples() + before, size, block.get(), before});
            blocks.push_back(block);
            at += size;
        }
    }
};

struct ViewCase {
    int width = 1;
    int height = 1;
    WaveformScene scene;
};

QImage Render(const ViewCase& view, std::span<const SampleSpan> spans, int64_t* summariesMade = nullptr)
{
    QImage image(view.width, view.height, QImage::Format_RGB32);
    image.fill(qRgb(1, 2, 3));
    const RowTable table = TableFor(view.height);
    WaveformScene scene = view.scene;
    scene.spans = spans;
    WaveformRenderer renderer(image, table.data(), view.height, scene);
    renderer.RenderColumns(0, view.width);
    if (summariesMade != nullptr)
        *summariesMade += renderer.SummariesMade();
    return image;
}

QImage RenderDirect(const ViewCase& view, const std::vector<int16_t>& samples)
{
    const SampleSpan whole{samples.data(), int64_t(samples.size()), nullptr, 0};
    return Render(view, samples.empty() ? std::span<const SampleSpan>() : std::span<const SampleSpan>(&whole, 1));
}

std::vector<int16_t> RandomSamples(std::mt19937& random, int64_t count)
{
    std::vector<int16_t> samples(size_t(count), int16_t(0));
    const int kind = int(random() % 5);
    const int amplitude = kind == 3 ? int(random() % 300) + 1 : 32768;
    const double period = 20.0 + double(random() % 5000);
    int16_t steady = int16_t(random());
    for (int64_t i = 0; i < count; ++i) {
        int value = 0;
        switch (kind) {
        case 0:  // noise over the full scale
            value = int(int16_t(random()));
            break;
        case 1:  // a tone
            value = int(std::lround(32767.0 * std::sin(double(i) * 2 * M_PI / period)));
            break;
        case 2:  // long steady stretches, so that one row takes a whole column
            if (random() % 20000 == 0)
                steady = int16_t(random());
            value = steady;
            break;
        case 3:  // quiet noise: few rows, fine chunks
            value = int(random() % uint32_t(2 * amplitude)) - amplitude;
            break;
        default:  // the extremes
            value = random() % 2 ? 32767 : -32768;
            break;
        }
        samples[size_t(i)] = int16_t(std::clamp(value, -32768, 32767));
    }
    return samples;
}

std::vector<int64_t> RandomBlockSizes(std::mt19937& random, int64_t total)
{
    std::vector<int64_t> sizes;
    const int64_t typical = int64_t(1) << (4 + random() % 14);
    for (int64_t at = 0; at < total;) {
        // Now and then a block shorter than any chunk.
        const int64_t size = random() % 6 == 0 ? 1 + int64_t(random() % 200) : 1 + int64_t(random() % uint32_t(2 * typical));
        sizes.push_back(size);
        at += size;
    }
    return sizes;
}

ViewCase RandomView(std::mt19937& random, int64_t count)
{
    ViewCase view;
    const bool wide = random() % 8 == 0;
    view.width = wide ? 1 + int(random() % 4) : 1 + int(random() % 240);
    view.height = random() % 10 == 0 ? 1 + int(random() % 4) : 1 + int(random() % 260);
    WaveformScene& scene = view.scene;
    scene.channelFirstFrame = random() % 4 == 0 ? int64_t(random() % 5000) : 0;
    const int64_t extent = count + scene.channelFirstFrame;
    scene.firstFrame = random() % 3 == 0 ? 0 : int64_t(random() % uint32_t(extent + 1));
    const int64_t span = std::max<int64_t>(view.width, 1 + int64_t(random() % uint32_t(extent + 2 * view.width)));
    scene.lastFrame = scene.firstFrame + (random() % 4 == 0 ? extent : span) - 1;
    scene.framesPerColumn = float(scene.lastFrame - scene.firstFrame + 1) / float(view.width);
    const auto frame = [&] { return int64_t(random() % uint32_t(extent + 10)) - 5; };
    scene.selected = random() % 2 == 0;
    if (random() % 3 != 0) {
        scene.rangeStart = frame();
        scene.rangeEnd = scene.rangeStart + int64_t(random() % uint32_t(extent + 1));
    }
    scene.cursorFrame = frame();
    scene.playmarkFrame = random() % 3 == 0 ? -1 : frame();
    scene.channelFrameCount = count;
    return view;
}

// Thousands of views of channels cut into blocks at random: rendering from
// the blocks, with and without their summaries, gives exactly the picture
// rendering the plain samples gives.
// Under the sanitizers a quarter of the trials runs: they look for memory
// errors, which the same paths show in fewer views, and the full count
// would take most of a minute there.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr int kTrials = 500;
#else
constexpr int kTrials = 2000;
#endif

TEST(BlockSummaryRender, RandomViewsMatchRenderingTheSamples)
{
    std::mt19937 random(20261123);
    int64_t summariesMade = 0;
    int compared = 0;
    for (int trial = 0; trial < kTrials; ++trial) {
        const int64_t count = random() % 10 == 0 ? 70000 + int64_t(random() % 200000) : int64_t(random() % 40000);
        BlockChannel channel;
        channel.samples = RandomSamples(random, count);
        channel.Cut(RandomBlockSizes(random, count), random);
        for (int look = 0; look < 3; ++look) {
            const ViewCase view = RandomView(random, count);
            const QImage direct = RenderDirect(view, channel.samples);
            // The first render from the blocks makes summaries as it goes;
            // the second finds them made.
            const QImage first = Render(view, channel.spans, &summariesMade);
            const QImage again = Render(view, channel.spans, &summariesMade);
            SCOPED_TRACE(::testing::Message() << "trial " << trial << " look " << look << " view " << view.width << "x"
                                              << view.height << " frames " << view.scene.firstFrame << ".."
                                              << view.scene.lastFrame << " of " << count);
            ASSERT_EQ(FirstDifference(first, direct), "");
            ASSERT_EQ(FirstDifference(again, direct), "");
            ++compared;
        }
    }
    EXPECT_EQ(compared, 3 * kTrials);
    // The summaries must have been in play, or the test shows nothing.
    EXPECT_GT(summariesMade, kTrials);
}

// The direct rendering above is itself checked against the rules computed
// from scratch, on a smaller sample of views.
TEST(BlockSummaryRender, RandomViewsMatchTheRules)
{
    std::mt19937 random(77);
    for (int trial = 0; trial < 60; ++trial) {
        const int64_t count = int64_t(random() % 150000);
        BlockChannel channel;
        channel.samples = RandomSamples(random, count);
        channel.Cut(RandomBlockSizes(random, count), random);
        ViewCase view = RandomView(random, count);
        view.height = std::min(view.height, 60);
        Render(view, channel.spans);
        WaveformCase rules;
        rules.samples = channel.samples;
        rules.channelFirst = view.scene.channelFirstFrame;
        rules.first = view.scene.firstFrame;
        rules.last = view.scene.lastFrame;
        rules.rangeStart = view.scene.rangeStart;
        rules.rangeEnd = view.scene.rangeEnd;
        rules.cursor = view.scene.cursorFrame;
        rules.playmark = view.scene.playmarkFrame;
        rules.selected = view.scene.selected;
        rules.width = view.width;
        rules.height = view.height;
        SCOPED_TRACE(trial);
        ASSERT_EQ(FirstDifference(Render(view, channel.spans), ReferenceWaveform(rules)), "");
    }
}

}  // namespace
}  // namespace glimmet::test
