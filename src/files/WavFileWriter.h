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
/// Everything goes to a hidden temporary file beside the destination (see
/// SiblingTemporaryFile); Finish flushes it to disk and renames it over the
/// destination. Only a regular file the user may write is replaced (see
/// SaveDestination), and failures carry the C library's own error. FFmpeg's muxer
/// writes the header and fills in the sizes at the end; the samples go
/// straight to the file, and the disk is set to work on them while more are
/// written. Until then the
/// destination is untouched, and a writer that fails or is destroyed
/// unfinished removes its temporary file.
class WavFileWriter : public FrameWriter {
public:
    static constexpr int kFrameRate = 44100;
    static constexpr int kChannelCount = 2;

    /// How often the disk is asked to start on the data written so far, and
    /// how far behind the writing that is waited for (bytes).
    struct Writeback {
        int64_t startEvery;
        int64_t waitBehind;
    };
    static constexpr Writeback kDefaultWriteback{int64_t(8) << 20, int64_t(64) << 20};

    /// Removes what killed saves to destination left, creates the temporary
    /// file and the one audio track. Ignores SIGXFSZ in the process from
    /// then on, so that a file-size limit fails a write instead of killing
    /// the program.
    explicit WavFileWriter(const std::filesystem::path& destination, Writeback writeback = kDefaultWriteback);
    ~WavFileWriter() override;
    WavFileWriter(const WavFileWriter&) = delete;
    WavFileWriter& operator=(const WavFileWriter&) = delete;

    /// A file larger than the process may write (ulimit -f) would kill the
    /// program with SIGXFSZ, losing every open document; ignored, the write
    /// fails with EFBIG like any other. Every writer makes sure of it, as the
    /// default may have been put back since; a handler of someone's own is
    /// left in place.
    static void IgnoreFileSizeSignal();

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
    status_t Sync();
    /// Renames the finished file over the destination.
    status_t Replace();
    void Discard();
    void NoteFailure(status_t status);
    status_t IOStatus() const;
    status_t WriteAt(const char* bytes, size_t size, int64_t offset);
    /// Has the disk start writing the data written since the last start,
    /// once there is enough of it.
    status_t StartWriteback();
    status_t WritebackFailure(int error);

    static int WritePacket(void* opaque, uint8_t* buffer, int size);
    static int64_t Seek(void* opaque, int64_t offset, int whence);

    std::filesystem::path destination_;
    Writeback writeback_;
    std::filesystem::path temporary_;
    int fd_ = -1;
    AVIOContext* io_ = nullptr;
    AVFormatContext* muxer_ = nullptr;
    status_t openStatus_ = B_NO_INIT;
    status_t firstFailure_ = B_OK;
    bool headerWritten_ = false;
    // Where the samples begin (right after the header), how many bytes of
    // them are written, and how far writeback was started and waited for.
    int64_t dataStart_ = 0;
    int64_t dataBytes_ = 0;
    int64_t writebackStarted_ = 0;
    int64_t writebackWaited_ = 0;
    bool writebackWorks_ = true;
};

}  // namespace glimmet
