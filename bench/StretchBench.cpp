// Time Stretch by 2.0 of one minute of stereo 44.1 kHz material (two
// sweeping tones under a tremolo, made by sox), with the dialog's defaults
// (oscillator-bank resynthesis) and with decimation 0 (inverse FFT and
// overlap-add), against two independent stretchers on the same file in the
// same run: `rubberband -t 2.0 IN OUT` and `sox IN OUT tempo 0.5`.
//
// The Time Stretch figure is the whole action: the snapshot of the range,
// the vocoder on both channels and the write-back. rubberband is optional
// (Debian package rubberband-cli); without it its baseline is skipped with
// a message.

#include <benchmark/benchmark.h>

#include "BenchSupport.h"

#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

#include "edit/EditPosition.h"
#include "edit/StretchAction.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/DiagnosticsCapture.h"

namespace glimmet {
namespace {

constexpr int kSeconds = 60;
constexpr int64_t kFrames = int64_t(kSeconds) * 44100;

/// A folder of this run's files, removed when the program ends.
class WorkFolder {
public:
    WorkFolder()
        : path_(std::filesystem::temp_directory_path() / ("glimmet-stretch-bench-" + std::to_string(getpid())))
    {
        std::filesystem::create_directories(path_);
    }
    ~WorkFolder()
    {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
    }
    const std::filesystem::path& Path() const { return path_; }

private:
    std::filesystem::path path_;
};

std::filesystem::path WorkFile(const std::string& name)
{
    static const WorkFolder folder;
    return folder.Path() / name;
}

bool Run(const std::string& command)
{
    return std::system((command + " >/dev/null 2>&1").c_str()) == 0;
}

/// The input file and its samples, channel by channel, made once.
const std::vector<std::vector<int16_t>>& Source()
{
    static const std::vector<std::vector<int16_t>> channels = [] {
        const std::string wav = WorkFile("minute.wav").string();
        const std::string raw = WorkFile("minute.raw").string();
        if (!Run("sox -n -r 44100 -c 2 -b 16 -e signed '" + wav + "' synth " + std::to_string(kSeconds)
                + " sine 220-880 sine 330-660 tremolo 4 60 vol 0.5")
            || !Run("sox '" + wav + "' -t raw '" + raw + "'"))
            std::abort();
        std::ifstream in(raw, std::ios::binary);
        std::vector<int16_t> interleaved(size_t(2 * kFrames));
        in.read(reinterpret_cast<char*>(interleaved.data()), std::streamsize(interleaved.size() * 2));
        std::vector<std::vector<int16_t>> split(2, std::vector<int16_t>(size_t(kFrames)));
        for (int64_t f = 0; f < kFrames; f++) {
            split[0][size_t(f)] = interleaved[size_t(2 * f)];
            split[1][size_t(f)] = interleaved[size_t(2 * f + 1)];
        }
        return split;
    }();
    return channels;
}

/// A dialog that answers with fixed values.
class FixedDialog : public StretchDialog {
public:
    explicit FixedDialog(const StretchParameters& values) : values_(values) {}
    bool Lock() override { return true; }
    void Unlock() override {}
    StretchParameters GetParameters() override { return values_; }
    void Quit() override {}

private:
    StretchParameters values_;
};

/// Seconds of one whole Time Stretch of the minute with the given values.
double StretchSeconds(const StretchParameters& values)
{
    ChannelManager manager(nullptr);
    EditPosition position;
    for (const std::vector<int16_t>& samples : Source()) {
        auto channel = std::make_unique<Channel>();
        auto* data = new int16_t[samples.size()];
        std::copy(samples.begin(), samples.end(), data);
        channel->SetTo(data, int64_t(samples.size()));
        channel->SetSelected(true);
        manager.AddChannel(std::move(channel));
    }
    manager.SetRangeStart(0);
    manager.SetRangeEnd(kFrames - 1);
    DiagnosticsCapture quietOut, quietErr(Diagnostics::Channel::Error);
    const auto start = std::chrono::steady_clock::now();
    StretchAction action(nullptr, std::make_unique<FixedDialog>(values));
    action.SetTo(&manager, &position);
    action.Go();
    return bench::Seconds(std::chrono::steady_clock::now() - start);
}

double CommandSeconds(const std::string& command)
{
    const auto start = std::chrono::steady_clock::now();
    if (!Run(command))
        return -1.0;
    return bench::Seconds(std::chrono::steady_clock::now() - start);
}

void StretchAgainstBaselines(benchmark::State& state, const StretchParameters& values)
{
    const std::string in = "'" + WorkFile("minute.wav").string() + "'";
    const bool haveRubberband = Run("command -v rubberband");
    if (!haveRubberband)
        std::fprintf(stderr, "rubberband not found (Debian package rubberband-cli): its baseline is skipped\n");
    Source();
    for (auto _ : state) {
        const double glimmet = StretchSeconds(values);
        const double sox = CommandSeconds("sox " + in + " '" + WorkFile("sox.wav").string() + "' tempo 0.5");
        state.SetIterationTime(glimmet);
        state.counters["stretch_s"] = glimmet;
        state.counters["sox_s"] = sox;
        state.counters["vs_sox"] = glimmet / sox;
        if (haveRubberband) {
            const double rubberband
                = CommandSeconds("rubberband -t 2.0 " + in + " '" + WorkFile("rubberband.wav").string() + "'");
            state.counters["rubberband_s"] = rubberband;
            state.counters["vs_rubberband"] = glimmet / rubberband;
        }
    }
}

void BM_StretchDefaults(benchmark::State& state)
{
    StretchAgainstBaselines(state, StretchParameters{8192, 8192, 2048, 2048, 2.0f, 0.0f, 0.0f});
}

void BM_StretchOverlapAdd(benchmark::State& state)
{
    StretchAgainstBaselines(state, StretchParameters{8192, 8192, 0, 2048, 2.0f, 0.0f, 0.0f});
}

}  // namespace
}  // namespace glimmet

BENCHMARK(glimmet::BM_StretchDefaults)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(glimmet::BM_StretchOverlapAdd)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(3);

BENCHMARK_MAIN();
