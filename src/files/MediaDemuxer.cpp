#include "files/MediaDemuxer.h"

#include <algorithm>
#include <cerrno>
#include <string>
#include <system_error>
#include <vector>

extern "C" {
#include <libavformat/avformat.h>
#include <libavutil/dict.h>
#include <libavutil/opt.h>
}

#include "files/FFmpegStatus.h"
#include "files/LoadProgress.h"

namespace glimmet {

namespace {

// Limits on what stream probing may decode (video in particular), so that a
// hostile header cannot make the probe allocate more than a few megabytes.
constexpr const char* kProbeMaxPixels = "4194304";
constexpr const char* kProbeMaxSamples = "4194304";
// More streams than any sound file needs; each costs a little memory.
constexpr unsigned kMaxStreams = 256;
// A read that keeps asking to be retried is given up after this many tries.
constexpr int kMaxRetries = 64;

int RefuseNestedOpen(AVFormatContext*, AVIOContext**, const char*, int, AVDictionary**)
{
    return AVERROR(EPERM);
}

status_t CheckIsRegularFile(const std::filesystem::path& path)
{
    std::error_code error;
    const auto status = std::filesystem::status(path, error);
    if (error || !std::filesystem::exists(status))
        return error == std::errc::permission_denied ? B_PERMISSION_DENIED : B_ENTRY_NOT_FOUND;
    if (std::filesystem::is_directory(status))
        return B_IS_A_DIRECTORY;
    if (!std::filesystem::is_regular_file(status))
        return B_BAD_VALUE;
    if (std::filesystem::file_size(path, error) == 0 || error)
        return B_MEDIA_NO_HANDLER;
    return B_OK;
}

}  // namespace

MediaDemuxer::MediaDemuxer(const std::filesystem::path& path)
{
    status_ = Open(path);
}

MediaDemuxer::~MediaDemuxer()
{
    avformat_close_input(&context_);
    avio_closep(&io_);
}

status_t MediaDemuxer::Open(const std::filesystem::path& path)
{
    status_t status = CheckIsRegularFile(path);
    if (status != B_OK)
        return status;

    // The "file:" prefix keeps a name such as "concat:a|b" from being taken
    // for a protocol.
    const std::string url = "file:" + path.string();
    int error = avio_open2(&io_, url.c_str(), AVIO_FLAG_READ, nullptr, nullptr);
    if (error < 0)
        return StatusFromAVError(error);
    LoadProgress::PassStarted();

    context_ = avformat_alloc_context();
    if (context_ == nullptr)
        return B_NO_MEMORY;
    context_->pb = io_;
    context_->io_open = RefuseNestedOpen;
    context_->max_streams = kMaxStreams;
    error = avformat_open_input(&context_, path.c_str(), nullptr, nullptr);
    if (error < 0) {
        // avformat_open_input frees the context on failure.
        context_ = nullptr;
        return error == AVERROR(EPERM) ? B_MEDIA_NO_HANDLER : StatusFromAVError(error);
    }
    return FindStreamInfo();
}

status_t MediaDemuxer::FindStreamInfo()
{
    std::vector<AVDictionary*> options(context_->nb_streams, nullptr);
    for (AVDictionary*& streamOptions : options) {
        av_dict_set(&streamOptions, "threads", "1", 0);
        av_dict_set(&streamOptions, "max_pixels", kProbeMaxPixels, 0);
        av_dict_set(&streamOptions, "max_samples", kProbeMaxSamples, 0);
    }
    const int error = avformat_find_stream_info(context_, options.empty() ? nullptr : options.data());
    for (AVDictionary*& streamOptions : options)
        av_dict_free(&streamOptions);
    // Missing details of some stream are no reason to refuse the file; a
    // track that cannot be decoded says so when it is asked to.
    if (error == AVERROR(ENOMEM))
        return B_NO_MEMORY;
    return B_OK;
}

int32_t MediaDemuxer::CountStreams() const
{
    return context_ == nullptr ? 0 : int32_t(context_->nb_streams);
}

const AVStream* MediaDemuxer::StreamAt(int32_t index) const
{
    if (index < 0 || index >= CountStreams())
        return nullptr;
    return context_->streams[index];
}

const char* MediaDemuxer::FormatName() const
{
    return context_ == nullptr || context_->iformat == nullptr ? "" : context_->iformat->name;
}

int64_t MediaDemuxer::FileSize() const
{
    return io_ == nullptr ? 0 : std::max<int64_t>(0, avio_size(io_));
}

bool MediaDemuxer::SetMaxPacketSize(int bytes)
{
    const std::string name = FormatName();
    if (name != "wav" && name != "w64")
        return false;
    return av_opt_set_int(context_->priv_data, "max_size", bytes, 0) >= 0;
}

void MediaDemuxer::KeepOnlyStream(int32_t index)
{
    for (int32_t i = 0; i < CountStreams(); ++i)
        context_->streams[i]->discard = i == index ? AVDISCARD_DEFAULT : AVDISCARD_ALL;
}

bool MediaDemuxer::ReadPacket(int32_t stream, AVPacket* packet)
{
    if (context_ == nullptr)
        return false;
    int retries = 0;
    for (;;) {
        const int error = av_read_frame(context_, packet);
        if (error == AVERROR(EAGAIN) && ++retries < kMaxRetries)
            continue;
        if (error < 0)
            return false;
        // A load given up on reads as the end of the file, so whatever pass
        // is running ends at once.
        if (!LoadProgress::Report(avio_tell(io_), FileSize())) {
            av_packet_unref(packet);
            return false;
        }
        if (packet->stream_index == stream)
            return true;
        av_packet_unref(packet);
    }
}

}  // namespace glimmet
