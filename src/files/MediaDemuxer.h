#pragma once

#include <cstdint>
#include <filesystem>

#include "support/Status.h"

struct AVFormatContext;
struct AVIOContext;
struct AVPacket;
struct AVStream;

namespace glimmet {

/// One open container file, read packet by packet.
///
/// The file is opened through our own file-only I/O context, and the
/// demuxer may not open any other file or URL (playlists and concatenation
/// lists are refused), so a sound file can never make us read elsewhere.
/// Devices, pipes and directories are refused before FFmpeg sees them.
class MediaDemuxer {
public:
    explicit MediaDemuxer(const std::filesystem::path& path);
    ~MediaDemuxer();
    MediaDemuxer(const MediaDemuxer&) = delete;
    MediaDemuxer& operator=(const MediaDemuxer&) = delete;

    /// B_OK when the file is open, else why not (B_ENTRY_NOT_FOUND,
    /// B_IS_A_DIRECTORY, B_MEDIA_NO_HANDLER for unknown or empty files...).
    status_t InitCheck() const { return status_; }

    int32_t CountStreams() const;
    /// Null when index is out of range or the file is not open.
    const AVStream* StreamAt(int32_t index) const;

    /// The container format's short name ("wav", "matroska,webm"); empty
    /// when the file is not open.
    const char* FormatName() const;
    /// The file's size in bytes; 0 when unknown.
    int64_t FileSize() const;

    /// Asks for packets of at most bytes bytes (a whole number of the
    /// stream's blocks) from a container that lets the reader choose (WAV and
    /// Wave64 give 4096 bytes by default). False, changing nothing, for any
    /// other container.
    bool SetMaxPacketSize(int bytes);

    /// Makes the demuxer drop the packets of every stream but this one.
    void KeepOnlyStream(int32_t index);

    /// The next packet of the given stream into packet (which the caller
    /// unreferences). False at the end of the file and on a read error; like
    /// FFmpeg's own tools, a read error ends the stream.
    bool ReadPacket(int32_t stream, AVPacket* packet);

private:
    status_t Open(const std::filesystem::path& path);
    status_t FindStreamInfo();

    AVFormatContext* context_ = nullptr;
    AVIOContext* io_ = nullptr;
    status_t status_ = B_NO_INIT;
};

}  // namespace glimmet
