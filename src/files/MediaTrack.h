#pragma once

#include <cstdint>
#include <filesystem>
#include <memory>
#include <string>

#include "files/MediaFormat.h"
#include "support/Status.h"

struct AVStream;

namespace glimmet {

class TrackDecoder;

/// One stream of a media file. Audio streams decode to interleaved signed
/// 16-bit frames at the stream's own rate and channel count; other streams
/// only describe themselves.
///
/// Made by MediaFile::TrackAt and owned by the file. Used by one thread at a
/// time.
class MediaTrack {
public:
    /// Frames one ReadFrames call delivers at most.
    static constexpr int64_t kFramesPerBuffer = 4096;

    MediaTrack(std::filesystem::path path, int32_t index, const AVStream* stream);
    ~MediaTrack();
    MediaTrack(const MediaTrack&) = delete;
    MediaTrack& operator=(const MediaTrack&) = delete;

    /// B_OK for a stream that exists.
    status_t InitCheck() const { return status_; }

    /// Raw audio for plain PCM, encoded audio for other audio codecs, raw or
    /// encoded video, or an unknown type for anything else.
    status_t EncodedFormat(media_format* format) const;

    /// Negotiates the decoded format. The request must be raw audio (or a
    /// zeroed format) whose sample format is signed 16-bit or any, and whose
    /// rate and channel count, where given, are the track's own. On success
    /// format is filled in completely; B_MEDIA_BAD_FORMAT otherwise.
    status_t DecodedFormat(media_format* format);

    /// The exact number of frames the track decodes to; 0 when it cannot be
    /// decoded. Counting may decode the whole track once; the result is kept.
    int64_t CountFrames();

    /// What CountFrames found, without counting: -1 until it was called.
    int64_t CountedFrames() const { return frameCount_; }

    /// At least as many frames as the track decodes to, known without
    /// decoding (plain PCM in a simple container: the file's size over the
    /// frame size); -1 when there is no such bound. Needs a DecodedFormat.
    int64_t FrameCountBound();

    /// The length the container's header gives, in frames at the track's
    /// own rate; -1 when it gives none. Known without decoding, and only a
    /// claim: the stream may hold more or fewer frames.
    int64_t HeaderFrameCount() const { return headerFrames_; }

    /// Starts reading again at *frame (0 for the start). The next ReadFrames
    /// decodes from the start of the file and skips the frames before it.
    status_t SeekToFrame(int64_t* frame, int32_t flags = 0);

    /// Decodes the next frames into buffer, which must hold the decoded
    /// format's buffer_size bytes; *frameCount is how many came. B_OK while
    /// there are frames, B_LAST_BUFFER_ERROR at the end, B_NO_INIT before a
    /// DecodedFormat was agreed on, another code when decoding fails.
    status_t ReadFrames(void* buffer, int64_t* frameCount);

    /// ReadFrames without the copy: *frames points into the track's own
    /// buffer, valid until the next read, seek or release.
    status_t ReadFramesInPlace(const int16_t** frames, int64_t* frameCount);

private:
    bool IsAudio() const;
    status_t EnsurePass();
    status_t StartPass();
    status_t SkipFrames(int64_t count);

    std::filesystem::path path_;
    int32_t index_;
    status_t status_ = B_NO_INIT;
    media_format encoded_;
    bool decoderAvailable_ = false;
    int32_t decodedChannels_ = 0;  // 0 until DecodedFormat succeeded
    int64_t frameCount_ = -1;      // -1 until counted
    int64_t headerFrames_ = -1;
    int64_t skipFrames_ = 0;
    std::unique_ptr<TrackDecoder> pass_;
};

}  // namespace glimmet
