#include "files/FFmpegStatus.h"
#include "files/ErrnoStatus.h"

#include <cerrno>

extern "C" {
#include <libavutil/error.h>
}

namespace glimmet {

status_t StatusFromAVError(int error)
{
    if (error >= 0)
        return B_OK;
    switch (error) {
        case AVERROR_EOF: return B_LAST_BUFFER_ERROR;
        case AVERROR_INVALIDDATA:
        case AVERROR_DEMUXER_NOT_FOUND:
        case AVERROR_DECODER_NOT_FOUND:
        case AVERROR_STREAM_NOT_FOUND: return B_MEDIA_NO_HANDLER;
        case AVERROR_PATCHWELCOME: return B_MEDIA_BAD_FORMAT;
        default:
            // Most other FFmpeg errors are negated errno values.
            return StatusFromErrno(AVUNERROR(error));
    }
}

}  // namespace glimmet
