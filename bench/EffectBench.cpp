// Distort, Peak Distort, Envelope and a 10-tap FIR filter over a whole
// one-hour stereo selection.
//
// Each benchmark times Go() on fresh data (binding and the undo between runs
// are not timed) and, in the same iteration, a memcpy of the selected bytes;
// it reports both (mean and best of the runs, and the CPU time of each) and
// their ratios. The FIR benchmark also runs sox's `fir` with the same
// coefficients over a WAV of the same hour, in the same process, and reports
// its time and Go's ratio to it.
//
// After the first run, the output is compared with the effect's arithmetic
// written out again here (at a few thousand positions, at every distinct
// input for Distort, everywhere for Peak Distort, whose runs depend on all
// that precedes them), so that a fast path in the effects cannot drift from
// it unnoticed.

#include <benchmark/benchmark.h>

#include "BenchSupport.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "edit/CompressorAction.h"
#include "edit/CurveDialog.h"
#include "edit/DistortAction.h"
#include "edit/EditPosition.h"
#include "edit/EnvelopeAction.h"
#include "edit/FilterAction.h"
#include "edit/effects/Spline.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/SampleAllocator.h"

namespace glimmet {
namespace {

using bench::Seconds;

constexpr int64_t kFrames = int64_t(3600) * 44100;
constexpr int kChannels = 2;
constexpr int32_t kTaps = 10;
constexpr int64_t kCheckStride = 997;

/// Half-waves of random length and height with both signs, single samples of
/// either sign, and runs of zeros: every case the effects tell apart.
void FillSignal(int16_t* samples, int64_t count, int channel)
{
    uint32_t state = 777u + 31u * uint32_t(channel);
    auto next = [&state] {
        state = state * 1664525u + 1013904223u;
        return state >> 8;
    };
    int sign = 1;
    int64_t i = 0;
    while (i < count) {
        const uint32_t kind = next() % 64;
        const int64_t length = 1 + int64_t(next() % 90);
        const int height = kind == 0 ? 0 : int(next() % 32768);
        for (int64_t j = 0; j < length && i < count; j++, i++) {
            // A triangle up to the height and down again.
            const int64_t rise = std::min(j + 1, length - j);
            const int value = int(int64_t(height) * rise * 2 / (length + 1));
            samples[i] = int16_t(sign > 0 ? std::min(value, 32767) : -std::min(value, 32768));
        }
        sign = kind % 5 == 0 ? sign : -sign;
    }
    samples[count - 1] = 32767;  // a run reaching the end of the range
    samples[0] = -32768;
}

/// The parameter dialog without a window: a fixed curve, always readable.
class BenchDialog : public CurveDialog {
public:
    BenchDialog(const std::vector<double>& x, const std::vector<double>& y, int32_t passes)
        : spline_(x.data(), y.data(), int32_t(x.size())), passes_(passes)
    {
    }
    bool Lock() override { return true; }
    void Unlock() override {}
    effects::SplineCurve Curve() override { return effects::SplineCurve(spline_); }
    int32_t NumPasses() override { return passes_; }
    bool IsHidden() override { return hidden_; }
    void Hide() override { hidden_ = true; }
    void Quit() override {}

private:
    Spline spline_;
    int32_t passes_;
    bool hidden_ = false;
};

/// Five knots each, so the curves wiggle and the not-a-knot spline is used.
const std::vector<double> kKnotsX = {0.0, 0.2, 0.45, 0.7, 1.0};
const std::vector<double> kDistortY = {0.05, 0.45, 0.2, 0.6, 0.35};
const std::vector<double> kPeakY = {0.0, 0.3, 0.1, 0.45, 0.2};
const std::vector<double> kEnvelopeY = {0.75, 0.55, 0.9, 0.6, 0.8};
const std::vector<double> kFilterY = {0.6, 0.95, 0.7, 0.9, 0.85};

/// The curve written out again: the spline's pieces, found by searching from
/// the first knot, and 0 outside [0, 1].
class ReferenceCurve {
public:
    explicit ReferenceCurve(const std::vector<double>& y) : spline_(kKnotsX.data(), y.data(), int32_t(y.size())) {}

