#include "files/DocumentLoader.h"

#include <algorithm>
#include <system_error>

#include "files/DecodedBlocks.h"
#include "files/LoadTarget.h"
#include "files/MediaFile.h"
#include "files/MediaFormat.h"
#include "files/MediaTrack.h"
#include "files/MemoryBudget.h"
#include "sound/BlockBuilder.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/Diagnostics.h"
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

/// Bytes of frames frames of channels channels, saturating instead of
/// overflowing for absurd claims.
int64_t BytesOf(int64_t frames, int64_t channels)
{
    const int64_t frameBytes = channels * int64_t(sizeof(int16_t));
    if (frames <= 0 || frameBytes <= 0)
        return 0;
    return frames > INT64_MAX / frameBytes ? INT64_MAX : frames * frameBytes;
}

/// A track whose length was counted before this pass loads as long as that
/// count said, as each channel loaded on its own would: cut, or filled up
/// with shared silence (which costs references, not memory).
BlockList FitToCount(BlockList samples, int64_t counted)
{
    if (counted < 0 || samples.Empty() || samples.Count() == counted)
        return samples;
    BlockBuilder builder;
    builder.AppendRange(samples, 0, counted);
    builder.AppendZeros(counted - samples.Count());
    return builder.Ok() ? builder.Finish() : BlockList();
}

}  // namespace

status_t DocumentLoader::Load(const std::filesystem::path& file, LoadTarget& target)
{
    LoadReport report;
    const status_t status = Load(file, target.DocumentManager(), target.IsAppendOnLoad(), &report);
    if (!report.opened || report.refused)
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
    report->budgetBytes = document != nullptr ? MemoryBudget::ForSamples() : 0;

    Staged staged;
    for (int32_t index = 0; !report->refused; ++index) {
        MediaTrack* track = media.TrackAt(index);
        if (track == nullptr)
            break;
        if (LoadTrack(track, document != nullptr, append, &status, report, &staged))
            report->decodedTracks++;
        media.ReleaseTrack(track);
    }
    if (report->refused) {
        PrintRefusal(report->entry, *report);
        return B_NO_MEMORY;
    }
    // The document changes in one go once every track is in: emptied when
    // an audio track replaced it, then given the staged channels.
    if (report->replacedDocument)
        EmptyDocument(document);
    for (std::unique_ptr<Channel>& channel : staged.channels)
        document->AddChannel(std::move(channel));
    return status;
}

bool DocumentLoader::LoadTrack(MediaTrack* track, bool hasDocument, bool append, status_t* status,
                               LoadReport* report, Staged* staged)
{
    media_format encoded;
    if (track->EncodedFormat(&encoded) != B_OK || !IsAudio(encoded))
        return false;
    if (!hasDocument)
        return false;
    if (!append) {
        // Each audio track replaces what came before it, so only the last
        // one's channels remain.
        staged->channels.clear();
        staged->bytes = 0;
        report->replacedDocument = true;
    }

    media_format decoded = ShortAudioRequest();
    *status = track->DecodedFormat(&decoded);
    if (*status != B_OK)
        return false;
    const int64_t budget = std::max<int64_t>(0, report->budgetBytes - staged->bytes);
    for (std::unique_ptr<Channel>& channel : LoadChannels(track, decoded, budget, report)) {
        if (channel == nullptr)
            continue;
        staged->bytes += BytesOf(channel->FrameCount(), 1);
        staged->channels.push_back(std::move(channel));
    }
    return true;
}

void DocumentLoader::EmptyDocument(ChannelManager* document)
{
    while (document->RemoveChannelAt(0))
        continue;
}

int64_t DocumentLoader::ClaimedFrames(MediaTrack* track)
{
    const int64_t header = track->HeaderFrameCount();
    const int64_t bound = track->FrameCountBound();
    if (header < 0 || bound < 0)
        return header;
    // A header may claim more than the file holds; the file's size cannot
    // lie about what fits in it.
    return std::min(header, bound);
}

std::vector<std::unique_ptr<Channel>> DocumentLoader::LoadChannels(MediaTrack* track, const media_format& decoded,
                                                                    int64_t budgetBytes, LoadReport* report)
{
    LoadReport ignored;
    if (report == nullptr)
        report = &ignored;
    const size_t channelCount = decoded.raw_audio.channel_count;
    std::vector<std::unique_ptr<Channel>> channels(channelCount);
    media_format encoded;
    if (channelCount == 0 || track->EncodedFormat(&encoded) != B_OK || !IsAudio(encoded))
        return channels;
    // A length the header gives is checked before anything is allocated;
    // where it is missing or lies, the decoding itself stops at the budget.
    const int64_t claimed = BytesOf(ClaimedFrames(track), int64_t(channelCount));
    if (claimed > budgetBytes) {
        report->refused = true;
        report->neededBytes = claimed;
        return {};
    }

    DecodedBlocks blocks{int32_t(channelCount)};
    int64_t seekTo = 0;
    track->SeekToFrame(&seekTo, 0);
    int64_t framesRead = 0;
    const int16_t* frames = nullptr;
    while (track->ReadFramesInPlace(&frames, &framesRead) == B_OK) {
        // A block that cannot be had means the samples do not fit either.
        if (!blocks.Append(frames, framesRead) || blocks.Bytes() > budgetBytes) {
            report->refused = true;
            report->neededBytes = -1;
            return {};
        }
    }
    if (blocks.Frames() <= 0)
        return channels;

    // Plain PCM is taken as the file holds it now; other codecs keep a count
    // made before this pass.
    const int64_t counted = track->FrameCountBound() >= 0 ? -1 : track->CountedFrames();
    for (size_t k = 0; k < channelCount; ++k) {
        BlockList samples = FitToCount(blocks.Take(int32_t(k)), counted);
        if (samples.Empty())
            continue;
        channels[k] = std::make_unique<Channel>();
        channels[k]->SetFrameRate(decoded.raw_audio.frame_rate);
        channels[k]->SetPanPosition(k % 2 == 1 ? Channel::kPanRight : Channel::kPanLeft);
        channels[k]->SetTo(std::move(samples));
    }
    return channels;
}

void DocumentLoader::PrintRefusal(const std::filesystem::path& file, const LoadReport& report)
{
    const std::string budget = MemoryBudget::Describe(report.budgetBytes);
    if (report.neededBytes >= 0) {
        Diagnostics::PrintError("cannot open %s: its samples need %s of memory, and only %s can be had\n",
                                file.c_str(), MemoryBudget::Describe(report.neededBytes).c_str(), budget.c_str());
    } else {
        Diagnostics::PrintError("cannot open %s: its samples need more than the %s of memory that can be had\n",
                                file.c_str(), budget.c_str());
    }
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
