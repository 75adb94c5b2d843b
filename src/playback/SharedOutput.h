#pragma once

#include <SDL_audio.h>

#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

#include "playback/MediaKit.h"
#include "support/Status.h"

namespace glimmet {

class AudioProducer;
class DeviceTimeSource;

/// The process's one SDL audio device, which every document window plays
/// through. Sound servers without a software mixer (ALSA's hw devices, SDL's
/// dummy and disk drivers) give a process a single output, so the windows
/// share it here and their producers are mixed together.
///
/// A graph joins with its negotiated format: the first place opens the
/// device in that format, and the last one to leave closes it; a later
/// window opens it again. A format that differs from the open device's in
/// rate, channels, sample format or buffer size is refused with a diagnostic (status
/// B_MEDIA_ALREADY_CONNECTED) rather than converted: every producer
/// negotiates the same format today, so a mismatch is a fault worth hearing
/// about, not something to resample around.
///
/// Each period, every attached producer fills its own scratch buffer (one
/// device period, allocated when it attaches) and advances its own time
/// source, exactly as when it had a device of its own. The buffers are then
/// added in attachment order and the sum hard-clipped to [-1, 1]. A lone
/// producer's samples are copied unchanged, and the clip leaves in-range
/// samples alone, so a window playing by itself sounds bit for bit as it
/// did with a device of its own.
///
/// Thread use: Join, Attach, Detach and Leave run on window threads and are
/// serialized by a mutex of our own. The producer list is changed only
/// while SDL's device lock is held as well, which is also held around every
/// callback: the audio thread reads it without taking a lock of ours, and
/// neither allocates nor posts anything itself. Once Detach returns, the
/// producer is served no more.
class SharedOutput {
public:
    /// The longest period SDL can be asked for, and the most channels.
    static constexpr int64_t kMaxPeriodFrames = 65535;
    static constexpr uint32_t kMaxChannels = 8;

    /// The one the playback graphs share.
    static SharedOutput& Instance();

    SharedOutput() = default;
    ~SharedOutput();
    SharedOutput(const SharedOutput&) = delete;
    SharedOutput& operator=(const SharedOutput&) = delete;

    /// Frames in one period of the format, 0 when it cannot be played (no
    /// whole frame, more than kMaxPeriodFrames or kMaxChannels, no rate).
    static int64_t PeriodFrames(const MediaFormat& format);

    /// Takes a place on the device, opening it (paused until the first
    /// producer attaches) when nobody holds one. B_MEDIA_BAD_FORMAT for a
    /// format that cannot be played, B_MEDIA_SYSTEM_FAILURE when SDL cannot
    /// open the device (SDL_GetError says why), B_MEDIA_ALREADY_CONNECTED
    /// when the device is open in another format. No place is taken then.
    status_t Join(const MediaFormat& format);
    /// Gives the place up; the last one closes the device. A producer still
    /// attached must be detached first.
    void Leave();

    /// With a place held: the device serves the producer from its next
    /// period on, advancing the time source by what it plays.
    void Attach(AudioProducer* producer, DeviceTimeSource* timeSource);
    /// Once this returns the producer is not called any more.
    void Detach(AudioProducer* producer);

    /// 0 while closed.
    SDL_AudioDeviceID Device() const;
    /// The driver the device was opened on, empty while closed.
    std::string DriverName() const;
    bool IsOpen() const { return Device() != 0; }
    int Places() const;
    int AttachedProducers() const;

private:
    struct Member {
        AudioProducer* producer;
        DeviceTimeSource* timeSource;
        std::vector<float> scratch;  // one period, channels interleaved
    };

    static void DeviceCallback(void* userdata, Uint8* stream, int length);
    void Serve(float* out, int32_t frames);
    void ServePeriod(float* out, int32_t frames);
    void Sum(float* out, size_t count) const;

    status_t Open(const MediaFormat& format);
    bool Accepts(const MediaFormat& format) const;
    void Close();

    mutable std::mutex mutex_;  // window threads: everything below
    int places_ = 0;
    SDL_AudioDeviceID device_ = 0;
    MediaFormat format_;
    std::string driverName_;
    // Fixed while the device is open; the audio thread reads them.
    int32_t periodFrames_ = 0;
    int channels_ = 0;
    // Changed under both mutex_ and SDL's device lock; the audio thread
    // reads it under the device lock only.
    std::vector<Member> members_;
};

}  // namespace glimmet
