// Opening and saving a one-hour 16-bit stereo WAV document, each beside the
// command-line tool doing the same work in the same run:
//   open: ffmpeg -v quiet -threads 1 -i FILE -f null -, and the bare decode
//         (our own track read to its end, the samples dropped)
//   save: sox FILE copy.wav (and, as the floor of a crash-safe save,
//         dd if=FILE of=copy.wav bs=1M conv=fsync)
// Peak memory of opening is compared with the decoded channel data.
// GLIMMET_BENCH_DIR chooses where the 635 MB files go (default: the system's
// temporary directory); GLIMMET_BENCH_SECONDS shortens the document.

#include <benchmark/benchmark.h>

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <memory>
#include <string>

#include "files/DocumentLoader.h"
#include "files/DocumentSaver.h"
#include "files/FrameWriter.h"
#include "sound/BlockPool.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/SampleAllocator.h"

#include "BenchSupport.h"

namespace {

using namespace glimmet;

constexpr int kRounds = 3;

/// A private directory for the benchmark's files, removed at exit.
class WorkDirectory {
public:
    WorkDirectory()
    {
        const char* chosen = std::getenv("GLIMMET_BENCH_DIR");
        std::string pattern = ((chosen != nullptr) ? std::filesystem::path(chosen)
                                                   : std::filesystem::temp_directory_path())
            / "glimmet-filebench-XXXXXX";
        if (mkdtemp(pattern.data()) == nullptr)
            std::abort();
        path_ = pattern;
    }
    ~WorkDirectory()
    {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
    }

