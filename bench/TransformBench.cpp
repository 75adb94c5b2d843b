// Fade In, Maximize and Revert over a whole one-hour stereo selection.
//
// Each benchmark times Go() on fresh data (the undo between runs is not
// timed) and, in the same iteration, a memcpy of the selected bytes; it
// reports both and their ratio, plus the time SetTo takes to snapshot the
// range, the bytes that snapshot keeps in the history, and the whole action
// (snapshot and Go, what the user waits for) against the memcpy.
//
// Every snapshot goes into fresh memory, as it does when the history keeps
// each one: the sample allocator's cache of freed blocks is emptied before
// each SetTo, outside the timing.

#include <benchmark/benchmark.h>

#include "BenchSupport.h"

#include <chrono>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <memory>
#include <vector>

#include "edit/EditPosition.h"
#include "edit/FadeInAction.h"
#include "edit/MaximizeAction.h"
#include "edit/RevertAction.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/SampleAllocator.h"

namespace glimmet {
namespace {

using bench::Seconds;

constexpr int64_t kFrames = int64_t(3600) * 44100;
constexpr int kChannels = 2;

/// A deterministic, quiet signal (peak well below full scale, so Maximize
/// scales) with every value's sign represented.
void FillSignal(int16_t* samples, int64_t count, int channel)
{
    uint32_t state = 12345u + uint32_t(channel);
    for (int64_t i = 0; i < count; i++) {
        state = state * 1664525u + 1013904223u;
        samples[i] = int16_t(int32_t(state >> 16) % 12000);
    }
}

/// The selected data before and after one run, per channel.
using Samples = std::vector<const int16_t*>;
/// Independent check of a few thousand positions of a transform's output.
using Check = std::function<bool(const Samples& before, const Samples& after, int64_t count)>;

constexpr int64_t kCheckStride = 9973;

bool CheckFadeIn(const Samples& before, const Samples& after, int64_t n)
{
    for (size_t c = 0; c < before.size(); c++) {
        for (int64_t i = 0; i < n; i += kCheckStride) {
            const double expected = std::trunc(double(i) * before[c][i] / double(n - 1));
            if (after[c][i] != int16_t(expected))
                return false;
        }
    }
    return true;
}

bool CheckRevert(const Samples& before, const Samples& after, int64_t n)
{
    for (size_t c = 0; c < before.size(); c++) {
        for (int64_t i = 0; i < n; i += kCheckStride) {
            if (after[c][i] != before[c][n - 1 - i])
                return false;
        }
    }
    return true;
}

bool CheckMaximize(const Samples& before, const Samples& after, int64_t n)
{
    int peak = 0;
    for (const int16_t* samples : before) {
        for (int64_t i = 0; i < n; i++) {
            if (std::abs(int(samples[i])) > std::abs(peak))
                peak = samples[i];
        }
    }
    const double factor = double(std::fabs(32767.0f / float(peak)));
    for (size_t c = 0; c < before.size(); c++) {
        for (int64_t i = 0; i < n; i += kCheckStride) {
            if (after[c][i] != int16_t(std::trunc(factor * before[c][i])))
                return false;
        }
    }
    return true;
}

template <typename T>
void RunTransform(benchmark::State& state, const Check& check)
{
    ChannelManager manager(nullptr);
    EditPosition position;
    for (int c = 0; c < kChannels; c++) {
        auto* channel = new Channel();
        auto* samples = new int16_t[size_t(kFrames)];
        FillSignal(samples, kFrames, c);
        channel->SetTo(samples, kFrames);
        channel->SetSelected(true);
        manager.AddChannel(std::unique_ptr<Channel>(channel));
    }
    manager.SetRangeStart(0);
    manager.SetRangeEnd(kFrames - 1);

    const size_t bytes = size_t(kFrames) * kChannels * sizeof(int16_t);
    std::vector<int16_t> source(size_t(kFrames) * kChannels, 1);
    std::vector<int16_t> destination(size_t(kFrames) * kChannels, 0);
    std::vector<std::vector<int16_t>> originals;
    Samples before;
    for (int c = 0; c < kChannels; c++) {
        originals.push_back(bench::SamplesOf(*manager.ChannelAt(c)));
        before.push_back(originals.back().data());
    }

    double goTotal = 0;
    double memcpyTotal = 0;
    double snapshotTotal = 0;
    int64_t snapshotBytes = 0;
    bool checked = false;
    for (auto _ : state) {
        T action(nullptr);
        SampleAllocator::Shared().ReleaseCached();
        auto begin = std::chrono::steady_clock::now();
        action.SetTo(&manager, &position);
        snapshotTotal += Seconds(std::chrono::steady_clock::now() - begin);
        snapshotBytes = action.SnapshotBytes();

        begin = std::chrono::steady_clock::now();
        action.Go();
        const double go = Seconds(std::chrono::steady_clock::now() - begin);
        goTotal += go;
        state.SetIterationTime(go);

        begin = std::chrono::steady_clock::now();
        std::memcpy(destination.data(), source.data(), bytes);
        benchmark::DoNotOptimize(destination.data());
        benchmark::ClobberMemory();
        memcpyTotal += Seconds(std::chrono::steady_clock::now() - begin);

        if (!checked) {
            std::vector<std::vector<int16_t>> results;
            Samples after;
            for (int c = 0; c < kChannels; c++) {
                results.push_back(bench::SamplesOf(*manager.ChannelAt(c)));
                after.push_back(results.back().data());
            }
            if (!check(before, after, kFrames)) {
                state.SkipWithError("output differs from the arithmetic");
                break;
            }
            checked = true;
        }
        // Fresh data for the next run; not timed.
        action.Undo();
    }
    const double runs = double(state.iterations());
    state.counters["go_ms"] = 1000 * goTotal / runs;
    state.counters["memcpy_ms"] = 1000 * memcpyTotal / runs;
    state.counters["go_over_memcpy"] = goTotal / memcpyTotal;
    state.counters["snapshot_ms"] = 1000 * snapshotTotal / runs;
    state.counters["snapshot_over_memcpy"] = snapshotTotal / memcpyTotal;
    state.counters["snapshot_MB"] = double(snapshotBytes) / 1e6;
    state.counters["action_over_memcpy"] = (snapshotTotal + goTotal) / memcpyTotal;
    state.counters["selected_MB"] = double(bytes) / 1e6;
}

void BM_FadeIn(benchmark::State& state)
{
    RunTransform<FadeInAction>(state, CheckFadeIn);
}

void BM_Maximize(benchmark::State& state)
{
    RunTransform<MaximizeAction>(state, CheckMaximize);
}

void BM_Revert(benchmark::State& state)
{
    RunTransform<RevertAction>(state, CheckRevert);
}

BENCHMARK(BM_FadeIn)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_Maximize)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_Revert)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);

}  // namespace
}  // namespace glimmet

BENCHMARK_MAIN();
