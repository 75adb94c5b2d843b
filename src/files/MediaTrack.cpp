#include "files/MediaTrack.h"

#include <algorithm>
#include <vector>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
}

#include "files/TrackDecoder.h"

namespace glimmet {

namespace {

bool IsPCMCodec(AVCodecID id)
{
    // FFmpeg numbers its plain and packed PCM codecs in one block, right
    // before the ADPCM ones.
    return id >= AV_CODEC_ID_FIRST_AUDIO && id < AV_CODEC_ID_ADPCM_IMA_QT;
}

uint32_t SampleFormatOf(AVCodecID id)
{
    switch (av_get_exact_bits_per_sample(id)) {
        case 8: return id == AV_CODEC_ID_PCM_U8 ? uint32_t(B_AUDIO_UCHAR) : uint32_t(B_AUDIO_CHAR);
        case 16: return B_AUDIO_SHORT;
        case 32:
            return id == AV_CODEC_ID_PCM_F32LE || id == AV_CODEC_ID_PCM_F32BE ? uint32_t(B_AUDIO_FLOAT)
                                                                               : uint32_t(B_AUDIO_INT);
        default: return B_AUDIO_FORMAT_ANY;
    }
}

media_format DescribeStream(const AVStream* stream)
{
    media_format format;
    const AVCodecParameters* parameters = stream->codecpar;
    format.codec_name = avcodec_get_name(parameters->codec_id);
    switch (parameters->codec_type) {
        case AVMEDIA_TYPE_AUDIO:
            format.type = IsPCMCodec(parameters->codec_id) ? B_MEDIA_RAW_AUDIO : B_MEDIA_ENCODED_AUDIO;
            format.raw_audio.frame_rate = float(parameters->sample_rate);
            format.raw_audio.channel_count = uint32_t(std::max(0, parameters->ch_layout.nb_channels));
            format.raw_audio.format = SampleFormatOf(parameters->codec_id);
            break;
        case AVMEDIA_TYPE_VIDEO:
            format.type = parameters->codec_id == AV_CODEC_ID_RAWVIDEO ? B_MEDIA_RAW_VIDEO : B_MEDIA_ENCODED_VIDEO;
            break;
        default:
            format.type = B_MEDIA_UNKNOWN_TYPE;
            break;
    }
    return format;
}

/// The stream's duration in frames of its own rate, computed in floating
/// point so that no header value can overflow it; -1 when unknown.
int64_t HeaderFramesOf(const AVStream* stream)
{
    const int rate = stream->codecpar->sample_rate;
    if (stream->duration == AV_NOPTS_VALUE || stream->duration <= 0 || rate <= 0 || stream->time_base.num <= 0
        || stream->time_base.den <= 0)
        return -1;
    const long double frames = (long double)stream->duration * stream->time_base.num * rate / stream->time_base.den;
    return frames >= (long double)INT64_MAX ? INT64_MAX : int64_t(frames);
}

}  // namespace

MediaTrack::MediaTrack(std::filesystem::path path, int32_t index, const AVStream* stream)
    : path_(std::move(path)), index_(index)
{
    if (stream == nullptr)
        return;
    encoded_ = DescribeStream(stream);
    if (IsAudio())
        headerFrames_ = HeaderFramesOf(stream);
    decoderAvailable_ = avcodec_find_decoder(stream->codecpar->codec_id) != nullptr;
    status_ = B_OK;
}

MediaTrack::~MediaTrack() = default;

bool MediaTrack::IsAudio() const
{
    return encoded_.type == B_MEDIA_RAW_AUDIO || encoded_.type == B_MEDIA_ENCODED_AUDIO;
}

status_t MediaTrack::EncodedFormat(media_format* format) const
{
    if (format == nullptr)
        return B_BAD_VALUE;
    if (status_ != B_OK)
        return status_;
    *format = encoded_;
    return B_OK;
}

status_t MediaTrack::DecodedFormat(media_format* format)
{
    if (format == nullptr)
        return B_BAD_VALUE;
    if (status_ != B_OK)
        return status_;
    if (!IsAudio())
        return B_MEDIA_BAD_FORMAT;
    if (!decoderAvailable_)
        return B_MEDIA_NO_HANDLER;
    const media_raw_audio_format& own = encoded_.raw_audio;
    const media_raw_audio_format& asked = format->raw_audio;
    const bool typeFits = format->type == B_MEDIA_RAW_AUDIO || format->type == B_MEDIA_UNKNOWN_TYPE;
    const bool sampleFits = asked.format == B_AUDIO_FORMAT_ANY || asked.format == B_AUDIO_SHORT;
    const bool rateFits = asked.frame_rate == 0 || asked.frame_rate == own.frame_rate;
    const bool channelsFit = asked.channel_count == 0 || asked.channel_count == own.channel_count;
    const bool trackUsable = own.frame_rate > 0 && own.channel_count >= 1
        && own.channel_count <= uint32_t(TrackDecoder::kMaxChannels);
    if (!typeFits || !sampleFits || !rateFits || !channelsFit || !trackUsable)
        return B_MEDIA_BAD_FORMAT;

    format->type = B_MEDIA_RAW_AUDIO;
    format->raw_audio.frame_rate = own.frame_rate;
    format->raw_audio.channel_count = own.channel_count;
    format->raw_audio.format = B_AUDIO_SHORT;
    format->raw_audio.byte_order = B_MEDIA_LITTLE_ENDIAN;
    format->raw_audio.buffer_size = size_t(kFramesPerBuffer) * own.channel_count * sizeof(int16_t);
    format->codec_name = encoded_.codec_name;
    decodedChannels_ = int32_t(own.channel_count);
    return B_OK;
}

int64_t MediaTrack::CountFrames()
{
    if (frameCount_ >= 0)
        return frameCount_;
    frameCount_ = 0;
    const uint32_t channels = encoded_.raw_audio.channel_count;
    if (status_ != B_OK || !IsAudio() || !decoderAvailable_ || channels < 1
        || channels > uint32_t(TrackDecoder::kMaxChannels))
        return frameCount_;
    TrackDecoder counter(path_, index_, int32_t(channels));
    frameCount_ = counter.CountRemainingFrames();
    return frameCount_;
}

int64_t MediaTrack::FrameCountBound()
{
    return EnsurePass() == B_OK ? pass_->FrameCountBound() : -1;
}

status_t MediaTrack::SeekToFrame(int64_t* frame, int32_t /*flags*/)
{
    if (frame == nullptr || *frame < 0)
        return B_BAD_VALUE;
    if (status_ != B_OK)
        return status_;
    pass_.reset();
    skipFrames_ = *frame;
    return B_OK;
}

status_t MediaTrack::StartPass()
{
    pass_ = std::make_unique<TrackDecoder>(path_, index_, decodedChannels_);
    const status_t status = pass_->InitCheck();
    if (status != B_OK)
        return status;
    const int64_t skip = skipFrames_;
    skipFrames_ = 0;
    return SkipFrames(skip);
}

status_t MediaTrack::SkipFrames(int64_t count)
{
    std::vector<int16_t> scratch;
    if (count > 0)
        scratch.resize(size_t(kFramesPerBuffer) * size_t(decodedChannels_));
    while (count > 0) {
        int64_t frames = 0;
        const status_t status = pass_->Read(scratch.data(), std::min(count, kFramesPerBuffer), &frames);
        if (status != B_OK)
            return status == B_LAST_BUFFER_ERROR ? B_OK : status;
        count -= frames;
    }
    return B_OK;
}

status_t MediaTrack::EnsurePass()
{
    if (status_ != B_OK)
        return status_;
    if (decodedChannels_ == 0)
        return B_NO_INIT;
    return pass_ == nullptr ? StartPass() : B_OK;
}

status_t MediaTrack::ReadFrames(void* buffer, int64_t* frameCount)
{
    if (buffer == nullptr || frameCount == nullptr)
        return B_BAD_VALUE;
    *frameCount = 0;
    const status_t status = EnsurePass();
    if (status != B_OK)
        return status;
    return pass_->Read(static_cast<int16_t*>(buffer), kFramesPerBuffer, frameCount);
}

status_t MediaTrack::ReadFramesInPlace(const int16_t** frames, int64_t* frameCount)
{
    if (frames == nullptr || frameCount == nullptr)
        return B_BAD_VALUE;
    *frameCount = 0;
    const status_t status = EnsurePass();
    if (status != B_OK)
        return status;
    return pass_->ReadInPlace(frames, kFramesPerBuffer, frameCount);
}

}  // namespace glimmet
