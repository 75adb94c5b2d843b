#include "playback/PlaybackGraph.h"

#include <SDL.h>

#include <atomic>
#include <cmath>

#include "playback/AudioProducer.h"
#include "playback/AudioSystem.h"
#include "playback/SharedOutput.h"
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

PlaybackGraph::PlaybackGraph(ChannelManager* manager, MessageTarget* window)
    : manager_(manager), window_(window), output_(&SharedOutput::Instance())
{
}

PlaybackGraph::~PlaybackGraph()
{
    LeaveOutput();
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
            status = JoinOutput(format);
            // An output already playing another format is no driver's fault.
            if (status != B_OK && status != B_MEDIA_ALREADY_CONNECTED && !fellBack) {
                fellBack = true;
                if (FallBack())
                    status = JoinOutput(format);
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
    // Connected: from the next period on the output serves the producer.
    output_->Attach(producer_.get(), &timeSource_);
    return B_OK;
}

bool PlaybackGraph::FallBack()
{
    Diagnostics::Print("No sound device could be opened (%s); playing through SDL's %s driver\n", SDL_GetError(),
        fallbackDriver_.c_str());
    return AudioSystem::SwitchDriver(fallbackDriver_.c_str(), share_, &share_);
}

status_t PlaybackGraph::JoinOutput(const MediaFormat& format)
{
    const status_t status = output_->Join(format);
    if (status != B_OK)
        return status;
    device_ = output_->Device();
    driverName_ = output_->DriverName();
    // The clock starts now; it runs once the producer is attached.
    const long rate = std::lround(format.frameRate);
    timeSource_.Reset(float(rate));
    // What lies downstream of the producer is one device period.
    producer_->SetBufferDuration(SharedOutput::PeriodFrames(format) * 1000000 / rate);
    return B_OK;
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
    // With the shared device locked no period is being served, so the stop
    // is run here and now: once this returns nothing more is mixed for this
    // window, and it may reset the play position safely. Other windows'
    // producers wait for at most this one event.
    SDL_LockAudioDevice(device_);
    producer_->HandleEvent(MediaEvent{B_STOP, 0}, 0, true);
    SDL_UnlockAudioDevice(device_);
}

void PlaybackGraph::LeaveOutput()
{
    if (device_ == 0)
        return;
    output_->Detach(producer_.get());
    output_->Leave();
    device_ = 0;
}

void PlaybackGraph::TearDownNodes()
{
    if (!roster_ || producer_ == nullptr)
        return;

    LeaveOutput();
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
