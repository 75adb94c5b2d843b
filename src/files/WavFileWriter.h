#pragma once

#include <cstdint>
#include <filesystem>

#include "files/FrameWriter.h"
#include "support/Status.h"

struct AVFormatContext;
struct AVIOContext;

namespace glimmet {

/// Writes a stereo, signed 16-bit little-endian, 44100 Hz RIFF WAV file with
/// the canonical 44-byte header, without ever damaging the file it replaces.
///
/// Everything goes to a hidden temporary file beside the destination; Finish
/// flushes it to disk and renames it over the destination. Until then the
/// destination is untouched, and a writer that fails or is destroyed
/// unfinished removes its temporary file.
class WavFileWriter : public FrameWriter {
public:
    static constexpr int kFrameRate = 44100;
    static constexpr int kChannelCount = 2;

    /// Creates the temporary file and the one audio track.
    explicit WavFileWriter(const std::filesystem::path& destination);
    ~WavFileWriter() override;
    WavFileWriter(const WavFileWriter&) = delete;
    WavFileWriter& operator=(const WavFileWriter&) = delete;

    /// B_OK when the temporary file and its track exist.
    status_t InitCheck() const { return openStatus_; }
    /// Writes the header; frames may follow.
    status_t CommitHeader();
    status_t WriteFrames(const int16_t* frames, int64_t count) override;
    /// Completes the file and puts it in the destination's place. Returns the
    /// first failure of the whole write (then the destination is as it was
    /// and no temporary file is left), else B_OK.
    status_t Finish();

    /// The temporary file's path while it exists (for diagnostics and tests).
    const std::filesystem::path& TemporaryPath() const { return temporary_; }

private:
    status_t CreateTemporaryFile();
    status_t CreateMuxer();
    status_t Complete();
    void Discard();
    void NoteFailure(status_t status);
    status_t IOStatus() const;

    static int WritePacket(void* opaque, uint8_t* buffer, int size);
    static int64_t Seek(void* opaque, int64_t offset, int whence);

    std::filesystem::path destination_;
    std::filesystem::path temporary_;
    int fd_ = -1;
    AVIOContext* io_ = nullptr;
    AVFormatContext* muxer_ = nullptr;
    status_t openStatus_ = B_NO_INIT;
    status_t firstFailure_ = B_OK;
    bool headerWritten_ = false;
    int64_t framesWritten_ = 0;
};

}  // namespace glimmet
