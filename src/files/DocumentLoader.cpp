#include "files/DocumentLoader.h"

#include <algorithm>
#include <system_error>

#include "files/FrameSpreader.h"
#include "files/LoadTarget.h"
#include "files/MediaFile.h"
#include "files/MediaFormat.h"
#include "files/MediaTrack.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/SampleAllocator.h"
#include "support/MessageCodes.h"

namespace glimmet {

namespace {

constexpr const char* kTitlePrefix = "Glimmet - ";

bool IsAudio(const media_format& format)
{
    return format.type == B_MEDIA_RAW_AUDIO || format.type == B_MEDIA_ENCODED_AUDIO;
}

media_format ShortAudioRequest()
{
    media_format request;
    request.type = B_MEDIA_RAW_AUDIO;
    request.raw_audio = media_raw_audio_format::wildcard;
    request.raw_audio.format = B_AUDIO_SHORT;
    return request;
}

using SampleArray = SampleAllocator::Array;

/// Arrays come from the allocator channels use, so that the first edit after
/// a load can reuse the block it frees, and a long array is faulted in with
/// one call rather than page by page while it is filled.
SampleArray AllocateSamples(int64_t count)
{
    if (count <= 0)
        return nullptr;
    return Channel::Allocate(count);
}

/// Copies frames interleaved frames of channels samples into the arrays
/// (null entries are skipped) from index at on.
void SpreadFrames(const int16_t* interleaved, int64_t frames, std::vector<SampleArray>& arrays, int64_t at)
{
    const size_t channels = arrays.size();
    if (channels == 1) {
        if (arrays[0] != nullptr)
            FrameSpreader::SpreadMono(interleaved, frames, arrays[0].get() + at);
        return;
    }
    if (channels == 2) {
        int16_t* left = arrays[0] == nullptr ? nullptr : arrays[0].get() + at;
        int16_t* right = arrays[1] == nullptr ? nullptr : arrays[1].get() + at;
        FrameSpreader::SpreadStereo(interleaved, frames, left, right);
        return;
    }
    for (size_t k = 0; k < channels; ++k) {
        int16_t* to = arrays[k].get();
        if (to == nullptr)
            continue;
        for (int64_t frame = 0; frame < frames; ++frame)
            to[at + frame] = interleaved[size_t(frame) * channels + k];
    }
}

/// Reads the whole track once and spreads its interleaved frames over the
/// arrays, at most capacity frames; returns how many frames it stored.
int64_t Deinterleave(MediaTrack* track, int64_t capacity, std::vector<SampleArray>& arrays)
{
    int64_t seekTo = 0;
    track->SeekToFrame(&seekTo, 0);
    int64_t stored = 0;
    int64_t framesRead = 0;
    const int16_t* block = nullptr;
    while (stored < capacity && track->ReadFramesInPlace(&block, &framesRead) == B_OK) {
        const int64_t frames = std::min(framesRead, capacity - stored);
        SpreadFrames(block, frames, arrays, stored);
        stored += frames;
    }
    FrameSpreader::Finish();
    return stored;
}

}  // namespace

status_t DocumentLoader::Load(const std::filesystem::path& file, LoadTarget& target)
{
    LoadReport report;
    const status_t status = Load(file, target.DocumentManager(), target.IsAppendOnLoad(), &report);
    if (!report.opened)
        return status;
    if (report.replacedDocument)
        target.DocumentReplaced();
    target.ReplaceFileEntry(report.entry);
    const std::string name = report.entry.filename().string();
    if (!target.IsAppendOnLoad() && !name.empty())
        target.SetWindowTitle(kTitlePrefix + name);
    for (int32_t track = 0; track < report.decodedTracks; ++track)
        target.PostToSelf(kMsgShowAll);
    return status;
}

status_t DocumentLoader::Load(const std::filesystem::path& file, ChannelManager* document, bool append,
                              LoadReport* report)
{
    LoadReport ignored;
    if (report == nullptr)
        report = &ignored;
    MediaFile media(file);
    status_t status = media.InitCheck();
    if (status != B_OK)
        return status;
    report->opened = true;
    report->entry = FollowLinks(file);

    for (int32_t index = 0;; ++index) {
        MediaTrack* track = media.TrackAt(index);
        if (track == nullptr)
            break;
        if (LoadTrack(track, document, append, &status, report))
            report->decodedTracks++;
        media.ReleaseTrack(track);
    }
    return status;
}

bool DocumentLoader::LoadTrack(MediaTrack* track, ChannelManager* document, bool append, status_t* status,
                               LoadReport* report)
{
    media_format encoded;
    if (track->EncodedFormat(&encoded) != B_OK || !IsAudio(encoded))
        return false;
    if (document == nullptr)
        return false;
    if (!append) {
        EmptyDocument(document);
        report->replacedDocument = true;
    }

    media_format decoded = ShortAudioRequest();
    *status = track->DecodedFormat(&decoded);
    if (*status != B_OK)
        return false;
    for (std::unique_ptr<Channel>& channel : LoadChannels(track, decoded)) {
        if (channel != nullptr)
            document->AddChannel(std::move(channel));
    }
    return true;
}

void DocumentLoader::EmptyDocument(ChannelManager* document)
{
    while (document->RemoveChannelAt(0))
        continue;
}

std::vector<std::unique_ptr<Channel>> DocumentLoader::LoadChannels(MediaTrack* track, const media_format& decoded)
{
    const size_t channelCount = decoded.raw_audio.channel_count;
    std::vector<std::unique_ptr<Channel>> channels(channelCount);
    media_format encoded;
    if (channelCount == 0 || track->EncodedFormat(&encoded) != B_OK || !IsAudio(encoded))
        return channels;
    // Where the file's size bounds the length, arrays of that bound are
    // filled in one pass and the count is what came; otherwise the exact
    // count comes first (which may cost a decoding pass of its own).
    const int64_t bound = track->FrameCountBound();
    const int64_t capacity = bound >= 0 ? bound : track->CountFrames();
    if (capacity <= 0)
        return channels;

    std::vector<SampleArray> arrays(channelCount);
    for (size_t k = 0; k < channelCount; ++k)
        arrays[k] = AllocateSamples(capacity);
    const int64_t stored = Deinterleave(track, capacity, arrays);
    const int64_t count = bound >= 0 ? stored : capacity;
    if (count <= 0)
        return channels;
    // A decode that came up short of the exact count leaves silence.
    for (auto& array : arrays) {
        if (array != nullptr)
            std::fill(array.get() + stored, array.get() + count, int16_t(0));
    }

    for (size_t k = 0; k < channelCount; ++k) {
        if (arrays[k] == nullptr)
            continue;
        channels[k] = std::make_unique<Channel>();
        channels[k]->SetFrameRate(decoded.raw_audio.frame_rate);
        channels[k]->SetPanPosition(k % 2 == 1 ? Channel::kPanRight : Channel::kPanLeft);
        channels[k]->SetTo(std::move(arrays[k]), count);
    }
    return channels;
}

std::filesystem::path DocumentLoader::FollowLinks(const std::filesystem::path& file)
{
    std::error_code error;
    std::filesystem::path resolved = std::filesystem::canonical(file, error);
    if (!error)
        return resolved;
    resolved = std::filesystem::absolute(file, error);
    return error ? file : resolved;
}

}  // namespace glimmet
