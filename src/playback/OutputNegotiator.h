#pragma once

#include <cstdint>

#include "playback/MediaKit.h"
#include "support/Status.h"

namespace glimmet {

/// The producer's one output and how its format is agreed with a consumer:
/// suggestions, proposals, the preparation of a connection and its end. It
/// holds what the connection is (destination, format, name) and nothing of
/// what the connection needs (buffers, mixer); the producer does that once
/// a step here succeeds. Window thread, while no device calls the producer.
class OutputNegotiator {
public:
    /// The buffer size given to a consumer that leaves it open: 256 stereo
    /// float frames.
    static constexpr uint32_t kDefaultBufferSize = 2048;

    OutputNegotiator();

    /// The node has an id: the output gets its source and name.
    void Register(int32_t nodeId, const char* name);

    const MediaFormat& PreferredFormat() const { return preferredFormat_; }
    const MediaOutput& Output() const { return output_; }
    bool IsOurSource(const MediaSource& source) const { return source == output_.source; }
    bool IsConnected() const { return !(output_.destination == MediaDestination::Null()); }

    status_t SuggestFormat(int32_t type, MediaFormat* format) const;
    status_t ProposeFormat(const MediaSource& output, MediaFormat* format) const;
    /// Takes the consumer's new format for the connection.
    status_t ChangeFormat(const MediaSource& source, const MediaDestination& destination, MediaFormat* format);
    status_t GetNextOutput(int32_t* cookie, MediaOutput* output) const;
    /// Reserves the output for the destination and settles the buffer size.
    status_t PrepareToConnect(const MediaSource& what, const MediaDestination& where, MediaFormat* format,
        MediaSource* source, char* name);
    /// The graph made the connection prepared for.
    void Connected(const MediaDestination& destination, const MediaFormat& format, char* name);
    /// The output is free again, with the preferred format.
    void Reset();
    /// Ends the connection when it is the one named; false (and a remark)
    /// when it is not.
    bool Disconnect(const MediaSource& what, const MediaDestination& where);

private:
    MediaOutput output_;
    MediaFormat preferredFormat_;
};

}  // namespace glimmet
