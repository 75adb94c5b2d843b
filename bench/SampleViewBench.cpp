// Redrawing 1920 x 200 views of a one-hour stereo document held as blocks of
// 65536 samples: shaded from the blocks' summaries, and shaded from the
// samples as the views did before summaries, each beside one plain pass
// over the same samples measured in the same run; then 100 zoom-slider-like
// display range changes, each rendered in full in both views.
#include <algorithm>
#include <array>
#include <ctime>
#include <utility>
#include <cstdio>
#include <memory>
#include <random>
#include <vector>

#include <QImage>

#include "sound/BlockBuilder.h"
#include "sound/SampleBlock.h"
#include "views/BlockSummary.h"
#include "views/WaveformRenderer.h"

namespace glimmet {
namespace {

constexpr int64_t kOneHourFrames = 158760000;
// The size channels build their blocks in, so the bench reads what ships.
constexpr int64_t kBlockFrames = BlockBuilder::kBlockSamples;
constexpr int kChannels = 2;
constexpr int kWidth = 1920;
constexpr int kHeight = 200;
constexpr int kZoomSteps = 100;

/// One channel as blocks of noise-like samples, with the spans over them,
/// once as blocks and once as plain samples (no block: shaded directly).
struct BlockChannel {
    std::vector<BlockRef> blocks;
    std::vector<SampleSpan> spans;
    std::vector<SampleSpan> plainSpans;

    explicit BlockChannel(uint32_t seed)
    {
        std::minstd_rand random(seed);
        for (int64_t at = 0; at < kOneHourFrames; at += kBlockFrames) {
            const int64_t count = std::min(kBlockFrames, kOneHourFrames - at);
            std::shared_ptr<SampleBlock> block = SampleBlock::Allocate(count);
            for (int64_t i = 0; i < count; ++i)
                block->MutableSamples()[i] = int16_t(random() & 0xffff);
            spans.push_back({block->Samples(), count, block.get(), 0});
            plainSpans.push_back({block->Samples(), count, nullptr, 0});
            blocks.push_back(std::move(block));
        }
    }

    size_t SummaryBytes() const
    {
        size_t bytes = 0;
        for (const BlockRef& block : blocks) {
            if (const auto summary = block->Summary())
                bytes += summary->Bytes();
        }
        return bytes;
    }
};

std::array<int16_t, 8192> RowTable(int rows)
{
    std::array<int16_t, 8192> table{};
    const uint32_t divisor = 65535u / uint32_t(rows) + 1;
    for (uint32_t i = 0; i < table.size(); ++i)
        table[i] = int16_t((8 * i) / divisor);
    return table;
}

struct Views {
    std::vector<std::unique_ptr<BlockChannel>> channels;
    std::vector<QImage> images;
    std::array<int16_t, 8192> table = RowTable(kHeight);

    Views()
    {
        for (int c = 0; c < kChannels; ++c) {
            channels.push_back(std::make_unique<BlockChannel>(uint32_t(c + 1)));
            images.emplace_back(kWidth, kHeight, QImage::Format_RGB32);
        }
    }

    /// Renders every column of view c for the display range.
    void Render(int c, int64_t first, int64_t last, bool plain, std::vector<const SampleBlock*>* wanted = nullptr)
    {
        WaveformScene scene;
        scene.firstFrame = first;
        scene.lastFrame = last;
        scene.cursorFrame = kOneHourFrames / 3;
        scene.playmarkFrame = kOneHourFrames / 2;
        scene.channelFrameCount = kOneHourFrames;
        scene.spans = plain ? channels[size_t(c)]->plainSpans : channels[size_t(c)]->spans;
        scene.framesPerColumn = float(last - first + 1) / float(kWidth);
        WaveformRenderer renderer(images[size_t(c)], table.data(), kHeight, scene);
        if (wanted != nullptr)
            renderer.DeferSummaries(wanted);
        renderer.RenderColumns(0, kWidth);
        asm volatile("" : : "r"(images[size_t(c)].constBits()) : "memory");
    }

    void RenderAll(int64_t first, int64_t last, bool plain)
    {
        for (int c = 0; c < kChannels; ++c)
            Render(c, first, last, plain);
    }

