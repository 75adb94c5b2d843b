#include <benchmark/benchmark.h>

#include <cstdlib>
#include <memory>

#include <QApplication>

#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "views/ChannelContainerView.h"
#include "views/SampleView.h"
#include "views/ZoomSlider.h"

namespace glimmet {
namespace {

constexpr int64_t kRate = 44100;
constexpr int kViewWidth = 1920;
constexpr int kViewHeight = 200;
// The container frames each view with one pixel and keeps the zoom
// slider's 15 rows below it.
constexpr int kContainerWidth = kViewWidth + 2;
constexpr int kContainerHeight = kViewHeight + 18;

/// A one-hour mono channel of noise-like samples.
Channel* MakeOneHourChannel()
{
    const int64_t count = kRate * 3600;
    auto* samples = new int16_t[size_t(count)];
    uint32_t seed = 12345;
    for (int64_t i = 0; i < count; ++i) {
        seed = seed * 1664525u + 1013904223u;
        samples[i] = int16_t(seed >> 16);
    }
    auto* channel = new Channel();
    channel->SetTo(samples, count);
    return channel;
}

/// A 1920 x 200 sample view over a one-hour channel, made once.
struct Scene {
    Scene()
    {
        manager.AddChannel(std::unique_ptr<Channel>(MakeOneHourChannel()));
        // As in a document window: a zoom slider along the bottom.
        container = std::make_unique<ChannelContainerView>(&manager, new ZoomSlider(nullptr, 0, 0, 0), nullptr);
        container->resize(kContainerWidth, kContainerHeight);
        view = container->SampleViewAtIndex(0);
    }

    ChannelManager manager{nullptr};
    std::unique_ptr<ChannelContainerView> container;
    SampleView* view = nullptr;
};

Scene& SharedScene()
{
    static Scene scene;
    return scene;
}

void RedrawShowing(benchmark::State& state, int64_t frames)
{
    Scene& scene = SharedScene();
    if (scene.view->width() != kViewWidth || scene.view->height() != kViewHeight) {
        state.SkipWithError("sample view is not 1920 x 200");
        return;
    }
    scene.container->SetDisplayRange(0, frames - 1);
    for (auto _ : state) {
        scene.view->Update();
        benchmark::DoNotOptimize(scene.view->Bitmap().constBits());
    }
    state.counters["frames"] = double(frames);
    state.counters["frames/s"] = benchmark::Counter(double(frames) * double(state.iterations()), benchmark::Counter::kIsRate);
}

// Baseline: one plain pass over the same samples, the least any density
// picture of them can cost.
void BM_BaselineSumOneHour(benchmark::State& state)
{
    Channel* channel = SharedScene().manager.ChannelAt(0);
    const int16_t* samples = channel->Data();
    const int64_t count = channel->FrameCount();
    for (auto _ : state) {
        int64_t sum = 0;
        for (int64_t i = 0; i < count; ++i)
            sum += samples[i];
        benchmark::DoNotOptimize(sum);
    }
    state.counters["frames/s"] = benchmark::Counter(double(count) * double(state.iterations()), benchmark::Counter::kIsRate);
}

void BM_RedrawOneHourWhole(benchmark::State& state)
{
    RedrawShowing(state, kRate * 3600);
}

void BM_RedrawTenSeconds(benchmark::State& state)
{
    RedrawShowing(state, kRate * 10);
}

BENCHMARK(BM_BaselineSumOneHour)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_RedrawOneHourWhole)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_RedrawTenSeconds)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace glimmet

int main(int argc, char** argv)
{
    // Views need a GUI application; no display is used.
    if (std::getenv("QT_QPA_PLATFORM") == nullptr)
        setenv("QT_QPA_PLATFORM", "offscreen", 0);
    QApplication application(argc, argv);
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return 1;
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
