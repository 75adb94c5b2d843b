// Opening a one-hour 16-bit stereo WAV file in a document window on Qt's
// offscreen platform, until both channels' views show their whole picture,
// beside three baselines measured in the same run, in alternation:
//   bare load:   the same file loaded into a document with no window
//   bare decode: our own track read to its end, the samples dropped
//   ffmpeg:      ffmpeg -v quiet -threads 1 -i FILE -f null -
// Every round opens into memory handed back to the system, as the first
// open of a session does. GLIMMET_BENCH_DIR chooses where the 635 MB file
// goes (default: the system's temporary directory); GLIMMET_BENCH_SECONDS
// shortens it. The figures are the best of the rounds.
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <memory>
#include <string>

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

int64_t DocumentSeconds()
{
    const char* seconds = std::getenv("GLIMMET_BENCH_SECONDS");
    return seconds != nullptr ? std::max(1L, std::atol(seconds)) : 3600;
}

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
    Run("sox -n -r 44100 -c 2 -b 16 -e signed " + Quote(path) + " synth " + std::to_string(DocumentSeconds())
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

    double window = 0, bare = 0, decode = 0, tool = 0;
    for (int round = 0; round < kRounds; ++round) {
        const double w = OpenInWindow(file);
        ReleaseMemory();
        const double b = LoadBare(file);
        ReleaseMemory();
        const double d = SecondsOf([&] { bench::DecodeOnly(file); });
        const double f = SecondsOf([&] { Run(ffmpeg); });
        std::printf("round %d: window %.3f s, bare load %.3f s, bare decode %.3f s, ffmpeg %.3f s\n", round + 1, w,
            b, d, f);
        window = round == 0 ? w : std::min(window, w);
        bare = round == 0 ? b : std::min(bare, b);
        decode = round == 0 ? d : std::min(decode, d);
        tool = round == 0 ? f : std::min(tool, f);
    }
    std::printf("\nbest of %d rounds\n", kRounds);
    std::printf("%-44s %8.3f s\n", "open until both views show the whole hour", window);
    std::printf("%-44s %8.3f s  ratio %.2f\n", "bare load (no window)", bare, window / bare);
    std::printf("%-44s %8.3f s  ratio %.2f\n", "bare decode (samples dropped)", decode, window / decode);
    std::printf("%-44s %8.3f s  ratio %.2f\n", "ffmpeg -threads 1 -f null", tool, window / tool);
    return 0;
}

}  // namespace
}  // namespace glimmet

int main(int argc, char** argv)
{
    return glimmet::Main(argc, argv);
}
