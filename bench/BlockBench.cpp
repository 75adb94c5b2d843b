// Edits of a one-hour stereo document whose channels share blocks: Fade In
// over everything with its undo and redo, a one-second cut from the middle
// with its undo, and a one-minute paste with its undo.
//
// Each benchmark times its steps and, in the same run, a memcpy of the bytes
// that step could not avoid touching if it copied them: the whole document
// for the fade, one second of both channels for the cut, one minute of both
// channels for the paste. It reports the times and the ratios.

#include <benchmark/benchmark.h>

#include "BenchSupport.h"

#include <chrono>
#include <cstring>
#include <memory>
#include <vector>

#include "edit/CopyBuffer.h"
#include "edit/EditPosition.h"
#include "edit/FadeInAction.h"
#include "edit/HistoryManager.h"
#include "edit/PasteAction.h"
#include "edit/RemoveAction.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {
namespace {

constexpr int64_t kRate = 44100;
constexpr int64_t kFrames = 3600 * kRate;
constexpr int kChannels = 2;

template <typename Function>
double Milliseconds(Function function)
{
    const auto begin = std::chrono::steady_clock::now();
    function();
    return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - begin).count();
}

double MemcpyMilliseconds(size_t bytes)
{
    return bench::MemcpyNanoseconds(bytes, 3, 1) / 1e6;
}

/// A one-hour stereo document with both channels selected.
struct Document {
    ChannelManager manager{nullptr};
    EditPosition position;

    Document()
    {
        std::vector<int16_t> samples(static_cast<size_t>(kFrames));
        for (int c = 0; c < kChannels; c++) {
            for (int64_t i = 0; i < kFrames; i++)
                samples[size_t(i)] = int16_t(i * (c + 3));
            auto channel = std::make_unique<Channel>();
            channel->InsertFrames(samples.data(), kFrames, 0);
            channel->SetSelected(true);
            manager.AddChannel(std::move(channel));
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

Document& SharedDocument()
{
    static Document document;
    return document;
}

void Report(benchmark::State& state, const char* name, double total, double baseline)
{
    const double runs = double(state.iterations());
    state.counters[std::string(name) + "_ms"] = total / runs;
    state.counters[std::string(name) + "_over_memcpy"] = total / baseline;
}

void BM_FadeInWholeHour(benchmark::State& state)
{
    Document& document = SharedDocument();
    const size_t bytes = size_t(kFrames) * kChannels * sizeof(int16_t);
    double go = 0;
    double undo = 0;
    double redo = 0;
    double whole = 0;
    double copy = 0;
    for (auto _ : state) {
        document.Select(0, kFrames - 1, true);
        FadeInAction action(nullptr);
        const double goTime = Milliseconds([&] {
            action.SetTo(&document.manager, &document.position);
            action.Go();
        });
        go += goTime;
        state.SetIterationTime(goTime / 1000);
        undo += Milliseconds([&] { action.Undo(); });
        redo += Milliseconds([&] { action.Redo(); });
        action.Undo();
        // The whole action as the menu runs it: made, bound, put in the
        // history, run, and the history's budget looked at.
        HistoryManager history;
        whole += Milliseconds([&] {
            std::unique_ptr<Action> menuAction = std::make_unique<FadeInAction>(nullptr);
            menuAction->SetTo(&document.manager, &document.position);
            Action* raw = menuAction.get();
            history.AddAction(menuAction);
            raw->Go();
            history.TrimMemory();
        });
        history.Undo();
        copy += MemcpyMilliseconds(bytes);
    }
    state.counters["memcpy_ms"] = copy / double(state.iterations());
    Report(state, "go", go, copy);
    Report(state, "whole", whole, copy);
    state.counters["whole_over_go"] = whole / go;
    Report(state, "undo", undo, copy);
    Report(state, "redo", redo, copy);
}

void BM_CutOneSecond(benchmark::State& state)
{
    Document& document = SharedDocument();
    const int64_t middle = kFrames / 2;
    const size_t bytes = size_t(kRate) * kChannels * sizeof(int16_t);
    double go = 0;
    double undo = 0;
    double copy = 0;
    for (auto _ : state) {
        document.Select(middle, middle + kRate - 1, true);
        RemoveAction action(nullptr);
        const double goTime = Milliseconds([&] {
            action.SetTo(&document.manager, &document.position);
            action.Go();
        });
        go += goTime;
        state.SetIterationTime(goTime / 1000);
        undo += Milliseconds([&] { action.Undo(); });
        copy += MemcpyMilliseconds(bytes);
        if (document.manager.ChannelAt(0)->FrameCount() != kFrames) {
            state.SkipWithError("undo did not restore the document's length");
            break;
        }
    }
    state.counters["memcpy_ms"] = copy / double(state.iterations());
    Report(state, "cut", go, copy);
    Report(state, "undo", undo, copy);
}

void BM_PasteOneMinute(benchmark::State& state)
{
    constexpr int64_t kMinute = 60 * kRate;
    CopyBuffer copyBuffer;
    std::vector<CopyBuffer::Samples> minute;
    for (int c = 0; c < kChannels; c++) {
        minute.emplace_back(new int16_t[size_t(kMinute)]);
        std::memset(minute.back().get(), 0x11, size_t(kMinute) * sizeof(int16_t));
    }
    copyBuffer.SetCopyBuffer(std::move(minute), kMinute);
    Document& document = SharedDocument();
    const int64_t middle = kFrames / 2;
    const size_t bytes = size_t(kMinute) * kChannels * sizeof(int16_t);
    double go = 0;
    double undo = 0;
    double copy = 0;
    // Measured once, before the pastes. Between them, mapping and unmapping
    // the memcpy's two 10 MB buffers made the next paste on this virtual
    // machine up to five times slower: its first loads of the lists' runs
    // stalled, in processes where it happened at all.
    const double copyOnce = MemcpyMilliseconds(bytes);
    for (auto _ : state) {
        copy += copyOnce;
        // No range and no selection: the minute is inserted at the cursor.
        document.Select(-1, -1, false);
        document.position.SetCursorFrame(middle);
        PasteAction action(nullptr, &copyBuffer);
        const double goTime = Milliseconds([&] {
            action.SetTo(&document.manager, &document.position);
            action.Go();
        });
        go += goTime;
        state.SetIterationTime(goTime / 1000);
        undo += Milliseconds([&] { action.Undo(); });
        if (document.manager.ChannelAt(0)->FrameCount() != kFrames) {
            state.SkipWithError("undo did not restore the document's length");
            break;
        }
    }
    state.counters["memcpy_ms"] = copy / double(state.iterations());
    Report(state, "paste", go, copy);
    Report(state, "undo", undo, copy);
}

BENCHMARK(BM_FadeInWholeHour)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_CutOneSecond)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(5);
BENCHMARK(BM_PasteOneMinute)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(5);

}  // namespace
}  // namespace glimmet

BENCHMARK_MAIN();
