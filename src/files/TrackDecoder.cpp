#include "files/TrackDecoder.h"

#include <algorithm>
#include <bit>
#include <string>
#include <cstring>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/opt.h>
#include <libswresample/swresample.h>
}

#include "files/FFmpegStatus.h"

namespace glimmet {

namespace {

// The most samples (all channels) one decoded block may hold: far above any
// real codec's block, far below what would hurt.
constexpr int64_t kMaxSamplesPerBlock = 1 << 22;
// Packets of plain PCM where the container lets us choose: large enough
// that the per-packet work vanishes, small enough to stay in the cache while
// its frames are spread over the channels.
constexpr int kLargePacketBytes = 256 * 1024;
// Errors a decoder may report after the end of its input before we stop
// asking it for more.
constexpr int kMaxErrorsAfterEnd = 64;
// Any rate will do for the converter: input and output rates are the same.
constexpr int kConverterRate = 48000;

bool IsPlainPCMCodec(AVCodecID id)
{
    switch (id) {
        case AV_CODEC_ID_PCM_S16LE: case AV_CODEC_ID_PCM_S16BE:
        case AV_CODEC_ID_PCM_U16LE: case AV_CODEC_ID_PCM_U16BE:
        case AV_CODEC_ID_PCM_S8: case AV_CODEC_ID_PCM_U8:
        case AV_CODEC_ID_PCM_MULAW: case AV_CODEC_ID_PCM_ALAW:
        case AV_CODEC_ID_PCM_S32LE: case AV_CODEC_ID_PCM_S32BE:
        case AV_CODEC_ID_PCM_U32LE: case AV_CODEC_ID_PCM_U32BE:
        case AV_CODEC_ID_PCM_S24LE: case AV_CODEC_ID_PCM_S24BE:
        case AV_CODEC_ID_PCM_U24LE: case AV_CODEC_ID_PCM_U24BE:
        case AV_CODEC_ID_PCM_F32BE: case AV_CODEC_ID_PCM_F32LE:
        case AV_CODEC_ID_PCM_F64BE: case AV_CODEC_ID_PCM_F64LE:
        case AV_CODEC_ID_PCM_S64LE: case AV_CODEC_ID_PCM_S64BE:
            return true;
        default:
            return false;
    }
}

bool IsSimpleContainer(const std::string& name)
{
    // Containers whose audio packets are bare sample bytes: no trimming
    // side data, no edit lists.
    return name == "wav" || name == "w64" || name == "aiff" || name == "au" || name == "caf";
}

constexpr AVCodecID kNativeShortCodec =
    std::endian::native == std::endian::little ? AV_CODEC_ID_PCM_S16LE : AV_CODEC_ID_PCM_S16BE;

}  // namespace

TrackDecoder::TrackDecoder(const std::filesystem::path& path, int32_t stream, int32_t channelCount)
    : demuxer_(path), stream_(stream), channelCount_(channelCount)
{
    status_ = demuxer_.InitCheck();
    if (status_ == B_OK)
        status_ = OpenDecoder(stream);
}

TrackDecoder::~TrackDecoder()
{
    swr_free(&converter_);
    av_packet_free(&packet_);
    av_frame_free(&frame_);
    avcodec_free_context(&codec_);
}

status_t TrackDecoder::OpenDecoder(int32_t stream)
{
    const AVStream* avStream = demuxer_.StreamAt(stream);
    if (avStream == nullptr || avStream->codecpar->codec_type != AVMEDIA_TYPE_AUDIO)
        return B_BAD_INDEX;
    if (channelCount_ < 1 || channelCount_ > kMaxChannels)
        return B_MEDIA_BAD_FORMAT;
    const AVCodecParameters* parameters = avStream->codecpar;
    if (parameters->ch_layout.nb_channels > kMaxChannels)
        return B_MEDIA_BAD_FORMAT;
    demuxer_.KeepOnlyStream(stream);

    const AVCodec* codec = avcodec_find_decoder(parameters->codec_id);
    if (codec == nullptr)
        return B_MEDIA_NO_HANDLER;
    codec_ = avcodec_alloc_context3(codec);
    frame_ = av_frame_alloc();
    packet_ = av_packet_alloc();
    if (codec_ == nullptr || frame_ == nullptr || packet_ == nullptr)
        return B_NO_MEMORY;
    int error = avcodec_parameters_to_context(codec_, parameters);
    if (error < 0)
        return StatusFromAVError(error);
    codec_->pkt_timebase = avStream->time_base;
    codec_->thread_count = 1;
    codec_->max_samples = kMaxSamplesPerBlock;
    error = avcodec_open2(codec_, codec, nullptr);
    if (error < 0)
        return StatusFromAVError(error);
    passThrough_ = IsPlainPCM() && codec_->codec_id == kNativeShortCodec;
    // Each packet is decoded on its own and loses a trailing partial frame,
    // so packets may only grow where every one but the last of a data chunk
    // stays a whole number of frames: where a block is whole frames.
    const int64_t frameBytes = IsPlainPCM() ? BytesPerFrame() : 0;
    if (frameBytes > 0 && parameters->block_align > 0 && parameters->block_align % frameBytes == 0)
        demuxer_.SetMaxPacketSize(kLargePacketBytes);
    return B_OK;
}

bool TrackDecoder::IsPlainPCM() const
{
    return codec_ != nullptr && IsPlainPCMCodec(codec_->codec_id) && codec_->ch_layout.nb_channels > 0
        && codec_->ch_layout.nb_channels <= kMaxChannels && IsSimpleContainer(demuxer_.FormatName());
}

int64_t TrackDecoder::BytesPerFrame() const
{
    return int64_t(av_get_bits_per_sample(codec_->codec_id) / 8) * codec_->ch_layout.nb_channels;
}

int64_t TrackDecoder::FrameCountBound() const
{
    if (status_ != B_OK || !IsPlainPCM() || BytesPerFrame() <= 0)
        return -1;
    return demuxer_.FileSize() / BytesPerFrame();
}

status_t TrackDecoder::Read(int16_t* buffer, int64_t maxFrames, int64_t* frames)
{
    const int16_t* block = nullptr;
    const status_t status = ReadInPlace(&block, maxFrames, frames);
    if (status == B_OK)
        std::memcpy(buffer, block, size_t(*frames) * size_t(channelCount_) * sizeof(int16_t));
    return status;
}

status_t TrackDecoder::ReadInPlace(const int16_t** block, int64_t maxFrames, int64_t* frames)
{
    *frames = 0;
    if (status_ != B_OK)
        return status_;
    if (maxFrames <= 0)
        return B_BAD_VALUE;
    if (pendingFrames_ == 0 && !DecodeNextBlock())
        return status_ == B_OK ? B_LAST_BUFFER_ERROR : status_;
    const int64_t count = std::min(maxFrames, pendingFrames_);
    *block = pending_;
    pending_ += size_t(count) * size_t(channelCount_);
    pendingFrames_ -= count;
    *frames = count;
    return B_OK;
}

int64_t TrackDecoder::CountRemainingFrames()
{
    if (status_ != B_OK)
        return 0;
    if (IsPlainPCM())
        return CountPacketFrames();
    int64_t total = pendingFrames_;
    pendingFrames_ = 0;
    while (DecodeNextBlock()) {
        total += pendingFrames_;
        pendingFrames_ = 0;
    }
    return total;
}

int64_t TrackDecoder::CountPacketFrames()
{
    // The PCM decoders turn each packet into as many whole frames as it
    // holds and drop a trailing partial frame.
    const int64_t frameBytes = BytesPerFrame();
    av_packet_unref(packet_);
    int64_t total = pendingFrames_;
    pendingFrames_ = 0;
    while (frameBytes > 0 && demuxer_.ReadPacket(stream_, packet_)) {
        total += packet_->size / frameBytes;
        av_packet_unref(packet_);
    }
    inputEnded_ = drained_ = true;
    return total;
}

bool TrackDecoder::DecodeNextBlock()
{
    pendingFrames_ = 0;
    if (passThrough_)
        return TakeNextPacket();
    while (!drained_) {
        const status_t received = ReceiveFrame();
        if (received == B_LAST_BUFFER_ERROR) {
            drained_ = true;
            break;
        }
        if (received != B_OK) {
            status_ = received;
            return false;
        }
        // The frame stays referenced while its block is pending; the next
        // receive releases it.
        if (!ConvertFrame())
            return false;
        if (pendingFrames_ > 0)
            return true;
    }
    return false;
}

status_t TrackDecoder::ReceiveFrame()
{
    int errorsAfterEnd = 0;
    for (;;) {
        const int error = avcodec_receive_frame(codec_, frame_);
        if (error == 0)
            return B_OK;
        if (error == AVERROR_EOF)
            return B_LAST_BUFFER_ERROR;
        if (error == AVERROR(ENOMEM))
            return B_NO_MEMORY;
        if (error != AVERROR(EAGAIN)) {
            // A damaged block is skipped, as FFmpeg's own tools do. Before the
            // end each error has used up input, so this ends; after it, a
            // decoder that keeps failing is given up on.
            if (inputEnded_ && ++errorsAfterEnd >= kMaxErrorsAfterEnd)
                return B_LAST_BUFFER_ERROR;
            continue;
        }
        if (inputEnded_)
            return B_LAST_BUFFER_ERROR;
        const status_t sent = SendNextPacket();
        if (sent != B_OK)
            return sent;
    }
}

status_t TrackDecoder::SendNextPacket()
{
    if (!demuxer_.ReadPacket(stream_, packet_)) {
        // No more input: ask the decoder for what it still holds.
        inputEnded_ = true;
        avcodec_send_packet(codec_, nullptr);
        return B_OK;
    }
    const int error = avcodec_send_packet(codec_, packet_);
    av_packet_unref(packet_);
    return error == AVERROR(ENOMEM) ? B_NO_MEMORY : B_OK;
}

bool TrackDecoder::ConvertFrame()
{
    const int inChannels = frame_->ch_layout.nb_channels;
    const int frames = frame_->nb_samples;
    if (frames <= 0 || inChannels <= 0 || inChannels > kMaxChannels)
        return true;  // nothing usable in this block; go on with the next
    const int16_t* interleaved = nullptr;
    const auto format = AVSampleFormat(frame_->format);
    if (format == AV_SAMPLE_FMT_S16 || (format == AV_SAMPLE_FMT_S16P && inChannels == 1)) {
        interleaved = reinterpret_cast<const int16_t*>(frame_->data[0]);
    } else {
        interleaved = ConvertToShorts(format, inChannels, frames);
        if (interleaved == nullptr)
            return false;
    }
    SetPending(interleaved, inChannels, frames);
    return true;
}

bool TrackDecoder::TakeNextPacket()
{
    const int64_t frameBytes = BytesPerFrame();
    av_packet_unref(packet_);
    while (!drained_) {
        if (!demuxer_.ReadPacket(stream_, packet_)) {
            drained_ = true;
            break;
        }
        const int64_t frames = packet_->size / frameBytes;
        if (frames > 0) {
            // The packet stays referenced while its block is pending.
            SetPending(reinterpret_cast<const int16_t*>(packet_->data), codec_->ch_layout.nb_channels, int(frames));
            return true;
        }
        av_packet_unref(packet_);
    }
    return false;
}

void TrackDecoder::SetPending(const int16_t* interleaved, int inChannels, int frames)
{
    pending_ = interleaved;
    if (inChannels != channelCount_)
        pending_ = Remap(interleaved, inChannels, frames);
    pendingFrames_ = frames;
}

const int16_t* TrackDecoder::ConvertToShorts(int format, int channels, int frames)
{
    if (converter_ == nullptr || converterFormat_ != format || converterChannels_ != channels) {
        swr_free(&converter_);
        // Same layout and rate on both sides: a pure sample format change,
        // so the converter neither remixes nor delays anything.
        AVChannelLayout layout;
        av_channel_layout_default(&layout, channels);
        int error = swr_alloc_set_opts2(&converter_, &layout, AV_SAMPLE_FMT_S16, kConverterRate, &layout,
                                        AVSampleFormat(format), kConverterRate, 0, nullptr);
        if (error >= 0)
            error = swr_init(converter_);
        av_channel_layout_uninit(&layout);
        if (error < 0) {
            swr_free(&converter_);
            status_ = error == AVERROR(ENOMEM) ? B_NO_MEMORY : B_MEDIA_BAD_FORMAT;
            return nullptr;
        }
        converterFormat_ = format;
        converterChannels_ = channels;
    }
    converted_.resize(size_t(frames) * size_t(channels));
    uint8_t* out = reinterpret_cast<uint8_t*>(converted_.data());
    const int done = swr_convert(converter_, &out, frames, const_cast<const uint8_t**>(frame_->extended_data), frames);
    if (done != frames) {
        status_ = done < 0 ? StatusFromAVError(done) : B_MEDIA_BAD_FORMAT;
        return nullptr;
    }
    return converted_.data();
}

const int16_t* TrackDecoder::Remap(const int16_t* interleaved, int inChannels, int frames)
{
    // Channels the block lacks are silent; channels beyond ours are left out.
    const int kept = std::min(inChannels, channelCount_);
    remapped_.assign(size_t(frames) * size_t(channelCount_), 0);
    for (int frame = 0; frame < frames; ++frame) {
        const int16_t* from = interleaved + size_t(frame) * size_t(inChannels);
        int16_t* to = remapped_.data() + size_t(frame) * size_t(channelCount_);
        std::copy(from, from + kept, to);
    }
    return remapped_.data();
}

}  // namespace glimmet
