#pragma once

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <cstdio>
#include <cstring>
#include <vector>

#include "files/MediaFile.h"
#include "files/MediaFormat.h"
#include "files/MediaTrack.h"
#include "sound/Channel.h"
#include "sound/SampleBlock.h"


namespace glimmet::bench {

/// How long the benchmark's document is: GLIMMET_BENCH_SECONDS, or an hour.
inline int64_t DocumentSeconds()
{
    const char* seconds = std::getenv("GLIMMET_BENCH_SECONDS");
    return seconds != nullptr ? std::max(1L, std::atol(seconds)) : 3600;
}

/// Best (lowest) mean wall time in nanoseconds of calling work `repetitions`
/// times, over `rounds` rounds: the least disturbed measurement.
template <typename Work>
double BestNanoseconds(int rounds, int repetitions, Work&& work)
{
    double best = 0;
    for (int round = 0; round < rounds; ++round) {
        const auto start = std::chrono::steady_clock::now();
        for (int i = 0; i < repetitions; ++i)
            work();
        const auto elapsed = std::chrono::steady_clock::now() - start;
        const double mean = std::chrono::duration<double, std::nano>(elapsed).count() / repetitions;
        if (round == 0 || mean < best)
            best = mean;
    }
    return best;
}

/// memcpy of `bytes`, timed like the work it is compared with.
inline double MemcpyNanoseconds(size_t bytes, int rounds, int repetitions)
{
    std::vector<char> source(bytes, 1);
    std::vector<char> target(bytes, 0);
    std::memcpy(target.data(), source.data(), bytes);  // fault the pages in first
    return BestNanoseconds(rounds, repetitions, [&] {
        std::memcpy(target.data(), source.data(), bytes);
        asm volatile("" : : "r"(target.data()) : "memory");
    });
}

/// Reads every frame of the file's first track and keeps none: what opening
/// costs before anything is stored. Aborts when the file cannot be read.
inline void DecodeOnly(const std::filesystem::path& file)
{
    MediaFile media(file);
    MediaTrack* track = media.TrackAt(0);
    media_format format;
    format.type = B_MEDIA_RAW_AUDIO;
    format.raw_audio.format = B_AUDIO_SHORT;
    if (track == nullptr || track->DecodedFormat(&format) != B_OK)
        std::abort();
    const int16_t* frames = nullptr;
    int64_t count = 0;
    int64_t total = 0;
    while (track->ReadFramesInPlace(&frames, &count) == B_OK) {
        asm volatile("" : : "r"(frames) : "memory");
        total += count;
    }
    if (total <= 0)
        std::abort();
    media.ReleaseTrack(track);
}

/// Seconds in a steady-clock duration.
inline double Seconds(std::chrono::steady_clock::duration duration)
{
    return std::chrono::duration<double>(duration).count();
}

/// A channel's samples in one array, read span by span as the mixer and the
/// views read them.
inline std::vector<int16_t> SamplesOf(Channel& channel)
{
    std::vector<int16_t> samples;
    channel.ReadSpans(0, channel.FrameCount(), [&samples](const SampleSpan& span) {
        samples.insert(samples.end(), span.samples, span.samples + span.count);
    });
    return samples;
}

}  // namespace glimmet::bench