    static std::filesystem::path Path()
    {
        static const WorkDirectory directory;
        return directory.path_;
    }

private:
    std::filesystem::path path_;
};

std::string Quote(const std::filesystem::path& path)
{
    return "'" + path.string() + "'";
}

/// The document as a WAV file, made once by sox: a sweep, so that no codec
/// or cache could take a shortcut.
const std::filesystem::path& SourceFile()
{
    static const std::filesystem::path file = [] {
        const auto path = WorkDirectory::Path() / "hour.wav";
        const std::string command = "sox -n -r 44100 -c 2 -b 16 -e signed " + Quote(path) + " synth "
            + std::to_string(bench::DocumentSeconds()) + " sine 100-8000 sine 300-3000 vol 0.8";
        if (std::system(command.c_str()) != 0)
            std::abort();
        return path;
    }();
    return file;
}

double SecondsOf(const std::function<void()>& work)
{
    const auto start = std::chrono::steady_clock::now();
    work();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

/// A /proc/self/status figure in bytes ("VmHWM", "VmRSS").
int64_t ProcessMemory(const std::string& field)
{
    std::ifstream status("/proc/self/status");
    std::string line;
    while (std::getline(status, line)) {
        if (line.rfind(field + ":", 0) == 0)
            return std::atoll(line.c_str() + field.size() + 1) * 1024;
    }
    return 0;
}

/// Makes VmHWM start again from the present resident size.
void ResetPeakMemory()
{
    std::ofstream("/proc/self/clear_refs") << "5";
}

int64_t DecodedBytes(ChannelManager& manager)
{
    int64_t bytes = 0;
    for (int32_t i = 0; i < manager.CountChannels(); ++i)
        bytes += manager.ChannelAt(i)->FrameCount() * int64_t(sizeof(int16_t));
    return bytes;
}

/// Best times of several pieces of work measured in alternation, so that a
/// busy moment of the machine falls on all of them alike.
std::vector<double> BestAlternating(const std::vector<std::function<void()>>& works)
{
    std::vector<double> best(works.size(), 0);
    for (int round = 0; round < kRounds; ++round) {
        for (size_t i = 0; i < works.size(); ++i) {
            const double seconds = SecondsOf(works[i]);
            best[i] = round == 0 ? seconds : std::min(best[i], seconds);
        }
    }
    return best;
}

std::function<void()> Command(const std::string& command)
{
    return [command] {
        if (std::system(command.c_str()) != 0)
            std::abort();
    };
}

void BM_OpenOneHourWav(benchmark::State& state)
{
    const auto& file = SourceFile();
    const auto ffmpeg = Command("ffmpeg -v quiet -threads 1 -i " + Quote(file) + " -f null -");
    double ours = 0;
    double baseline = 0;
    double bare = 0;
    double peakRatio = 0;
    for (auto _ : state) {
        // Rounds alternate between the two, so that a busy moment of the
        // machine falls on both alike. Only the opening is timed: closing a
        // document is no part of it (and ffmpeg never holds the data).
        for (int round = 0; round < kRounds; ++round) {
            auto document = std::make_unique<ChannelManager>(nullptr);
            const int64_t before = ProcessMemory("VmRSS");
            ResetPeakMemory();
            const double seconds = SecondsOf([&] {
                if (DocumentLoader::Load(file, document.get(), false) != B_OK)
                    std::abort();
            });
            peakRatio = double(ProcessMemory("VmHWM") - before) / double(DecodedBytes(*document));
            document.reset();
            // Every round opens into fresh memory, as the first open of a
            // session does, instead of into the blocks the last round freed.
            SampleAllocator::Shared().ReleaseCached();
            BlockPool::Shared().ReleaseFree();
            const double baselineSeconds = SecondsOf(ffmpeg);
            const double bareSeconds = SecondsOf([&] { bench::DecodeOnly(file); });
            ours = round == 0 ? seconds : std::min(ours, seconds);
            baseline = round == 0 ? baselineSeconds : std::min(baseline, baselineSeconds);
            bare = round == 0 ? bareSeconds : std::min(bare, bareSeconds);
        }
        state.SetIterationTime(ours);
    }
    state.counters["ours_s"] = ours;
    state.counters["ffmpeg_s"] = baseline;
    state.counters["time_vs_ffmpeg"] = ours / baseline;
    state.counters["bare_decode_s"] = bare;
    state.counters["time_vs_bare_decode"] = ours / bare;
    state.counters["peak_vs_decoded"] = peakRatio;
}
BENCHMARK(BM_OpenOneHourWav)->UseManualTime()->Iterations(1)->Unit(benchmark::kMillisecond);

/// Takes frames and drops them: the mix alone, without any file.
class DiscardingWriter : public FrameWriter {
public:
    status_t WriteFrames(const int16_t* frames, int64_t count) override
    {
        benchmark::DoNotOptimize(frames[2 * count - 1]);
        return B_OK;
    }
};

void BM_SaveOneHourWav(benchmark::State& state)
{
    const auto& file = SourceFile();
    ChannelManager document(nullptr);
    if (DocumentLoader::Load(file, &document, false) != B_OK)
        std::abort();
    const auto soxCopy = WorkDirectory::Path() / "sox-copy.wav";
    const auto ddCopy = WorkDirectory::Path() / "dd-copy.wav";
    const auto ourCopy = WorkDirectory::Path() / "our-copy.wav";
    DiscardingWriter discard;
    std::vector<double> best;
    for (auto _ : state) {
        best = BestAlternating({
            [&] { DocumentSaver::SaveFile(ourCopy, &document, nullptr); },
            Command("sox " + Quote(file) + " " + Quote(soxCopy)),
            // The floor for any save that survives a crash: the same bytes
            // copied and flushed to disk.
            Command("dd if=" + Quote(file) + " of=" + Quote(ddCopy) + " bs=1M conv=fsync status=none"),
            [&] { DocumentSaver::WriteDocument(&document, discard); },
        });
        state.SetIterationTime(best[0]);
    }
    state.counters["ours_s"] = best[0];
    state.counters["sox_s"] = best[1];
    state.counters["time_vs_sox"] = best[0] / best[1];
    state.counters["dd_fsync_s"] = best[2];
    state.counters["time_vs_dd_fsync"] = best[0] / best[2];
    // What saving costs beyond the mix: writing, and waiting for the disk.
    state.counters["mix_s"] = best[3];
    for (const auto& copy : {soxCopy, ddCopy, ourCopy})
        std::filesystem::remove(copy);
}
BENCHMARK(BM_SaveOneHourWav)->UseManualTime()->Iterations(1)->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();
