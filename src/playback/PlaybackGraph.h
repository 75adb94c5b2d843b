#pragma once

#include <SDL_audio.h>

#include <cstdint>
#include <memory>
#include <string>

#include "playback/DeviceTimeSource.h"
#include "playback/MediaKit.h"
#include "support/Status.h"

namespace glimmet {

class AudioProducer;
class ChannelManager;
class MessageTarget;
class SharedOutput;

/// A document window's way to the sound server: its AudioProducer connected
/// to the process's SharedOutput, running on a clock of its own that the
/// output advances by what it plays of this producer.
///
/// SetupNodes registers the producer, negotiates the format with it and
/// joins the output (the first graph to join opens the device);
/// StartNodes and StopNodes start and stop the producer; TearDownNodes
/// leaves the output (the last graph to leave closes the device) and
/// deletes the producer. Failures are printed on standard output and
/// returned. When the device cannot be opened the graph falls back to SDL's
/// dummy driver, saying so in one line, so the editor keeps working without
/// sound.
///
/// Thread use: every operation runs on the window thread, which must not
/// hold the document lock while calling them (the device's audio thread
/// takes it to mix). Graphs of different windows may be set up, played and
/// torn down from their own threads at the same time.
class PlaybackGraph {
public:
    /// The driver tried when the device cannot be opened.
    static constexpr const char* kFallbackDriver = "dummy";

    PlaybackGraph(ChannelManager* manager, MessageTarget* window);
    ~PlaybackGraph();
    PlaybackGraph(const PlaybackGraph&) = delete;
    PlaybackGraph& operator=(const PlaybackGraph&) = delete;

    /// B_MEDIA_ALREADY_CONNECTED, changing nothing, once there is a producer.
    status_t SetupNodes();
    /// B_ERROR when there is no roster or no producer.
    status_t StartNodes();
    /// Stops the producer at once; returns when no buffer is being mixed any
    /// more, so that the play position can be reset safely afterwards.
    void StopNodes();
    void TearDownNodes();

    AudioProducer* Producer() const { return producer_.get(); }
    const MediaFormat& Format() const { return format_; }
    const MediaSource& Source() const { return source_; }
    const MediaDestination& Destination() const { return destination_; }
    DeviceTimeSource& TimeSource() { return timeSource_; }
    /// The SDL driver the device was opened on, empty before.
    const std::string& DriverName() const { return driverName_; }
    /// The shared output's device while this graph plays through it, else 0.
    SDL_AudioDeviceID Device() const { return device_; }

    /// For tests: the driver tried after a failed open instead of "dummy".
    void SetFallbackDriver(const char* driver) { fallbackDriver_ = driver; }

private:
    status_t JoinOutput(const MediaFormat& format);
    bool FallBack();
    status_t GetInitialLatency(int64_t* latency) const;
    void LeaveOutput();

    ChannelManager* manager_;  // not owned
    MessageTarget* window_;    // not owned
    bool roster_ = false;      // set up far enough to have a roster
    bool share_ = false;       // holds a share of the audio subsystem
    std::unique_ptr<AudioProducer> producer_;
    int32_t producerNode_ = -1;
    int32_t timeSourceNode_ = -1;
    int32_t mixerNode_ = -1;
    MediaSource source_;
    MediaDestination destination_;
    MediaFormat format_;
    DeviceTimeSource timeSource_;
    SharedOutput* output_;     // not owned
    SDL_AudioDeviceID device_ = 0;  // set while holding a place on output_
    std::string driverName_;
    std::string fallbackDriver_ = kFallbackDriver;
};

}  // namespace glimmet
