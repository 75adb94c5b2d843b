#pragma once

#include <cstdint>

// Media types, sample formats and byte orders are the files layer's, so that
// a track's format and a connection's format use the same numbers.
#include "files/MediaFormat.h"

namespace glimmet {

// The vocabulary of the playback graph: run modes, event types and the
// endpoints of a connection. The numbers are those of the media framework
// the producer was first written against, so that the diagnostics and the
// negotiation read the same.

// Run modes of a node.
inline constexpr int32_t B_OFFLINE = 1;
inline constexpr int32_t B_DECREASE_PRECISION = 2;
inline constexpr int32_t B_INCREASE_LATENCY = 3;
inline constexpr int32_t B_DROP_DATA = 4;
inline constexpr int32_t B_RECORDING = 5;

// Timed event types.
inline constexpr int32_t B_START = 1;
inline constexpr int32_t B_STOP = 2;
inline constexpr int32_t B_SEEK = 3;
inline constexpr int32_t B_WARP = 4;
inline constexpr int32_t B_TIMER = 5;
inline constexpr int32_t B_HANDLE_BUFFER = 6;

// Errors a node reports to whoever watches it (not status codes).
inline constexpr int32_t B_NODE_FAILED_START = 0x54524930;  // 'TRI0'
inline constexpr int32_t B_NODE_FAILED_STOP = B_NODE_FAILED_START + 1;
inline constexpr int32_t B_NODE_FAILED_SEEK = B_NODE_FAILED_START + 2;
inline constexpr int32_t B_NODE_FAILED_SET_RUN_MODE = B_NODE_FAILED_START + 3;

/// The buffer size of a raw audio format that the consumer leaves open.
inline constexpr uint32_t kWildcardBufferSize = 0;

/// A raw audio format. Zero in a field means "any" (the wildcard).
struct MediaFormat {
    int32_t type = B_MEDIA_UNKNOWN_TYPE;
    float frameRate = 0;
    uint32_t channelCount = 0;
    uint32_t sampleFormat = 0;
    uint32_t byteOrder = 0;
    uint32_t bufferSize = kWildcardBufferSize;

    bool operator==(const MediaFormat&) const = default;
};

/// Where buffers come from: a node's port and an output id. The null source
/// has both at -1.
struct MediaSource {
    int32_t port = -1;
    int32_t id = -1;

    bool operator==(const MediaSource&) const = default;
    static constexpr MediaSource Null() { return {}; }
};

/// Where buffers go: the sound device's id and an input id; null at -1.
struct MediaDestination {
    int32_t port = -1;
    int32_t id = -1;

    bool operator==(const MediaDestination&) const = default;
    static constexpr MediaDestination Null() { return {}; }
};

/// Room for an output's name, terminator included.
inline constexpr int kMediaNameLength = 64;

/// One output of a node as the graph sees it.
struct MediaOutput {
    int32_t node = -1;
    MediaSource source;
    MediaDestination destination;
    MediaFormat format;
    char name[kMediaNameLength] = {};
};

/// One timed event of a node's queue.
struct MediaEvent {
    int32_t type = 0;
    int64_t eventTime = 0;  // performance time, microseconds
};

}  // namespace glimmet
