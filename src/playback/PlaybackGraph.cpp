#include "playback/PlaybackGraph.h"

#include <SDL.h>

#include <atomic>
#include <cmath>
#include <cstring>

#include "playback/AudioProducer.h"
#include "playback/AudioSystem.h"
#include "support/Diagnostics.h"
#include "support/SystemTime.h"

namespace glimmet {

namespace {

std::atomic<int32_t> gNextNodeId{1};

// Errors print as the 32-bit numbers they are.
unsigned long Hex(status_t status)
{
    return (unsigned long)uint32_t(status);
}

}  // namespace

PlaybackGraph::PlaybackGraph(ChannelManager* manager, MessageTarget* window) : manager_(manager), window_(window)
{
}

PlaybackGraph::~PlaybackGraph()
{
    CloseDevice();
    producer_.reset();
    if (share_)
        AudioSystem::Release();
}

status_t PlaybackGraph::SetupNodes()
{
    // The device serves the producer that exists; a second one is not made.
    if (producer_ != nullptr)
        return B_MEDIA_ALREADY_CONNECTED;
    bool fellBack = false;
    share_ = AudioSystem::Acquire();
    if (!share_) {
        fellBack = true;
        if (!FallBack()) {
            Diagnostics::Print("Can't find the media roster, error: %lx\n", Hex(B_MEDIA_SYSTEM_FAILURE));
            return B_MEDIA_SYSTEM_FAILURE;
        }
    }
    roster_ = true;

    // The device's clock; it starts when the device is opened.
    timeSourceNode_ = gNextNodeId++;

    producer_ = std::make_unique<AudioProducer>(manager_, window_);
    producerNode_ = gNextNodeId++;
    producer_->NodeRegistered(producerNode_);

    // The system's mixer stands for the output device of the driver in use.
    if (AudioSystem::CurrentDriver() == nullptr) {
        Diagnostics::Print("unable to get the system mixer, error: %lx\n", Hex(B_MEDIA_SYSTEM_FAILURE));
        return B_MEDIA_SYSTEM_FAILURE;
    }
    mixerNode_ = gNextNodeId++;
    producer_->SetTimeSource(&timeSource_);

    int32_t cookie = 0;
    MediaOutput output;
    if (producer_->GetNextOutput(&cookie, &output) != B_OK || !(output.destination == MediaDestination::Null())) {
        Diagnostics::Print("unable to get a free output from the producer node, error: %lx\n", Hex(B_MEDIA_BAD_NODE));
        return B_MEDIA_BAD_NODE;
    }
    const MediaDestination input{mixerNode_, 0};

    MediaFormat format;
    format.type = B_MEDIA_RAW_AUDIO;
    status_t status = B_OK;
    source_ = output.source;
    destination_ = input;
    if ((status = producer_->FormatProposal(source_, &format)) == B_OK) {
        MediaSource source;
        char name[kMediaNameLength] = {};
        status = producer_->PrepareToConnect(source_, input, &format, &source, name);
        if (status == B_OK) {
            status = OpenDevice(format);
            if (status != B_OK && !fellBack) {
                fellBack = true;
                if (FallBack())
                    status = OpenDevice(format);
            }
            producer_->Connect(status, source, input, format, name,
                status == B_OK ? producer_->BufferDuration() : 0);
        }
    }
    if (status != B_OK) {
        source_ = MediaSource::Null();
        destination_ = MediaDestination::Null();
        Diagnostics::Print("unable to connect nodes, error: %lx\n", Hex(status));
        return status;
    }
    format_ = format;
    producer_->SetRunMode(B_INCREASE_LATENCY);
    SDL_PauseAudioDevice(device_, 0);
    return B_OK;
}

bool PlaybackGraph::FallBack()
{
    Diagnostics::Print("No sound device could be opened (%s); playing through SDL's %s driver\n", SDL_GetError(),
        fallbackDriver_.c_str());
    return AudioSystem::SwitchDriver(fallbackDriver_.c_str(), share_, &share_);
}

status_t PlaybackGraph::OpenDevice(const MediaFormat& format)
{
    const int64_t frames = format.channelCount > 0 ? format.bufferSize / 4 / format.channelCount : 0;
    const long rate = std::lround(format.frameRate);
    if (frames < 1 || frames > 65535 || rate < 1 || format.channelCount > 8) {
        SDL_SetError("the format cannot be played");
        return B_MEDIA_BAD_FORMAT;
    }
    SDL_AudioSpec wanted;
    SDL_zero(wanted);
    wanted.freq = int(rate);
    wanted.format = AUDIO_F32SYS;
    wanted.channels = Uint8(format.channelCount);
    wanted.samples = Uint16(frames);
    wanted.callback = &PlaybackGraph::DeviceCallback;
    wanted.userdata = this;
    SDL_AudioSpec obtained;
    SDL_zero(obtained);
    // No changes allowed: SDL converts and re-blocks to what the producer
    // negotiated, so each callback is exactly one producer buffer.
    timeSource_.Reset(float(rate));
    device_ = SDL_OpenAudioDevice(nullptr, 0, &wanted, &obtained, 0);
    if (device_ == 0)
        return B_MEDIA_SYSTEM_FAILURE;
    deviceChannels_ = obtained.channels;
    driverName_ = SDL_GetCurrentAudioDriver() ? SDL_GetCurrentAudioDriver() : "";
    // What lies downstream of the producer is one device period.
    producer_->SetBufferDuration(int64_t(frames) * 1000000 / rate);
    return B_OK;
}

void PlaybackGraph::DeviceCallback(void* userdata, Uint8* stream, int length)
{
    static_cast<PlaybackGraph*>(userdata)->ServeDevice(stream, length);
}

void PlaybackGraph::ServeDevice(Uint8* stream, int length)
{
    // Runs on SDL's audio thread. The device is closed before the producer
    // goes, so the producer is there whenever this runs.
    const int frameBytes = deviceChannels_ * int(sizeof(float));
    if (producer_ == nullptr || deviceChannels_ != 2) {
        std::memset(stream, 0, size_t(length));
        return;
    }
    const int32_t frames = length / frameBytes;
    producer_->ServeDevice(reinterpret_cast<float*>(stream), frames, timeSource_.FramesDelivered());
    timeSource_.Advance(frames, system_time());
}

status_t PlaybackGraph::GetInitialLatency(int64_t* latency) const
{
    if (producer_->Output().destination == MediaDestination::Null())
        return B_MEDIA_NOT_CONNECTED;
    *latency = producer_->DownstreamLatency();
    return B_OK;
}

status_t PlaybackGraph::StartNodes()
{
    if (!roster_ || producer_ == nullptr)
        return B_ERROR;

    int64_t latency = 0;
    producer_->GetLatency(&latency);
    // While playing, buffers are stamped with their event times and late
    // notices are not acted on.
    producer_->SetRunMode(B_RECORDING);
    producer_->SetProducerDelay(latency);

    int64_t initialLatency = 0;
    const status_t initialStatus = GetInitialLatency(&initialLatency);
    if (initialStatus < 0) {
        Diagnostics::Print("Can't get initial latency for audio producer node - Error: %s\n", StatusText(initialStatus));
    }
    initialLatency += producer_->SchedulingLatency();

    const int64_t start = timeSource_.PerformanceTimeFor(DeviceTimeSource::RealTime() + latency + initialLatency);
    const status_t status = producer_->IsLoopRunning() ? producer_->Start(start) : B_MEDIA_BAD_NODE;
    if (status != B_OK) {
        Diagnostics::Print("Can't start the audio producer - Error: %s\n", StatusText(status));
        return status;
    }
    return B_OK;
}

void PlaybackGraph::StopNodes()
{
    if (!roster_ || producer_ == nullptr)
        return;
    if (device_ == 0) {
        producer_->Stop(0, true);
        return;
    }
    // With the device locked no period is being served, so the stop is run
    // here and now: once this returns nothing more is mixed, and the window
    // may reset the play position safely.
    SDL_LockAudioDevice(device_);
    producer_->HandleEvent(MediaEvent{B_STOP, 0}, 0, true);
    SDL_UnlockAudioDevice(device_);
}

void PlaybackGraph::CloseDevice()
{
    if (device_ == 0)
        return;
    SDL_CloseAudioDevice(device_);
    device_ = 0;
    deviceChannels_ = 0;
}

void PlaybackGraph::TearDownNodes()
{
    if (!roster_ || producer_ == nullptr)
        return;

    CloseDevice();
    status_t status = B_MEDIA_NOT_CONNECTED;
    if (!(destination_ == MediaDestination::Null())) {
        producer_->Disconnect(source_, destination_);
        status = B_OK;
    }
    if (status != B_OK)
        Diagnostics::Print("Error disconnecting audio nodes:  %ld (%s)\n", long(status), StatusText(status));

    producerNode_ = -1;
    if (mixerNode_ < 0)
        Diagnostics::Print("Error releasing audio consumer: %s\n", StatusText(B_MEDIA_BAD_NODE));
    mixerNode_ = -1;

    producer_.reset();
    if (share_)
        AudioSystem::Release();
    share_ = false;
    // Let the sound server settle before the window goes on.
    snooze(20000);
}

}  // namespace glimmet
