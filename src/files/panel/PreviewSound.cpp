#include "files/panel/PreviewSound.h"

#include <chrono>
#include <vector>

#include "files/MediaFile.h"
#include "files/MediaFormat.h"
#include "files/MediaTrack.h"
#include "playback/AudioSystem.h"

namespace glimmet {

namespace {

// How far ahead of the device the decoder keeps, and how long it naps when
// it is that far ahead.
constexpr double kQueueSeconds = 0.5;
constexpr std::chrono::milliseconds kNap(10);
constexpr int kMaxPrefillReads = 512;

}  // namespace

PreviewSound::PreviewSound(const std::filesystem::path& file)
{
    status_ = OpenTrack(file);
    if (status_ == B_OK)
        status_ = OpenDevice();
}

PreviewSound::~PreviewSound()
{
    StopFeeding();
    if (device_ != 0)
        SDL_CloseAudioDevice(device_);
    if (holdsAudio_)
        AudioSystem::Release();
}

status_t PreviewSound::OpenTrack(const std::filesystem::path& file)
{
    file_ = std::make_unique<MediaFile>(file);
    if (file_->InitCheck() != B_OK)
        return file_->InitCheck();
    for (int32_t i = 0; i < file_->CountTracks(); i++) {
        MediaTrack* track = file_->TrackAt(i);
        media_format encoded;
        if (track == nullptr || track->EncodedFormat(&encoded) != B_OK
            || (encoded.type != B_MEDIA_RAW_AUDIO && encoded.type != B_MEDIA_ENCODED_AUDIO))
            continue;
        media_format decoded;
        decoded.type = B_MEDIA_RAW_AUDIO;
        decoded.raw_audio = media_raw_audio_format::wildcard;
        decoded.raw_audio.format = B_AUDIO_SHORT;
        if (track->DecodedFormat(&decoded) != B_OK || decoded.raw_audio.channel_count == 0)
            continue;
        track_ = track;
        channels_ = int(decoded.raw_audio.channel_count);
        rate_ = int(decoded.raw_audio.frame_rate);
        return B_OK;
    }
    return B_MEDIA_BAD_FORMAT;
}

status_t PreviewSound::OpenDevice()
{
    holdsAudio_ = AudioSystem::Acquire();
    if (!holdsAudio_)
        return B_MEDIA_SYSTEM_FAILURE;
    SDL_AudioSpec wanted{};
    wanted.freq = rate_;
    wanted.format = AUDIO_S16SYS;
    wanted.channels = Uint8(channels_);
    wanted.samples = 2048;
    // No callback: the device plays what the decoder queues.
    SDL_AudioSpec obtained{};
    device_ = SDL_OpenAudioDevice(nullptr, 0, &wanted, &obtained, 0);
    return device_ != 0 ? B_OK : B_MEDIA_SYSTEM_FAILURE;
}

status_t PreviewSound::StartPlaying()
{
    if (status_ != B_OK)
        return B_NO_INIT;
    StopFeeding();
    SDL_ClearQueuedAudio(device_);
    int64_t start = 0;
    track_->SeekToFrame(&start);
    stop_ = false;
    feeding_ = true;
    // The first half second is queued before the device starts, so the
    // start never underruns, however slow the decoder is to get going; a
    // short sound is then whole in the queue.
    // Bounded, so a track that keeps giving empty reads cannot hold the
    // panel.
    for (int reads = 0; reads < kMaxPrefillReads && SDL_GetQueuedAudioSize(device_) <= QueueLimit(); reads++) {
        if (!QueueNextFrames()) {
            feeding_ = false;
            break;
        }
    }
    if (feeding_)
        feeder_ = std::thread([this] { Feed(); });
    SDL_PauseAudioDevice(device_, 0);
    return B_OK;
}

status_t PreviewSound::StopPlaying()
{
    if (status_ != B_OK)
        return B_NO_INIT;
    StopFeeding();
    SDL_PauseAudioDevice(device_, 1);
    SDL_ClearQueuedAudio(device_);
    return B_OK;
}

bool PreviewSound::IsPlaying() const
{
    if (status_ != B_OK)
        return false;
    return feeding_ || SDL_GetQueuedAudioSize(device_) > 0;
}

void PreviewSound::StopFeeding()
{
    stop_ = true;
    if (feeder_.joinable())
        feeder_.join();
    feeding_ = false;
}

Uint32 PreviewSound::QueueLimit() const
{
    const Uint32 bytesPerSecond = Uint32(rate_) * Uint32(channels_) * sizeof(int16_t);
    return Uint32(kQueueSeconds * bytesPerSecond);
}

bool PreviewSound::QueueNextFrames()
{
    const int16_t* frames = nullptr;
    int64_t count = 0;
    if (track_->ReadFramesInPlace(&frames, &count) != B_OK)
        return false;
    if (count > 0)
        SDL_QueueAudio(device_, frames, Uint32(count) * Uint32(channels_) * sizeof(int16_t));
    return true;
}

void PreviewSound::Feed()
{
    while (!stop_) {
        if (SDL_GetQueuedAudioSize(device_) > QueueLimit()) {
            std::this_thread::sleep_for(kNap);
            continue;
        }
        if (!QueueNextFrames())
            break;
    }
    feeding_ = false;
}

}  // namespace glimmet