    double operator()(double t) const
    {
        if (!(t >= 0.0 && t <= 1.0))
            return 0.0;
        int32_t k = 0;
        while (k < spline_.Count() - 2 && spline_.KnotX(k + 1) < t)
            k++;
        const double u = t - spline_.KnotX(k);
        return spline_.KnotY(k) + u * (spline_.Linear(k) + u * (spline_.Quadratic(k) + u * spline_.Cubic(k)));
    }

private:
    Spline spline_;
};

int32_t Trunc32(double value)
{
    const double t = std::trunc(value);
    return t >= -2147483648.0 && t <= 2147483647.0 ? int32_t(t) : INT32_MIN;
}

int16_t OneSided(double value)
{
    const int32_t t = Trunc32(value);
    return t < -32768 || t > 32767 ? int16_t(32767) : int16_t(t);
}

/// The selected data before and after one run, per channel.
using Samples = std::vector<const int16_t*>;
/// Independent check of one channel's output.
using Check = std::function<bool(const int16_t* before, const int16_t* after, int64_t count)>;

bool CheckDistort(const int16_t* before, const int16_t* after, int64_t n)
{
    const ReferenceCurve curve(kDistortY);
    // Every input value the signal holds is checked at its first position,
    // so the whole transfer function in use is covered, and a few thousand
    // positions besides.
    std::vector<bool> seen(65536, false);
    for (int64_t i = 0; i < n; i++) {
        const int s = before[i];
        if (seen[size_t(s + 32768)] && i % kCheckStride != 0)
            continue;
        seen[size_t(s + 32768)] = true;
        const int16_t expected = s < 0 ? OneSided((1.0 - curve(-s / 32768.0)) * -32768.0)
                                       : OneSided(32767.0 * (1.0 - curve(s / 32767.0)));
        if (after[i] != expected)
            return false;
    }
    return true;
}

bool CheckEnvelope(const int16_t* before, const int16_t* after, int64_t n)
{
    const ReferenceCurve curve(kEnvelopeY);
    for (int64_t i = 0; i < n; i += kCheckStride) {
        const double gain = 1.0 - curve(double(i) / double(n));
        if (after[i] != OneSided(gain * 4.0 * before[i]))
            return false;
    }
    return after[n - 1] == OneSided((1.0 - curve(double(n - 1) / double(n))) * 4.0 * before[n - 1]);
}

/// Peak Distort depends on everything before a position, so the whole
/// channel is run through the rule again.
bool CheckPeak(const int16_t* before, const int16_t* after, int64_t n)
{
    const ReferenceCurve curve(kPeakY);
    std::vector<int16_t> s(before, before + n);
    s.push_back(0);  // the one sample a run reaching the end also scales
    auto scale = [&](int64_t begin, int64_t length, double position) {
        const double gain = double(float(1.0 - curve(position))) / position;
        for (int64_t j = begin; j <= begin + length; j++)
            s[size_t(j)] = int16_t(uint16_t(uint32_t(Trunc32(gain * s[size_t(j)]))));
    };
    for (int64_t i = 0; i < n;) {
        int64_t l = 0;
        int peak = 0;
        for (; i + l < n && s[size_t(i + l)] >= 1; l++)
            peak = std::max(peak, int(s[size_t(i + l)]));
        if (l > 1)
            scale(i, l, peak / 32767.0);
        const int64_t u = i + l;
        int64_t m = 0;
        int low = 0;
        for (; u + m < n && s[size_t(u + m)] <= -1; m++)
            low = std::min(low, int(s[size_t(u + m)]));
        if (m > 1)
            scale(u, m, low * (-1.0 / 32768.0));
        i = u + m + 1;
    }
    return std::memcmp(s.data(), after, size_t(n) * sizeof(int16_t)) == 0;
}

std::vector<double> FilterKernel()
{
    const ReferenceCurve curve(kFilterY);
    std::vector<double> kernel;
    for (int32_t k = 0; k < kTaps; k++)
        kernel.push_back(1.0 - curve(double(k) / double(kTaps)));
    return kernel;
}

bool CheckFilter(const int16_t* before, const int16_t* after, int64_t n)
{
    const std::vector<double> kernel = FilterKernel();
    auto at = [&](int64_t i) { return i < 0 ? 0.0 : double(before[i]); };
    for (int64_t i = 0; i < n; i += i < 100 ? 1 : kCheckStride) {
        int64_t acc = Trunc32(kernel[0] * at(i));
        for (int32_t k = 1; k < kTaps; k++)
            acc = std::clamp<int64_t>(acc + Trunc32(kernel[size_t(k)] * at(i - k)), -32768, 32767);
        if (after[i] != acc)
            return false;
    }
    return true;
}

struct Document {
    ChannelManager manager{nullptr};
    EditPosition position;
    std::vector<std::vector<int16_t>> originals;

