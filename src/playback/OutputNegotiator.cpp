#include "playback/OutputNegotiator.h"

#include <cstring>

#include "support/Diagnostics.h"

namespace glimmet {

namespace {

void CopyName(char* to, const char* from)
{
    if (to == nullptr || to == from)
        return;
    std::strncpy(to, from, kMediaNameLength - 1);
    to[kMediaNameLength - 1] = '\0';
}

}  // namespace

OutputNegotiator::OutputNegotiator()
{
    preferredFormat_.type = B_MEDIA_RAW_AUDIO;
    preferredFormat_.frameRate = 44100;
    preferredFormat_.channelCount = 2;
    preferredFormat_.sampleFormat = B_AUDIO_FLOAT;
    preferredFormat_.byteOrder = B_MEDIA_LITTLE_ENDIAN;
    preferredFormat_.bufferSize = kWildcardBufferSize;

    output_.destination = MediaDestination::Null();
    output_.format = preferredFormat_;
}

void OutputNegotiator::Register(int32_t nodeId, const char* name)
{
    output_.source = MediaSource{nodeId, 0};
    output_.node = nodeId;
    CopyName(output_.name, name);
}

status_t OutputNegotiator::SuggestFormat(int32_t type, MediaFormat* format) const
{
    if (format == nullptr) {
        Diagnostics::Print("\tERROR - NULL format pointer passed in!\n");
        return B_BAD_VALUE;
    }
    *format = preferredFormat_;
    if (type == B_MEDIA_UNKNOWN_TYPE)
        type = B_MEDIA_RAW_AUDIO;
    return type == B_MEDIA_RAW_AUDIO ? B_OK : B_MEDIA_BAD_FORMAT;
}

status_t OutputNegotiator::ProposeFormat(const MediaSource& output, MediaFormat* format) const
{
    if (!IsOurSource(output)) {
        Diagnostics::Print("AudioProducer::FormatProposal returning B_MEDIA_BAD_SOURCE\n");
        return B_MEDIA_BAD_SOURCE;
    }
    if (format == nullptr)
        return B_BAD_VALUE;
    const int32_t proposed = format->type;
    *format = preferredFormat_;
    if (proposed == B_MEDIA_UNKNOWN_TYPE || proposed == B_MEDIA_RAW_AUDIO)
        return B_OK;
    Diagnostics::Print("AudioProducer::FormatProposal returning B_MEDIA_BAD_FORMAT\n");
    return B_MEDIA_BAD_FORMAT;
}

status_t OutputNegotiator::ChangeFormat(const MediaSource& source, const MediaDestination& destination,
    MediaFormat* format)
{
    if (!(destination == output_.destination))
        return B_MEDIA_BAD_DESTINATION;
    if (!IsOurSource(source))
        return B_MEDIA_BAD_SOURCE;
    if (format == nullptr)
        return B_BAD_VALUE;
    output_.format = *format;
    return B_OK;
}

status_t OutputNegotiator::GetNextOutput(int32_t* cookie, MediaOutput* output) const
{
    if (cookie == nullptr || output == nullptr)
        return B_BAD_VALUE;
    if (*cookie != 0)
        return B_BAD_INDEX;
    *output = output_;
    ++*cookie;
    return B_OK;
}

status_t OutputNegotiator::PrepareToConnect(const MediaSource& what, const MediaDestination& where,
    MediaFormat* format, MediaSource* source, char* name)
{
    if (!IsOurSource(what))
        return B_MEDIA_BAD_SOURCE;
    if (IsConnected())
        return B_MEDIA_ALREADY_CONNECTED;
    if (format == nullptr)
        return B_BAD_VALUE;
    if (format->type != B_MEDIA_RAW_AUDIO) {
        Diagnostics::Print("\tnon-raw-audio format?!\n");
        return B_MEDIA_BAD_FORMAT;
    }
    if (format->sampleFormat != B_AUDIO_FLOAT) {
        Diagnostics::Print("\tnon-float-audio format?!\n");
        return B_MEDIA_BAD_FORMAT;
    }
    if (format->bufferSize == kWildcardBufferSize) {
        format->bufferSize = kDefaultBufferSize;
        Diagnostics::Print("\tno buffer size provided, suggesting %lu\n", (unsigned long)format->bufferSize);
    } else {
        Diagnostics::Print("\tconsumer suggested buffer_size %lu\n", (unsigned long)format->bufferSize);
    }
    output_.destination = where;
    output_.format = *format;
    if (source != nullptr)
        *source = output_.source;
    CopyName(name, output_.name);
    return B_OK;
}

void OutputNegotiator::Connected(const MediaDestination& destination, const MediaFormat& format, char* name)
{
    output_.destination = destination;
    output_.format = format;
    CopyName(name, output_.name);
}

void OutputNegotiator::Reset()
{
    output_.destination = MediaDestination::Null();
    output_.format = preferredFormat_;
}

bool OutputNegotiator::Disconnect(const MediaSource& what, const MediaDestination& where)
{
    if (IsOurSource(what) && where == output_.destination) {
        Reset();
        return true;
    }
    Diagnostics::Print("\tDisconnect() called with wrong source/destination (%ld/%ld), ours is (%ld/%ld)\n",
        long(what.id), long(where.id), long(output_.source.id), long(output_.destination.id));
    return false;
}

}  // namespace glimmet
