#pragma once

#include <cstdint>
#include <filesystem>
#include <memory>
#include <vector>

#include "files/MediaDemuxer.h"
#include "support/Status.h"

struct AVCodecContext;
struct AVFrame;
struct AVPacket;
struct SwrContext;

namespace glimmet {

/// One pass over one audio stream of a file, from its start: demuxes,
/// decodes and converts to interleaved signed 16-bit frames of a fixed
/// channel count. Every pass opens the file afresh, so two passes over the
/// same stream give the same frames, which is what makes a counted length
/// exact.
///
/// A decoded block with fewer channels than asked for is padded with
/// silence, one with more is cut; sample rate changes inside a stream are
/// passed through unresampled. Not thread-safe; one thread uses a pass.
class TrackDecoder {
public:
    /// Refuses more channels than this (a header may claim anything).
    static constexpr int32_t kMaxChannels = 256;

    TrackDecoder(const std::filesystem::path& path, int32_t stream, int32_t channelCount);
    ~TrackDecoder();
    TrackDecoder(const TrackDecoder&) = delete;
    TrackDecoder& operator=(const TrackDecoder&) = delete;

    status_t InitCheck() const { return status_; }

    /// Up to maxFrames frames into buffer (maxFrames * channel count
    /// samples); *frames is how many came. B_OK with at least one frame,
    /// B_LAST_BUFFER_ERROR at the end of the stream, another code when
    /// decoding cannot go on.
    status_t Read(int16_t* buffer, int64_t maxFrames, int64_t* frames);
    /// Like Read, without the copy: *frames point into the pass's own block
    /// and stay valid until the next call.
    status_t ReadInPlace(const int16_t** block, int64_t maxFrames, int64_t* frames);

    /// The frames left in the stream, counted by decoding (or, for plain PCM
    /// in a simple container, from packet sizes, which give exactly what the
    /// decoder would). Uses up the pass.
    int64_t CountRemainingFrames();

    /// At least as many frames as the stream decodes to, known without
    /// reading it: for plain PCM in a simple container, the file's size over
    /// the frame size. -1 when no such bound is known.
    int64_t FrameCountBound() const;

private:
    status_t OpenDecoder(int32_t stream);
    /// Decodes until a block of frames is pending; false at the end.
    bool DecodeNextBlock();
    /// B_OK with a frame in frame_, B_LAST_BUFFER_ERROR when drained.
    status_t ReceiveFrame();
    status_t SendNextPacket();
    /// Makes the received frame the pending block; false (with status_ set)
    /// when it cannot be converted.
    bool ConvertFrame();
    const int16_t* ConvertToShorts(int format, int channels, int frames);
    const int16_t* Remap(const int16_t* interleaved, int inChannels, int frames);
    /// Plain PCM in a container whose packets hold nothing but samples, so
    /// packet sizes say how many frames the decoder makes of them.
    bool IsPlainPCM() const;
    int64_t BytesPerFrame() const;
    int64_t CountPacketFrames();
    /// For native 16-bit PCM: the packet's bytes are the decoder's output,
    /// so the block is taken from the packet itself.
    bool TakeNextPacket();
    /// Makes interleaved frames of inChannels channels the pending block.
    void SetPending(const int16_t* interleaved, int inChannels, int frames);

    MediaDemuxer demuxer_;
    int32_t stream_;
    int32_t channelCount_;
    status_t status_ = B_NO_INIT;
    AVCodecContext* codec_ = nullptr;
    AVFrame* frame_ = nullptr;
    AVPacket* packet_ = nullptr;
    SwrContext* converter_ = nullptr;
    int converterFormat_ = -1;
    int converterChannels_ = 0;
    bool passThrough_ = false;
    bool inputEnded_ = false;
    bool drained_ = false;

    // The current block as interleaved frames and how far it has been read.
    const int16_t* pending_ = nullptr;
    int64_t pendingFrames_ = 0;
    std::vector<int16_t> converted_;
    std::vector<int16_t> remapped_;
};

}  // namespace glimmet