    Document()
    {
        for (int c = 0; c < kChannels; c++) {
            auto* channel = new Channel();
            auto* samples = new int16_t[size_t(kFrames)];
            FillSignal(samples, kFrames, c);
            originals.emplace_back(samples, samples + kFrames);
            channel->SetTo(samples, kFrames);
            channel->SetSelected(true);
            manager.AddChannel(std::unique_ptr<Channel>(channel));
        }
        manager.SetRangeStart(0);
        manager.SetRangeEnd(kFrames - 1);
    }

    bool Matches(const Check& check)
    {
        for (int c = 0; c < kChannels; c++) {
            if (!check(originals[size_t(c)].data(), bench::SamplesOf(*manager.ChannelAt(c)).data(), kFrames))
                return false;
        }
        return true;
    }
};

/// The same hour as an interleaved 16-bit WAV for sox.
bool WriteWav(const std::string& path, const Document& document)
{
    std::FILE* file = std::fopen(path.c_str(), "wb");
    if (file == nullptr)
        return false;
    const uint32_t dataBytes = uint32_t(kFrames * kChannels * 2);
    auto put32 = [file](uint32_t v) { std::fwrite(&v, 4, 1, file); };
    auto put16 = [file](uint16_t v) { std::fwrite(&v, 2, 1, file); };
    std::fwrite("RIFF", 1, 4, file);
    put32(36 + dataBytes);
    std::fwrite("WAVEfmt ", 1, 8, file);
    put32(16);
    put16(1);
    put16(kChannels);
    put32(44100);
    put32(44100 * kChannels * 2);
    put16(kChannels * 2);
    put16(16);
    std::fwrite("data", 1, 4, file);
    put32(dataBytes);
    std::vector<int16_t> block;
    constexpr int64_t kBlock = 1 << 16;
    for (int64_t start = 0; start < kFrames; start += kBlock) {
        const int64_t count = std::min(kBlock, kFrames - start);
        block.resize(size_t(count * kChannels));
        for (int64_t i = 0; i < count; i++) {
            for (int c = 0; c < kChannels; c++)
                block[size_t(i * kChannels + c)] = document.originals[size_t(c)][size_t(start + i)];
        }
        std::fwrite(block.data(), sizeof(int16_t), block.size(), file);
    }
    return std::fclose(file) == 0;
}

/// Seconds sox takes to filter the hour with the same coefficients; a
/// negative value when sox is missing or fails.
double SoxFilterSeconds(const Document& document)
{
    if (std::system("command -v sox >/dev/null 2>&1") != 0)
        return -1;
    const std::filesystem::path dir = std::filesystem::temp_directory_path() / "glimmet-effectbench";
    std::filesystem::create_directories(dir);
    const std::string in = (dir / "in.wav").string();
    const std::string out = (dir / "out.wav").string();
    if (!WriteWav(in, document))
        return -1;
    std::string command = "sox '" + in + "' '" + out + "' fir";
    char coefficient[64];
    for (double k : FilterKernel()) {
        std::snprintf(coefficient, sizeof coefficient, " %.17g", k);
        command += coefficient;
    }
    const auto begin = std::chrono::steady_clock::now();
    const int status = std::system(command.c_str());
    const double seconds = Seconds(std::chrono::steady_clock::now() - begin);
    std::filesystem::remove_all(dir);
    return status == 0 ? seconds : -1;
}

/// CPU seconds of the calling thread: what Go and the memcpy cost
/// themselves, without the time others' work on a shared machine took from
/// them.
double ThreadCpuSeconds()
{
    timespec now{};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return double(now.tv_sec) + 1e-9 * double(now.tv_nsec);
}

using MakeAction = std::function<std::unique_ptr<Action>()>;

template <typename T>
MakeAction Maker(const std::vector<double>& y, int32_t passes = 0)
{
    return [y, passes] { return std::make_unique<T>(nullptr, std::make_unique<BenchDialog>(kKnotsX, y, passes)); };
}

/// Runs the action once per iteration; returns false when its output
/// differs from the arithmetic.
bool RunEffect(benchmark::State& state, Document& document, const MakeAction& make, const Check& check)
{
    const size_t bytes = size_t(kFrames) * kChannels * sizeof(int16_t);
    std::vector<int16_t> source(size_t(kFrames) * kChannels, 1);
    std::vector<int16_t> destination(size_t(kFrames) * kChannels, 0);
    // Once before timing, so the baseline copies between pages already in
    // use, as the effects work on channel data already in use.
    std::memcpy(destination.data(), source.data(), bytes);
    double goTotal = 0;
    double memcpyTotal = 0;
    // The least disturbed run of each, on a machine shared with others.
    double goBest = 0;
    double memcpyBest = 0;
    double goCpu = 0;
    double memcpyCpu = 0;
    bool checked = false;
    for (auto _ : state) {
        std::unique_ptr<Action> action = make();
        SampleAllocator::Shared().ReleaseCached();
        action->SetTo(&document.manager, &document.position);

        double cpu = ThreadCpuSeconds();
        auto begin = std::chrono::steady_clock::now();
        action->Go();
        const double go = Seconds(std::chrono::steady_clock::now() - begin);
        goCpu += ThreadCpuSeconds() - cpu;
        goTotal += go;
        goBest = goBest == 0 ? go : std::min(goBest, go);
        state.SetIterationTime(go);

        cpu = ThreadCpuSeconds();
        begin = std::chrono::steady_clock::now();
        std::memcpy(destination.data(), source.data(), bytes);
        benchmark::DoNotOptimize(destination.data());
        benchmark::ClobberMemory();
        const double copy = Seconds(std::chrono::steady_clock::now() - begin);
        memcpyCpu += ThreadCpuSeconds() - cpu;
        memcpyTotal += copy;
        memcpyBest = memcpyBest == 0 ? copy : std::min(memcpyBest, copy);

        if (!checked) {
            if (!document.Matches(check)) {
                state.SkipWithError("output differs from the arithmetic");
                return false;
            }
            checked = true;
        }
        // Fresh data for the next run; not timed.
        action->Undo();
    }
    const double runs = double(state.iterations());
    state.counters["go_s"] = goTotal / runs;
    state.counters["memcpy_s"] = memcpyTotal / runs;
    state.counters["go_over_memcpy"] = goTotal / memcpyTotal;
    state.counters["go_best_s"] = goBest;
    state.counters["memcpy_best_s"] = memcpyBest;
    state.counters["best_go_over_best_memcpy"] = goBest / memcpyBest;
    state.counters["go_cpu_s"] = goCpu / runs;
    state.counters["memcpy_cpu_s"] = memcpyCpu / runs;
    state.counters["cpu_go_over_memcpy"] = goCpu / memcpyCpu;
    state.counters["selected_MB"] = double(bytes) / 1e6;
    return true;
}

void BM_Distort(benchmark::State& state)
{
    Document document;
    RunEffect(state, document, Maker<DistortAction>(kDistortY), CheckDistort);
}

void BM_PeakDistort(benchmark::State& state)
{
    Document document;
    RunEffect(state, document, Maker<CompressorAction>(kPeakY), CheckPeak);
}

void BM_Envelope(benchmark::State& state)
{
    Document document;
    RunEffect(state, document, Maker<EnvelopeAction>(kEnvelopeY), CheckEnvelope);
}

void BM_Fir10(benchmark::State& state)
{
    Document document;
    if (!RunEffect(state, document, Maker<FilterAction>(kFilterY, kTaps), CheckFilter))
        return;
    const double sox = SoxFilterSeconds(document);
    if (sox < 0) {
        std::fprintf(stderr, "EffectBench: sox is missing or failed; FIR is not compared with it\n");
        return;
    }
    state.counters["sox_s"] = sox;
    state.counters["go_over_sox"] = state.counters["go_s"] / sox;
}

BENCHMARK(BM_Distort)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_PeakDistort)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_Envelope)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_Fir10)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);

}  // namespace
}  // namespace glimmet

BENCHMARK_MAIN();
