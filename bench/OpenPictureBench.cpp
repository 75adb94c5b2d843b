// Opening a one-hour 16-bit stereo WAV file in a document window on Qt's
// offscreen platform, until both channels' views show their whole picture,
// beside three baselines measured in the same run:
//   bare load:   the same file loaded into a document with no window
//   bare decode: our own track read to its end, the samples dropped
//   ffmpeg:      ffmpeg -v quiet -threads 1 -i FILE -f null -
// Every open goes into memory handed back to the system, as the first open
// of a session does. The window and the bare load take turns, first each
// right after the other gave its memory back, then each a few seconds after
// (see Alternate). GLIMMET_BENCH_DIR chooses where the 635 MB file goes
// (default: the system's temporary directory); GLIMMET_BENCH_SECONDS
// shortens it. The figures are the best of the rounds.
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <thread>
#include <utility>

#include <QApplication>
#include <QDir>
#include <QTemporaryDir>
#include <QTimer>

#include "app/BatchRunner.h"
#include "app/QuillexWindow.h"
#include "files/DocumentLoader.h"
#include "sound/BlockPool.h"
#include "support/MessageEvent.h"
#include "sound/ChannelManager.h"
#include "sound/SampleAllocator.h"
#include "views/ChannelContainerView.h"
#include "views/SampleView.h"

#include "BenchSupport.h"

