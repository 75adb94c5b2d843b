// Documents of 256, 1024 and 2048 channels in a real document window on
// Qt's offscreen platform: appending 256-channel WAV files until the
// document holds them all, laid out and drawn; one select-all and Invert
// Phase over every channel; its undo; one added channel and its undo; one
// removed channel and its undo. Every step is timed up to the point where
// the window has drained its events, as the batch mode does after each
// line.
//
// The baseline is the 256-channel document measured in the same run: the
// cost per channel of each step at 1024 and 2048 channels is printed as a
// ratio to it. Work that grows linearly with the channel count keeps that
// ratio near 1; work that grows with its square doubles it with each
// doubling of the channels.
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <iterator>
#include <filesystem>
#include <fstream>
#include <map>
#include <string>
#include <vector>

#include <QApplication>
#include <QTemporaryDir>

#include "app/BatchRunner.h"
#include "app/QuillexWindow.h"
#include "sound/ChannelManager.h"
#include "support/MessageCodes.h"

#include "BenchSupport.h"

namespace glimmet {
namespace {

constexpr int kFileChannels = 256;
constexpr int kFileFrames = 4410;  // 0.1 s at 44100 Hz
// The sizes measured unless others are named on the command line (each a
// multiple of 256; the first is the baseline).
constexpr int kSizes[] = {256, 1024, 2048};

void PutLittleEndian(std::ofstream& out, uint32_t value, int bytes)
{
    for (int i = 0; i < bytes; ++i)
        out.put(char((value >> (8 * i)) & 0xff));
}

// A plain PCM WAV of 256 channels, each its own tone, written here because
// the ffmpeg command line refuses to make one.
std::filesystem::path WriteManyChannelWav(const std::filesystem::path& dir)
{
    const std::filesystem::path path = dir / "ch256.wav";
    std::ofstream out(path, std::ios::binary);
    const uint32_t dataBytes = uint32_t(kFileFrames) * kFileChannels * 2;
    out.write("RIFF", 4);
    PutLittleEndian(out, 36 + dataBytes, 4);
    out.write("WAVEfmt ", 8);
    PutLittleEndian(out, 16, 4);
    PutLittleEndian(out, 1, 2);
    PutLittleEndian(out, kFileChannels, 2);
    PutLittleEndian(out, 44100, 4);
    PutLittleEndian(out, 44100u * kFileChannels * 2, 4);
    PutLittleEndian(out, kFileChannels * 2, 2);
    PutLittleEndian(out, 16, 2);
    out.write("data", 4);
    PutLittleEndian(out, dataBytes, 4);
    for (int frame = 0; frame < kFileFrames; ++frame) {
        for (int channel = 0; channel < kFileChannels; ++channel) {
            const double phase = 2 * M_PI * frame * (channel + 1) / 441.0;
            PutLittleEndian(out, uint32_t(uint16_t(int16_t(std::lround(20000 * std::sin(phase))))), 2);
        }
    }
    return path;
}

using Clock = std::chrono::steady_clock;

double SecondsOf(QuillexWindow& window, uint32_t what)
{
    const Clock::time_point start = Clock::now();
    window.PostMessage(what);
    BatchRunner::DrainEvents();
    return bench::Seconds(Clock::now() - start);
}

struct Figures {
    std::map<std::string, double> seconds;
    int channels = 0;
};

const char* const kSteps[] = {"append + layout + draw", "select all + Invert Phase", "undo",
    "add channel + undo", "remove channel + undo"};

Figures Measure(const std::filesystem::path& file, int channels)
{
    Figures figures;
    QuillexWindow window;
    window.SetAppendOnLoad(true);
    BatchRunner::DrainEvents();

    const Clock::time_point start = Clock::now();
    for (int added = 0; added < channels; added += kFileChannels) {
        window.OpenFile(file);
        BatchRunner::DrainEvents();
    }
    figures.seconds[kSteps[0]] = bench::Seconds(Clock::now() - start);
    figures.channels = window.Manager()->CountChannels();

    const Clock::time_point transform = Clock::now();
    window.PostMessage(kMsgSelectAll);
    window.PostMessage(kMsgRevertPhases);
    BatchRunner::DrainEvents();
    figures.seconds[kSteps[1]] = bench::Seconds(Clock::now() - transform);
    figures.seconds[kSteps[2]] = SecondsOf(window, kMsgUndo);
    figures.seconds[kSteps[3]] = SecondsOf(window, kMsgAddChannel) + SecondsOf(window, kMsgUndo);
    figures.seconds[kSteps[4]] = SecondsOf(window, kMsgRemoveChannel) + SecondsOf(window, kMsgUndo);
    return figures;
}

int Run(int argc, char** argv)
{
    if (qEnvironmentVariableIsEmpty("QT_QPA_PLATFORM"))
        qputenv("QT_QPA_PLATFORM", "offscreen");
    if (qEnvironmentVariableIsEmpty("SDL_AUDIODRIVER"))
        qputenv("SDL_AUDIODRIVER", "dummy");
    QApplication application(argc, argv);
    QTemporaryDir dir;
    const std::filesystem::path file = WriteManyChannelWav(dir.path().toStdString());

    std::vector<int> sizes(std::begin(kSizes), std::end(kSizes));
    if (argc > 1) {
        sizes.clear();
        for (int i = 1; i < argc; ++i)
            sizes.push_back(std::max(kFileChannels, std::atoi(argv[i]) / kFileChannels * kFileChannels));
    }
    std::vector<Figures> all;
    for (int size : sizes) {
        all.push_back(Measure(file, size));
        std::printf("%5d channels measured\n", all.back().channels);
        std::fflush(stdout);
    }
    const Figures& base = all.front();
    std::printf("\n%-28s %8s %12s %14s %18s\n", "step", "channels", "seconds", "us per channel",
        "ratio to 256 ch.");
    for (const char* step : kSteps) {
        const double basePerChannel = base.seconds.at(step) / base.channels;
        for (const Figures& figures : all) {
            const double perChannel = figures.seconds.at(step) / figures.channels;
            std::printf("%-28s %8d %12.3f %14.1f %18.2f\n", step, figures.channels, figures.seconds.at(step),
                perChannel * 1e6, perChannel / basePerChannel);
        }
    }
    return 0;
}

}  // namespace
}  // namespace glimmet

int main(int argc, char** argv)
{
    return glimmet::Run(argc, argv);
}
