#pragma once

#include <cstdint>
#include <filesystem>
#include <memory>
#include <vector>

#include "files/MediaDemuxer.h"
#include "support/Status.h"

namespace glimmet {

class MediaTrack;

/// A media file opened for reading: its streams, in container order, as
/// tracks. Tracks are made on demand by TrackAt and stay owned by the file
/// until ReleaseTrack or the file's end.
class MediaFile {
public:
    explicit MediaFile(const std::filesystem::path& path);
    ~MediaFile();
    MediaFile(const MediaFile&) = delete;
    MediaFile& operator=(const MediaFile&) = delete;

    /// B_OK when the file could be opened and recognised; otherwise
    /// B_ENTRY_NOT_FOUND, B_IS_A_DIRECTORY, B_PERMISSION_DENIED, B_BAD_VALUE
    /// (not a regular file), B_MEDIA_NO_HANDLER (unknown or empty) and the like.
    status_t InitCheck() const { return demuxer_.InitCheck(); }

    int32_t CountTracks() const;
    /// The track of stream index; null past the last stream or when the file
    /// is not open.
    MediaTrack* TrackAt(int32_t index);
    /// Deletes a track made by TrackAt; B_BAD_VALUE for anything else.
    status_t ReleaseTrack(MediaTrack* track);

private:
    std::filesystem::path path_;
    MediaDemuxer demuxer_;
    std::vector<std::unique_ptr<MediaTrack>> tracks_;
};

}  // namespace glimmet
