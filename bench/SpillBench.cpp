// Ten whole-hour Fade Ins on a one-hour stereo document, then ten undos,
// with the history held to a 1 GB memory budget (GLIMMET_HISTORY_BUDGET
// changes it; GLIMMET_BENCH_SECONDS shortens the document).
//
// Reports the resident set size (VmRSS) after the fades and after each undo
// beside its bound: the process before the document, plus the document,
// plus the budget. Each undo is timed beside its baseline, measured in the
// same run: reading the bytes it had to bring back from a file in the same
// folder as the scratch file, plus three memcpys of them.

#include <benchmark/benchmark.h>

#include "BenchSupport.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <fstream>
#include <memory>
#include <string>
#include <sys/mman.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

#include "edit/EditPosition.h"
#include "edit/FadeInAction.h"
#include "edit/HistoryManager.h"
#include "sound/BlockPool.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/SampleBlock.h"

namespace glimmet {
namespace {

constexpr int64_t kRate = 44100;
constexpr int kChannels = 2;

const int64_t kFrames = bench::DocumentSeconds() * kRate;
const int64_t kDocumentBytes = kChannels * kFrames * int64_t(sizeof(int16_t));

double Milliseconds(std::chrono::steady_clock::duration duration)
{
    return std::chrono::duration<double, std::milli>(duration).count();
}

/// VmRSS of this process in bytes.
int64_t ResidentSetBytes()
{
    std::ifstream status("/proc/self/status");
    std::string line;
    while (std::getline(status, line)) {
        if (line.rfind("VmRSS:", 0) == 0)
            return std::atoll(line.c_str() + 6) * 1024;
    }
    return -1;
}

double Megabytes(int64_t bytes)
{
    return double(bytes) / (1 << 20);
}

/// Reading bytes back from a file in the scratch file's folder (written
/// first, so it sits in the page cache as the scratch file does), plus
/// three memcpys of them, in milliseconds.
double BaselineMilliseconds(int64_t bytes)
{
    const char* folder = std::getenv("TMPDIR");
    std::string path = std::string(folder != nullptr && folder[0] != '\0' ? folder : "/tmp") + "/spillbench-XXXXXX";
    const int fd = ::mkstemp(path.data());
    if (fd < 0)
        return -1;
    ::unlink(path.c_str());
    std::vector<char> buffer(size_t(bytes), 3);
    for (int64_t done = 0; done < bytes;)
        done += ::pwrite(fd, buffer.data() + done, size_t(bytes - done), off_t(done));
    std::vector<char> target(size_t(bytes), 0);
    const auto begin = std::chrono::steady_clock::now();
    for (int64_t done = 0; done < bytes;)
        done += ::pread(fd, buffer.data() + done, size_t(bytes - done), off_t(done));
    const double read = Milliseconds(std::chrono::steady_clock::now() - begin);
    ::close(fd);
    return read + 3 * bench::MemcpyNanoseconds(size_t(bytes), 3, 1) / 1e6;
}

/// The share of the file behind fd that is in the page cache, in percent;
/// -1 when it cannot be told. Reading back from a cold file is the disk's
/// speed, not the program's.
double CachedPercent(int fd)
{
    struct stat status {};
    if (fd < 0 || ::fstat(fd, &status) != 0 || status.st_size == 0)
        return -1;
    void* map = ::mmap(nullptr, size_t(status.st_size), PROT_READ, MAP_SHARED, fd, 0);
    if (map == MAP_FAILED)
        return -1;
    const long page = ::sysconf(_SC_PAGE_SIZE);
    std::vector<unsigned char> pages(size_t((status.st_size + page - 1) / page));
    double percent = -1;
    if (::mincore(map, size_t(status.st_size), pages.data()) == 0)
        percent = 100.0 * double(std::count_if(pages.begin(), pages.end(), [](unsigned char p) { return p & 1; }))
            / double(pages.size());
    ::munmap(map, size_t(status.st_size));
    return percent;
}

/// CPU time of the calling thread so far, in milliseconds, and how often it
/// was taken off a core against its will: on a loaded machine wall time
/// alone cannot tell slow code from a thread left waiting for a core.
struct ThreadTimes {
    double cpu = 0;
    long preempted = 0;

    static ThreadTimes Now()
    {
        rusage usage {};
        ::getrusage(RUSAGE_THREAD, &usage);
        const auto ms = [](const timeval& t) { return double(t.tv_sec) * 1e3 + double(t.tv_usec) / 1e3; };
        return ThreadTimes{ms(usage.ru_utime) + ms(usage.ru_stime), usage.ru_nivcsw};
    }
};

struct Document {
    ChannelManager manager{nullptr};
    EditPosition position;

