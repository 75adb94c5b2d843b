// The audio callback's cost per 256-frame buffer, as a share of the 5.8 ms
// the buffer lasts, beside a baseline measured in the same run: the least
// work any mix of that many channels does (reading each channel's samples and
// adding them up). And ten seconds played in real time through SDL's dummy
// driver, counting the periods that were served later than they play.

#include <benchmark/benchmark.h>

#include <QCoreApplication>
#include <QEventLoop>
#include <QTimer>

#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <memory>
#include <random>
#include <vector>

#include "playback/AudioProducer.h"
#include "playback/PlaybackGraph.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/DocumentWindow.h"

namespace glimmet {
namespace {

constexpr int64_t kFrames = 256;
constexpr double kBufferSeconds = double(kFrames) / 44100.0;
constexpr int64_t kDocumentFrames = 441000;  // ten seconds

// The window as far as playback needs it: it takes messages and shows a
// fixed stretch of frames.
class BenchWindow : public DocumentWindow {
public:
    using DocumentWindow::PostMessage;
    status_t PostMessage(const Message&) override
    {
        messages++;
        return B_OK;
    }
    bool LockWithTimeout(int64_t) override { return true; }
    void UnlockWindow() override {}
    void GetVisibleFrames(int64_t* first, int64_t* last) override
    {
        *first = 0;
        *last = kDocumentFrames - 1;
    }
    int64_t messages = 0;
};

std::vector<std::vector<int16_t>> MakeSamples(int64_t channels)
{
    std::mt19937 random(7);
    std::uniform_int_distribution<int> value(-3000, 3000);
    std::vector<std::vector<int16_t>> samples(static_cast<size_t>(channels));
    for (auto& channel : samples)
        channel.resize(static_cast<size_t>(kDocumentFrames));
    for (auto& channel : samples) {
        for (int16_t& sample : channel)
            sample = int16_t(value(random));
    }
    return samples;
}

void FillDocument(ChannelManager* manager, const std::vector<std::vector<int16_t>>& samples)
{
    static const int8_t pans[] = {0, -128, 127};
    for (size_t c = 0; c < samples.size(); c++) {
        auto* data = new int16_t[samples[c].size()];
        std::copy(samples[c].begin(), samples[c].end(), data);
        auto* channel = new Channel();
        channel->SetTo(data, int64_t(samples[c].size()));
        channel->SetPanPosition(pans[c % 3]);
        manager->AddChannel(std::unique_ptr<Channel>(channel));
    }
}

// The calling thread's processor time in seconds.
double ThreadCpuSeconds()
{
    timespec now{};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return double(now.tv_sec) + double(now.tv_nsec) * 1e-9;
}

// Reports the processor time per iteration as a percentage of the time the
// buffer lasts.
void ReportBufferShare(benchmark::State& state, double cpuSeconds)
{
    if (state.iterations() > 0)
        state.counters["cpu_%_of_buffer"] = 100.0 * cpuSeconds / double(state.iterations()) / kBufferSeconds;
}

// One device period as SDL's callback serves it: events, the mix of all
// channels under the document lock, the position update.
void BM_AudioCallback(benchmark::State& state)
{
    const int64_t channels = state.range(0);
    BenchWindow window;
    ChannelManager manager(&window);
    FillDocument(&manager, MakeSamples(channels));
    AudioProducer producer(&manager, &window);
    producer.NodeRegistered(1);
    MediaFormat format = producer.PreferredFormat();
    MediaSource source;
    const MediaDestination device{2, 0};
    char name[kMediaNameLength] = {};
    std::fflush(stdout);
    producer.PrepareToConnect(MediaSource{1, 0}, device, &format, &source, name);
    producer.Connect(B_OK, source, device, format, name, 5804);
    producer.SetRunMode(B_RECORDING);
    producer.Start(0);

    std::vector<float> out(size_t(kFrames) * 2);
    int64_t deviceFrame = 0;
    double cpu = 0;
    for (auto _ : state) {
        const double before = ThreadCpuSeconds();
        producer.ServeDevice(out.data(), int32_t(kFrames), deviceFrame);
        cpu += ThreadCpuSeconds() - before;
        deviceFrame += kFrames;
        benchmark::DoNotOptimize(out.data());
        // Keep the position updates from piling up, outside the timing.
        if (deviceFrame % (kFrames * 1024) == 0) {
            state.PauseTiming();
            producer.Relay().Drain();
            state.ResumeTiming();
        }
    }
    producer.Relay().Drain();
    ReportBufferShare(state, cpu);
}
BENCHMARK(BM_AudioCallback)->Arg(2)->Arg(16)->Arg(64);

// Baseline: the least any mix of these channels costs, reading 256 samples
// of each and adding them into two float sums.
void BM_Baseline_SumChannels(benchmark::State& state)
{
    const int64_t channels = state.range(0);
    const auto samples = MakeSamples(channels);
    std::vector<float> out(size_t(kFrames) * 2);
    int64_t position = 0;
    double cpu = 0;
    for (auto _ : state) {
        const double before = ThreadCpuSeconds();
        std::fill(out.begin(), out.end(), 0.0f);
        for (const auto& channel : samples) {
            const int16_t* data = channel.data() + position;
            for (int64_t i = 0; i < kFrames; i++) {
                const float value = float(data[i]) * (1.0f / 32768.0f);
                out[size_t(2 * i)] += value;
                out[size_t(2 * i + 1)] += value;
            }
        }
        benchmark::DoNotOptimize(out.data());
        cpu += ThreadCpuSeconds() - before;
        position = (position + kFrames) % (kDocumentFrames - kFrames);
    }
    ReportBufferShare(state, cpu);
}
BENCHMARK(BM_Baseline_SumChannels)->Arg(2)->Arg(16)->Arg(64);

// Ten seconds of a 64-channel document played in real time through SDL's
// dummy driver, which paces its callbacks like a sound card. A period is late
// when serving it took longer than it plays.
void BM_RealTimeDummyDriver(benchmark::State& state)
{
    setenv("SDL_AUDIODRIVER", "dummy", 1);
    BenchWindow window;
    ChannelManager manager(&window);
    FillDocument(&manager, MakeSamples(64));
    for (auto _ : state) {
        PlaybackGraph graph(&manager, &window);
        std::fflush(stdout);
        if (graph.SetupNodes() != B_OK) {
            state.SkipWithError("no playback graph");
            return;
        }
        manager.ResetCurrentFrame();
        graph.StartNodes();
        // The window thread sleeps in its event loop between updates.
        QEventLoop loop;
        QTimer::singleShot(10000, &loop, &QEventLoop::quit);
        loop.exec();
        graph.StopNodes();
        AudioProducer* producer = graph.Producer();
        state.counters["periods"] = double(producer->PeriodsServed());
        state.counters["late_periods"] = double(producer->LatePeriods());
        state.counters["longest_period_us"] = double(producer->LongestPeriodMicros());
        state.counters["longest_%_of_buffer"] = 100.0 * double(producer->LongestPeriodMicros()) / (kBufferSeconds * 1e6);
        state.counters["updates_dropped"] = double(producer->Relay().DroppedUpdates());
        graph.TearDownNodes();
    }
}
BENCHMARK(BM_RealTimeDummyDriver)->Iterations(1)->Unit(benchmark::kSecond);

}  // namespace
}  // namespace glimmet

int main(int argc, char** argv)
{
    // The position updates travel through the Qt event loop.
    QCoreApplication application(argc, argv);
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return 1;
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
