#include "files/MediaFile.h"

#include <algorithm>

#include "files/MediaTrack.h"

namespace glimmet {

MediaFile::MediaFile(const std::filesystem::path& path) : path_(path), demuxer_(path) {}

MediaFile::~MediaFile() = default;

int32_t MediaFile::CountTracks() const
{
    return demuxer_.CountStreams();
}

MediaTrack* MediaFile::TrackAt(int32_t index)
{
    if (index < 0 || index >= CountTracks())
        return nullptr;
    tracks_.push_back(std::make_unique<MediaTrack>(path_, index, demuxer_.StreamAt(index)));
    return tracks_.back().get();
}

status_t MediaFile::ReleaseTrack(MediaTrack* track)
{
    auto found = std::find_if(tracks_.begin(), tracks_.end(),
                              [track](const std::unique_ptr<MediaTrack>& owned) { return owned.get() == track; });
    if (found == tracks_.end())
        return B_BAD_VALUE;
    tracks_.erase(found);
    return B_OK;
}

}  // namespace glimmet
