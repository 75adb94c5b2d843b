#pragma once

#include <SDL.h>

#include <atomic>
#include <filesystem>
#include <memory>
#include <mutex>
#include <thread>

#include "support/Status.h"

namespace glimmet {

class MediaFile;
class MediaTrack;

/// A sound file heard before it is opened: the file's first audio track,
/// decoded by the same reader documents use, played once from its start on
/// an SDL output device of its own. Playing goes on by itself until the end
/// or StopPlaying, and ends when the object does.
///
/// A decoding thread keeps about half a second queued on the device, so a
/// long file is never held in memory. GUI thread only, apart from that
/// thread.
class PreviewSound {
public:
    explicit PreviewSound(const std::filesystem::path& file);
    ~PreviewSound();
    PreviewSound(const PreviewSound&) = delete;
    PreviewSound& operator=(const PreviewSound&) = delete;

    /// B_OK when the file has an audio track and a device could be opened
    /// for it.
    status_t InitCheck() const { return status_; }

    /// Plays from the start; B_NO_INIT for a sound that could not be set up.
    status_t StartPlaying();
    status_t StopPlaying();
    /// True from StartPlaying until the last frame has left the queue or
    /// StopPlaying.
    bool IsPlaying() const;

private:
    status_t OpenTrack(const std::filesystem::path& file);
    status_t OpenDevice();
    void StopFeeding();
    /// The decoding thread: reads the track and queues its frames.
    void Feed();
    /// Queues the track's next frames; false at its end or on an error.
    bool QueueNextFrames();
    /// How many bytes the decoder keeps queued ahead of the device.
    Uint32 QueueLimit() const;

    std::unique_ptr<MediaFile> file_;
    MediaTrack* track_ = nullptr;
    int channels_ = 0;
    int rate_ = 0;
    bool holdsAudio_ = false;
    SDL_AudioDeviceID device_ = 0;
    status_t status_ = B_NO_INIT;
    std::thread feeder_;
    std::atomic<bool> stop_{false};
    std::atomic<bool> feeding_{false};
};

}  // namespace glimmet
