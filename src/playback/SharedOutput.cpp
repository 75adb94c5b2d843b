#include "playback/SharedOutput.h"

#include <SDL.h>

#include <algorithm>
#include <cmath>
#include <cstring>

#include "playback/AudioProducer.h"
#include "playback/DeviceTimeSource.h"
#include "support/Diagnostics.h"
#include "support/SystemTime.h"

namespace glimmet {

namespace {

// What a producer writes per frame: it always mixes to stereo.
constexpr size_t kProducerChannels = 2;

long Hertz(const MediaFormat& format)
{
    return std::lround(format.frameRate);
}

}  // namespace

SharedOutput& SharedOutput::Instance()
{
    static SharedOutput output;
    return output;
}

SharedOutput::~SharedOutput()
{
    std::lock_guard guard(mutex_);
    if (device_ != 0)
        Close();
}

int64_t SharedOutput::PeriodFrames(const MediaFormat& format)
{
    if (format.channelCount == 0 || format.channelCount > kMaxChannels)
        return 0;
    const int64_t frames = int64_t(format.bufferSize) / 4 / format.channelCount;
    if (frames < 1 || frames > kMaxPeriodFrames || Hertz(format) < 1)
        return 0;
    return frames;
}

status_t SharedOutput::Join(const MediaFormat& format)
{
    std::lock_guard guard(mutex_);
    if (places_ == 0) {
        const status_t status = Open(format);
        if (status != B_OK)
            return status;
    } else if (!Accepts(format)) {
        Diagnostics::Print("The sound output plays %ld Hz, %u channels in %u-byte buffers; "
                           "%ld Hz, %u channels in %u-byte buffers cannot join it\n",
            Hertz(format_), format_.channelCount, format_.bufferSize, Hertz(format), format.channelCount,
            format.bufferSize);
        return B_MEDIA_ALREADY_CONNECTED;
    }
    ++places_;
    return B_OK;
}

void SharedOutput::Leave()
{
    std::lock_guard guard(mutex_);
    if (places_ == 0)
        return;
    if (--places_ == 0)
        Close();
}

// Mixing different rates or periods would need resampling and re-blocking;
// since every producer negotiates the same format, only that one joins.
bool SharedOutput::Accepts(const MediaFormat& format) const
{
    return format.frameRate == format_.frameRate && format.channelCount == format_.channelCount
        && format.bufferSize == format_.bufferSize && format.sampleFormat == format_.sampleFormat;
}

status_t SharedOutput::Open(const MediaFormat& format)
{
    const int64_t frames = PeriodFrames(format);
    if (frames == 0) {
        SDL_SetError("the format cannot be played");
        return B_MEDIA_BAD_FORMAT;
    }
    SDL_AudioSpec wanted;
    SDL_zero(wanted);
    wanted.freq = int(Hertz(format));
    wanted.format = AUDIO_F32SYS;
    wanted.channels = Uint8(format.channelCount);
    wanted.samples = Uint16(frames);
    wanted.callback = &SharedOutput::DeviceCallback;
    wanted.userdata = this;
    SDL_AudioSpec obtained;
    SDL_zero(obtained);
    // Set before SDL starts the audio thread, which reads them. No changes
    // are allowed, so SDL converts and re-blocks to exactly this layout and
    // each callback is one producer buffer.
    periodFrames_ = int32_t(frames);
    channels_ = int(format.channelCount);
    device_ = SDL_OpenAudioDevice(nullptr, 0, &wanted, &obtained, 0);
    if (device_ == 0) {
        periodFrames_ = 0;
        channels_ = 0;
        return B_MEDIA_SYSTEM_FAILURE;
    }
    format_ = format;
    driverName_ = SDL_GetCurrentAudioDriver() ? SDL_GetCurrentAudioDriver() : "";
    return B_OK;
}

void SharedOutput::Close()
{
    // Joins SDL's audio thread: nothing is served after this.
    SDL_CloseAudioDevice(device_);
    device_ = 0;
    members_.clear();
    format_ = MediaFormat();
    driverName_.clear();
    periodFrames_ = 0;
    channels_ = 0;
}

void SharedOutput::Attach(AudioProducer* producer, DeviceTimeSource* timeSource)
{
    std::lock_guard guard(mutex_);
    if (device_ == 0)
        return;
    // The scratch is allocated here, on the window thread, so that the
    // audio thread never has to.
    Member member{producer, timeSource, std::vector<float>(size_t(periodFrames_) * kProducerChannels)};
    SDL_LockAudioDevice(device_);
    members_.push_back(std::move(member));
    SDL_UnlockAudioDevice(device_);
    SDL_PauseAudioDevice(device_, 0);
}

void SharedOutput::Detach(AudioProducer* producer)
{
    std::lock_guard guard(mutex_);
    if (device_ == 0)
        return;
    std::vector<float> released;  // freed after the device runs again
    SDL_LockAudioDevice(device_);
    const auto found = std::find_if(
        members_.begin(), members_.end(), [producer](const Member& member) { return member.producer == producer; });
    if (found != members_.end()) {
        released.swap(found->scratch);
        members_.erase(found);
    }
    SDL_UnlockAudioDevice(device_);
}

SDL_AudioDeviceID SharedOutput::Device() const
{
    std::lock_guard guard(mutex_);
    return device_;
}

std::string SharedOutput::DriverName() const
{
    std::lock_guard guard(mutex_);
    return driverName_;
}

int SharedOutput::Places() const
{
    std::lock_guard guard(mutex_);
    return places_;
}

int SharedOutput::AttachedProducers() const
{
    std::lock_guard guard(mutex_);
    return int(members_.size());
}

void SharedOutput::DeviceCallback(void* userdata, Uint8* stream, int length)
{
    auto* output = static_cast<SharedOutput*>(userdata);
    const int frameBytes = output->channels_ * int(sizeof(float));
    // The producers write stereo; a device in any other layout plays
    // silence, as does one that nobody is attached to.
    if (output->members_.empty() || output->channels_ != int(kProducerChannels)) {
        std::memset(stream, 0, size_t(length));
        return;
    }
    output->Serve(reinterpret_cast<float*>(stream), length / frameBytes);
}

// Runs on SDL's audio thread with the device locked, so the members stay
// as they are until it returns.
void SharedOutput::Serve(float* out, int32_t frames)
{
    // SDL hands over exactly one period; should it ever hand over more, the
    // scratch buffers still take it a period at a time.
    for (int32_t done = 0; done < frames; done += periodFrames_)
        ServePeriod(out + size_t(done) * kProducerChannels, std::min(periodFrames_, frames - done));
}

void SharedOutput::ServePeriod(float* out, int32_t frames)
{
    for (Member& member : members_) {
        member.producer->ServeDevice(member.scratch.data(), frames, member.timeSource->FramesDelivered());
        member.timeSource->Advance(frames, system_time());
    }
    Sum(out, size_t(frames) * kProducerChannels);
}

// The first producer is copied rather than added to zero, so a lone
// producer's samples arrive untouched (negative zeros included); only a sum
// of several is a mix that needs the clip, and a lone one skips that pass.
void SharedOutput::Sum(float* out, size_t count) const
{
    std::copy_n(members_.front().scratch.data(), count, out);
    if (members_.size() == 1)
        return;
    for (size_t m = 1; m < members_.size(); m++) {
        const float* in = members_[m].scratch.data();
        for (size_t i = 0; i < count; i++)
            out[i] += in[i];
    }
    for (size_t i = 0; i < count; i++)
        out[i] = std::clamp(out[i], -1.0f, 1.0f);
}

}  // namespace glimmet