    Document()
    {
        std::vector<int16_t> samples(static_cast<size_t>(kFrames));
        for (int c = 0; c < kChannels; c++) {
            for (int64_t i = 0; i < kFrames; i++)
                samples[size_t(i)] = int16_t(9000 * std::sin(double(i) * (c + 3) * 0.01) + (i * 7 + c) % 61);
            auto channel = std::make_unique<Channel>();
            channel->InsertFrames(samples.data(), kFrames, 0);
            channel->SetSelected(true);
            manager.AddChannel(std::move(channel));
        }
        manager.SetRangeStart(0);
        manager.SetRangeEnd(kFrames - 1);
    }
};

void BM_TenFadesAndUndosWithinBudget(benchmark::State& state)
{
    // Lines appear as they are measured, also when the output is a file.
    std::setvbuf(stdout, nullptr, _IOLBF, 0);
    for (auto _ : state) {
        const int64_t before = ResidentSetBytes();
        Document document;
        HistoryManager history;
        if (std::getenv("GLIMMET_HISTORY_BUDGET") == nullptr)
            history.SetMemoryBudget(int64_t(1) << 30);
        const int64_t bound = before + kDocumentBytes + history.MemoryBudget();
        std::printf("budget %.0f MB, document %.0f MB, process before the document %.0f MB\n",
            Megabytes(history.MemoryBudget()), Megabytes(kDocumentBytes), Megabytes(before));
        double worstRatio = 0;
        for (int i = 0; i < 10; i++) {
            auto* action = new FadeInAction(nullptr);
            std::unique_ptr<Action> owned(action);
            action->SetTo(&document.manager, &document.position);
            history.AddAction(owned);
            const auto begin = std::chrono::steady_clock::now();
            action->Go();
            const double go = Milliseconds(std::chrono::steady_clock::now() - begin);
            history.SettleMemory();
            const int64_t rss = ResidentSetBytes();
            std::printf("fade %2d: Go %.0f ms; RSS %.0f MB, bound %.0f MB%s; blocks resident %.0f MB\n", i + 1, go,
                Megabytes(rss), Megabytes(bound), rss <= bound ? "" : "  OVER",
                Megabytes(SampleBlock::ResidentBytes()));
        }
        for (int i = 10; i > 0; i--) {
            const int64_t residentBefore = SampleBlock::ResidentBytes();
            const double cached = CachedPercent(history.SpillDescriptor());
            const ThreadTimes timesBefore = ThreadTimes::Now();
            const auto begin = std::chrono::steady_clock::now();
            history.Undo();
            const double undo = Milliseconds(std::chrono::steady_clock::now() - begin);
            const ThreadTimes timesAfter = ThreadTimes::Now();
            const int64_t readBack = std::max<int64_t>(0, SampleBlock::ResidentBytes() - residentBefore);
            const double baseline = readBack > 0 ? BaselineMilliseconds(readBack) : 0;
            history.SettleMemory();
            const int64_t rss = ResidentSetBytes();
            std::printf("undo %2d: %.1f ms, read back %.0f MB, baseline (read + 3 memcpy) %.1f ms, ratio %.2f; RSS "
                        "%.0f MB, bound %.0f MB%s; blocks resident %.0f MB, free pool blocks kept %.0f MB\n",
                i, undo, Megabytes(readBack), baseline, baseline > 0 ? undo / baseline : 0.0, Megabytes(rss),
                Megabytes(bound), rss <= bound ? "" : "  OVER", Megabytes(SampleBlock::ResidentBytes()),
                Megabytes(int64_t(BlockPool::Shared().WarmBlocks() * BlockPool::kBlockBytes)));
            std::printf("         undo on a core %.1f ms, preempted %ld times; scratch file %.0f%% in the page cache "
                        "before it\n",
                timesAfter.cpu - timesBefore.cpu, timesAfter.preempted - timesBefore.preempted, cached);
            if (baseline > 0)
                worstRatio = std::max(worstRatio, undo / baseline);
        }
        state.counters["worst_undo_vs_baseline"] = worstRatio;
    }
}
BENCHMARK(BM_TenFadesAndUndosWithinBudget)->Iterations(1)->Unit(benchmark::kSecond);

}  // namespace
}  // namespace glimmet

BENCHMARK_MAIN();
