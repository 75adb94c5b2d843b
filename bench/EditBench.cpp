// Removing one second from the middle of a one-hour stereo document,
// pasting one minute into it, and undoing each.
//
// Each iteration times the action (binding and Go) and its undo, and in the
// same iteration a memmove of the document's channel bytes (the work an
// edit that rebuilds every channel cannot avoid); it reports the times and
// the ratios to the memmove.

#include <benchmark/benchmark.h>

#include "BenchSupport.h"

#include <chrono>
#include <cstring>
#include <memory>
#include <vector>

#include "edit/CopyBuffer.h"
#include "edit/EditPosition.h"
#include "edit/PasteAction.h"
#include "edit/RemoveAction.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {
namespace {

using bench::Seconds;

constexpr int64_t kRate = 44100;
constexpr int64_t kFrames = 3600 * kRate;
constexpr int kChannels = 2;

template <typename Function>
double Timed(Function function)
{
    const auto begin = std::chrono::steady_clock::now();
    function();
    return Seconds(std::chrono::steady_clock::now() - begin);
}

/// A one-hour stereo document with both channels selected.
struct Document {
    ChannelManager manager{nullptr};
    EditPosition position;

    Document()
    {
        for (int c = 0; c < kChannels; c++) {
            auto* channel = new Channel();
            auto* samples = new int16_t[size_t(kFrames)];
            for (int64_t i = 0; i < kFrames; i++)
                samples[i] = int16_t(i * (c + 3));
            channel->SetTo(samples, kFrames);
            channel->SetSelected(true);
            manager.AddChannel(std::unique_ptr<Channel>(channel));
        }
    }

    void Select(int64_t start, int64_t end, bool selected)
    {
        for (int c = 0; c < kChannels; c++)
            manager.ChannelAt(c)->SetSelected(selected);
        manager.SetRangeStart(start);
        manager.SetRangeEnd(end);
        position.SetCursorFrame(start);
    }
};

/// Times action, undo and the memmove baseline, and reports them.
template <typename MakeAction>
void RunEdit(benchmark::State& state, Document& document, int64_t start, int64_t end, bool selected, MakeAction make)
{
    const size_t bytes = size_t(kFrames) * kChannels * sizeof(int16_t);
    std::vector<int16_t> scratch(size_t(kFrames) * kChannels + 1, 1);
    double goTotal = 0;
    double undoTotal = 0;
    double memmoveTotal = 0;
    for (auto _ : state) {
        document.Select(start, end, selected);
        auto action = make();
        const double go = Timed([&] {
            action->SetTo(&document.manager, &document.position);
            action->Go();
        });
        goTotal += go;
        state.SetIterationTime(go);
        undoTotal += Timed([&] { action->Undo(); });
        memmoveTotal += Timed([&] {
            std::memmove(scratch.data() + 1, scratch.data(), bytes);
            benchmark::DoNotOptimize(scratch.data());
            benchmark::ClobberMemory();
        });
        if (document.manager.ChannelAt(0)->FrameCount() != kFrames) {
            state.SkipWithError("undo did not restore the document's length");
            break;
        }
    }
    const double runs = double(state.iterations());
    state.counters["action_ms"] = 1000 * goTotal / runs;
    state.counters["undo_ms"] = 1000 * undoTotal / runs;
    state.counters["memmove_ms"] = 1000 * memmoveTotal / runs;
    state.counters["action_over_memmove"] = goTotal / memmoveTotal;
    state.counters["undo_over_memmove"] = undoTotal / memmoveTotal;
}

Document& SharedDocument()
{
    static Document document;
    return document;
}

void BM_RemoveOneSecond(benchmark::State& state)
{
    const int64_t middle = kFrames / 2;
    RunEdit(state, SharedDocument(), middle, middle + kRate - 1, true,
        [] { return std::make_unique<RemoveAction>(nullptr); });
}

void BM_PasteOneMinute(benchmark::State& state)
{
    CopyBuffer copyBuffer;
    std::vector<CopyBuffer::Samples> minute;
    for (int c = 0; c < kChannels; c++) {
        minute.emplace_back(new int16_t[size_t(60 * kRate)]);
        std::memset(minute.back().get(), 0x11, size_t(60 * kRate) * sizeof(int16_t));
    }
    copyBuffer.SetCopyBuffer(std::move(minute), 60 * kRate);
    // No range and no selection: the minute is inserted at the cursor in
    // the middle of the focused channel and the one after it.
    Document& document = SharedDocument();
    const int64_t middle = kFrames / 2;
    RunEdit(state, document, -1, -1, false, [&document, &copyBuffer, middle] {
        document.position.SetCursorFrame(middle);
        return std::make_unique<PasteAction>(nullptr, &copyBuffer);
    });
}

BENCHMARK(BM_RemoveOneSecond)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_PasteOneMinute)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);

}  // namespace
}  // namespace glimmet

BENCHMARK_MAIN();
