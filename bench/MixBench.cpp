// The playback mix in 256-frame buffers and the save mix of a one-hour
// stereo document, each beside a memcpy of the same input bytes measured in
// the same run.
#include <cstdio>
#include <random>
#include <vector>

#include "BenchSupport.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {
namespace {

constexpr int64_t kBufferFrames = 256;
constexpr double kRate = 44100.0;
constexpr int64_t kOneHourFrames = 158760000;

Channel* RandomChannel(int64_t frames, int8_t pan, uint32_t seed)
{
    std::minstd_rand random(seed);
    auto* samples = new int16_t[size_t(frames)];
    for (int64_t i = 0; i < frames; ++i)
        samples[i] = int16_t(random() & 0xffff);
    auto* channel = new Channel();
    channel->SetTo(samples, frames);
    channel->SetPanPosition(pan);
    return channel;
}

// Channels alternate left and right as a loaded file's do, so each side sums
// many channels and goes through the curve.
void PlaybackMix(int32_t channels)
{
    ChannelManager manager(nullptr);
    for (int32_t c = 0; c < channels; ++c)
        manager.AddChannel(std::unique_ptr<Channel>(RandomChannel(10 * 44100, c % 2 == 0 ? -128 : 127, uint32_t(c + 1))));
    std::vector<float> out(size_t(kBufferFrames) * 2);
    const double mixNs = bench::BestNanoseconds(5, 2000, [&] {
        manager.FillBuffer(out.data(), kBufferFrames);
        asm volatile("" : : "r"(out.data()) : "memory");
    });
    const double memcpyNs = bench::MemcpyNanoseconds(size_t(channels) * kBufferFrames * sizeof(int16_t), 5, 2000);
    const double bufferNs = kBufferFrames / kRate * 1e9;
    std::printf("playback mix, %2d channels: %8.2f us per buffer, %7.0fx realtime; memcpy of the input %6.3f us; "
                "ratio %.1f\n",
        channels, mixNs / 1000, bufferNs / mixNs, memcpyNs / 1000, mixNs / memcpyNs);
}

void SaveMix()
{
    ChannelManager manager(nullptr);
    manager.AddChannel(std::unique_ptr<Channel>(RandomChannel(kOneHourFrames, -128, 1)));
    manager.AddChannel(std::unique_ptr<Channel>(RandomChannel(kOneHourFrames, 127, 2)));
    std::vector<int16_t> out(1024 * 2);
    const double saveNs = bench::BestNanoseconds(3, 1, [&] {
        manager.SetCurrentFrame(0);
        int64_t frames = 1024;
        while (manager.FillBuffer(out.data(), &frames)) {
            asm volatile("" : : "r"(out.data()) : "memory");
            frames = 1024;
        }
    });
    const size_t bytes = size_t(kOneHourFrames) * 2 * sizeof(int16_t);
    const double memcpyNs = bench::MemcpyNanoseconds(bytes, 3, 1);
    std::printf("save mix of one hour of stereo: %8.1f ms; memcpy of the same %zu bytes %8.1f ms; ratio %.2f\n",
        saveNs / 1e6, bytes, memcpyNs / 1e6, saveNs / memcpyNs);
}

}  // namespace
}  // namespace glimmet

int main(int argc, char** argv)
{
    const bool quick = argc > 1 && std::string_view(argv[1]) == "--quick";
    for (int32_t channels : {2, 16, 64})
        glimmet::PlaybackMix(channels);
    if (!quick)
        glimmet::SaveMix();
    return 0;
}