namespace glimmet {
namespace {

constexpr int kRounds = 3;
constexpr int kColdPauseSeconds = 4;

std::string Quote(const std::filesystem::path& path)
{
    return "'" + path.string() + "'";
}

void Run(const std::string& command)
{
    if (std::system(command.c_str()) != 0) {
        std::fprintf(stderr, "failed: %s\n", command.c_str());
        std::exit(1);
    }
}

/// A sweep, so that no codec or cache could take a shortcut.
std::filesystem::path MakeSourceFile(const std::filesystem::path& directory)
{
    const auto path = directory / "hour.wav";
    Run("sox -n -r 44100 -c 2 -b 16 -e signed " + Quote(path) + " synth " + std::to_string(bench::DocumentSeconds())
        + " sine 100-8000 sine 300-3000 vol 0.8");
    return path;
}

double SecondsOf(const std::function<void()>& work)
{
    const auto start = std::chrono::steady_clock::now();
    work();
    return bench::Seconds(std::chrono::steady_clock::now() - start);
}

/// What the document held is handed back, so the next round starts afresh.
void ReleaseMemory()
{
    SampleAllocator::Shared().ReleaseCached();
    BlockPool::Shared().ReleaseFree();
}

/// Whether both views show the whole hour: the document is in, the views
/// are laid out across the window, no zoom slider message that sets their
/// display range is on its way, and every column has been rendered (asking
/// renders what a paint would).
bool PictureComplete(QuillexWindow& window)
{
    ChannelContainerView* container = window.ContainerView();
    if (container == nullptr || window.Manager()->CountChannels() != 2
        || container->LastDisplayedFrame() < window.Manager()->ChannelAt(0)->FrameCount() - 1
        || MessageEvent::CountPendingFromMainThread() != 0)
        return false;
    for (int32_t i = 0; i < 2; ++i) {
        SampleView* view = container->SampleViewAtIndex(i);
        if (view == nullptr || view->width() < container->width() / 2 || view->RenderedColumns() < view->width())
            return false;
    }
    return true;
}

double OpenInWindow(const std::filesystem::path& file)
{
    QuillexWindow window;
    window.resize(1920, 600);
    window.show();
    BatchRunner::DrainEvents();
    // Not until the window is idle: once the picture is up, the window goes
    // on making waveform summaries in its idle time, which is no part of
    // opening.
    // The thread sleeps between events, as the application's own event loop
    // does, so that the loader has the processor to itself; a timer makes
    // sure it looks again at least every 10 ms.
    QTimer wake;
    wake.start(10);
    const double seconds = SecondsOf([&] {
        window.OpenFile(file);
        while (window.IsLoading() || !PictureComplete(window))
            QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents);
        window.repaint();
    });
    if (!PictureComplete(window)) {
        std::fprintf(stderr, "the window did not show the whole picture\n");
        std::exit(1);
    }
    // More than one width means the views drew pictures nobody saw.
    SampleView* view = window.ContainerView()->SampleViewAtIndex(0);
    std::printf("  columns rendered by the first view: %lld for a width of %d\n",
        static_cast<long long>(view->RenderedColumns()), view->width());
    return seconds;
}

double LoadBare(const std::filesystem::path& file)
{
    ChannelManager document(nullptr);
    return SecondsOf([&] {
        if (DocumentLoader::Load(file, &document, false) != B_OK)
            std::exit(1);
    });
}

struct Pair {
    double window = 1e9;
    double bare = 1e9;
};

/// Window and bare load in turn, each into the memory the one before it gave
/// back, after a pause of pauseSeconds. On a virtual machine that hands
/// memory given back to its host, a pause of a few seconds lets the host
/// take it, and the next open pays for the host providing it again: each
/// figure is compared only with the other taken after the same pause.
Pair Alternate(const std::filesystem::path& file, int pauseSeconds)
{
    const auto pause = [pauseSeconds] {
        ReleaseMemory();
        if (pauseSeconds > 0)
            std::this_thread::sleep_for(std::chrono::seconds(pauseSeconds));
    };
    // The first load of all pays for the process's first use of memory.
    LoadBare(file);
    pause();
    Pair best;
    for (int round = 0; round < kRounds; ++round) {
        const double w = OpenInWindow(file);
        pause();
        const double b = LoadBare(file);
        pause();
        std::printf("pause %d s, round %d: window %.3f s, bare load %.3f s\n", pauseSeconds, round + 1, w, b);
        best.window = std::min(best.window, w);
        best.bare = std::min(best.bare, b);
    }
    return best;
}

int Main(int argc, char** argv)
{
    if (qEnvironmentVariableIsEmpty("QT_QPA_PLATFORM"))
        qputenv("QT_QPA_PLATFORM", "offscreen");
    if (qEnvironmentVariableIsEmpty("SDL_AUDIODRIVER"))
        qputenv("SDL_AUDIODRIVER", "dummy");
    QApplication application(argc, argv);
    const QString base = qEnvironmentVariableIsEmpty("GLIMMET_BENCH_DIR") ? QDir::tempPath()
                                                                          : qEnvironmentVariable("GLIMMET_BENCH_DIR");
    QTemporaryDir directory(base + "/glimmet-openbench-XXXXXX");
    const std::filesystem::path file = MakeSourceFile(directory.path().toStdString());
    const std::string ffmpeg = "ffmpeg -v quiet -threads 1 -i " + Quote(file) + " -f null -";

    // The baselines that hold no document first: they allocate next to
    // nothing, so where they run changes no other figure.
    double decode = 1e9, tool = 1e9;
    for (int round = 0; round < kRounds; ++round) {
        decode = std::min(decode, SecondsOf([&] { bench::DecodeOnly(file); }));
        tool = std::min(tool, SecondsOf([&] { Run(ffmpeg); }));
    }
    const Pair warm = Alternate(file, 0);
    const Pair cold = Alternate(file, kColdPauseSeconds);
    std::printf("\nbest of %d rounds\n", kRounds);
    std::printf("%-52s %8.3f s\n", "bare decode (samples dropped)", decode);
    std::printf("%-52s %8.3f s\n", "ffmpeg -threads 1 -f null", tool);
    for (const auto& [name, pair] : {std::pair{"memory just given back", warm}, std::pair{"memory given back 4 s before", cold}}) {
        std::printf("%s:\n", name);
        std::printf("  %-50s %8.3f s\n", "open until both views show the whole hour", pair.window);
        std::printf("  %-50s %8.3f s  ratio %.2f\n", "bare load (no window)", pair.bare, pair.window / pair.bare);
        std::printf("  %-50s %8s    ratio %.2f\n", "bare decode", "", pair.window / decode);
        std::printf("  %-50s %8s    ratio %.2f\n", "ffmpeg", "", pair.window / tool);
    }
    return 0;
}

}  // namespace
}  // namespace glimmet

int main(int argc, char** argv)
{
    return glimmet::Main(argc, argv);
}