    int64_t Sum() const
    {
        int64_t sum = 0;
        for (const auto& channel : channels) {
            for (const SampleSpan& span : channel->plainSpans) {
                for (int64_t i = 0; i < span.count; ++i)
                    sum += span.samples[i];
            }
        }
        return sum;
    }
};

// The machine the benchmarks run on is shared, so the figures are the
// thread's processor time, not wall time: other processes' load then changes
// neither the baseline nor the work compared with it.
double ThreadNanoseconds()
{
    timespec now{};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return double(now.tv_sec) * 1e9 + double(now.tv_nsec);
}

template <typename Work>
double BestCpuNanoseconds(int rounds, Work&& work)
{
    double best = 0;
    for (int round = 0; round < rounds; ++round) {
        const double start = ThreadNanoseconds();
        work();
        const double spent = ThreadNanoseconds() - start;
        if (round == 0 || spent < best)
            best = spent;
    }
    return best;
}

double Milliseconds(double nanoseconds)
{
    return nanoseconds / 1e6;
}

// Like dragging both zoom slider handles towards the middle: the span
// shrinks from the whole hour to a fiftieth of it.
std::pair<int64_t, int64_t> ZoomStep(int step)
{
    const int64_t inset = int64_t(double(kOneHourFrames) * 0.49 * double(step + 1) / double(kZoomSteps));
    return {inset, kOneHourFrames - 1 - inset};
}

void Run()
{
    Views views;
    const int64_t last = kOneHourFrames - 1;
    std::printf("one hour: %d channels of %lld samples in blocks of %lld; views %d x %d\n", kChannels,
                (long long)kOneHourFrames, (long long)kBlockFrames, kWidth, kHeight);

    const double sumNs = BestCpuNanoseconds(5, [&] {
        const int64_t sum = views.Sum();
        asm volatile("" : : "r"(sum));
    });
    const double plainNs = BestCpuNanoseconds(2, [&] { views.RenderAll(0, last, true); });
    // The views' first render reads the samples and only lists the blocks
    // that want a summary; the window makes them afterwards, while idle.
    std::vector<const SampleBlock*> wanted;
    const double firstNs = BestCpuNanoseconds(1, [&] {
        for (int c = 0; c < kChannels; ++c)
            views.Render(c, 0, last, false, &wanted);
    });
    const uint64_t key = BlockSummary::KeyOf(views.table.data());
    const double idleNs = BestCpuNanoseconds(1, [&] {
        for (const SampleBlock* block : wanted)
            block->SetSummary(BlockSummary::Make(block->Samples(), block->Count(), views.table.data(), key));
    });
    const double redrawNs = BestCpuNanoseconds(10, [&] { views.RenderAll(0, last, false); });
    const double zoomNs = BestCpuNanoseconds(1, [&] {
        for (int step = 0; step < kZoomSteps; ++step) {
            const auto [first, end] = ZoomStep(step);
            views.RenderAll(first, end, false);
        }
    });
    const double zoomStepNs = zoomNs / kZoomSteps;

    size_t summaryBytes = 0;
    for (const auto& channel : views.channels)
        summaryBytes += channel->SummaryBytes();
    const double sampleBytes = double(kChannels) * double(kOneHourFrames) * sizeof(int16_t);

    std::printf("%-52s %10.2f ms  ratio 1\n", "baseline: one plain pass (sum) over both channels", Milliseconds(sumNs));
    std::printf("%-52s %10.2f ms  ratio %.3f\n", "full redraw, shaded from the samples", Milliseconds(plainNs),
                plainNs / sumNs);
    std::printf("%-52s %10.2f ms  ratio %.3f  (%.2fx the redraw from samples)\n", "first redraw from blocks",
                Milliseconds(firstNs), firstNs / sumNs, firstNs / plainNs);
    std::printf("%-52s %10.2f ms  ratio %.3f  (%zu blocks, while idle)\n", "then making their summaries",
                Milliseconds(idleNs), idleNs / sumNs, wanted.size());
    std::printf("%-52s %10.2f ms  ratio %.3f  (%.2f ms per view)\n", "full redraw from summaries",
                Milliseconds(redrawNs), redrawNs / sumNs, Milliseconds(redrawNs) / kChannels);
    std::printf("%-52s %10.2f ms  ratio %.3f  (%.1f steps/s)\n", "zoom step (both views rendered)",
                Milliseconds(zoomStepNs), zoomStepNs / sumNs, 1.0 / (zoomStepNs / 1e9));
    std::printf("%-52s %10.1f MB  (%.1f%% of the samples)\n", "summaries held", double(summaryBytes) / 1e6,
                100.0 * double(summaryBytes) / sampleBytes);
}

}  // namespace
}  // namespace glimmet

int main()
{
    glimmet::Run();
    return 0;
}
