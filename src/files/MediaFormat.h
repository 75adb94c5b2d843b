#pragma once

#include <cstddef>
#include <cstdint>

namespace glimmet {

// The vocabulary of media formats, shared by the file readers and the
// playback graph. The numbers are those of the media framework the program
// was first written against, so that diagnostics and format negotiation read
// the same as there; plain enumerations, since the graph carries them in
// int32_t and uint32_t fields.

/// What kind of data a track or a connection holds.
enum media_type : int32_t {
    B_MEDIA_NO_TYPE = -1,
    B_MEDIA_UNKNOWN_TYPE = 0,
    B_MEDIA_RAW_AUDIO = 1,
    B_MEDIA_RAW_VIDEO = 2,
    B_MEDIA_ENCODED_AUDIO = 10,
    B_MEDIA_ENCODED_VIDEO = 11,
};

/// Sample formats of raw audio; 0 is the wildcard ("any").
enum : uint32_t {
    B_AUDIO_FORMAT_ANY = 0,
    B_AUDIO_UCHAR = 0x11,
    B_AUDIO_CHAR = 0x1,
    B_AUDIO_SHORT = 0x2,
    B_AUDIO_INT = 0x4,
    B_AUDIO_FLOAT = 0x24,
};

enum : uint32_t {
    B_MEDIA_BYTE_ORDER_ANY = 0,
    B_MEDIA_BIG_ENDIAN = 1,
    B_MEDIA_LITTLE_ENDIAN = 2,
};

/// The shape of raw audio. Zero in a field means "any" when asking a track
/// for a decoded format (the wildcard).
struct media_raw_audio_format {
    float frame_rate = 0;
    uint32_t channel_count = 0;
    uint32_t format = B_AUDIO_FORMAT_ANY;
    uint32_t byte_order = B_MEDIA_BYTE_ORDER_ANY;
    /// Bytes that one ReadFrames call delivers at most.
    size_t buffer_size = 0;

    static const media_raw_audio_format wildcard;
};

inline const media_raw_audio_format media_raw_audio_format::wildcard{};

/// A track's format: its type and, for audio, the raw-audio shape (for
/// encoded audio, the shape the decoder will produce).
struct media_format {
    media_type type = B_MEDIA_UNKNOWN_TYPE;
    media_raw_audio_format raw_audio;
    /// The codec's short name for encoded data ("mp3", "flac"); for
    /// information only.
    const char* codec_name = "";
};

}  // namespace glimmet
