#include "files/WavFileWriter.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <string>

extern "C" {
#include <libavformat/avformat.h>
#include <libavutil/dict.h>
#include <libavutil/mem.h>
}

#include "files/ErrnoStatus.h"
#include "files/FFmpegStatus.h"
#include "files/SaveDestination.h"
#include "files/SiblingTemporaryFile.h"
#include "files/WriteFaults.h"

namespace glimmet {

namespace {

constexpr int kIOBufferSize = 64 * 1024;
constexpr int kBytesPerFrame = WavFileWriter::kChannelCount * int(sizeof(int16_t));

std::filesystem::path DirectoryOf(const std::filesystem::path& file)
{
    const std::filesystem::path parent = file.parent_path();
    return parent.empty() ? std::filesystem::path(".") : parent;
}

/// The errno a step is to fail with for a test, or 0.
int InjectedError(WriteFaults::Step step)
{
    return WriteFaults::ErrorFor(step);
}

/// FFmpeg's I/O errors are negated errno values: those keep their own text.
status_t ExactStatusFromAVError(int error)
{
    const int system = AVUNERROR(error);
    if (error < 0 && system > 0 && system < kPosixErrorCount)
        return ExactStatusFromErrno(system);
    return StatusFromAVError(error);
}

/// Makes the rename durable: the directory entry reaches the disk too.
void SyncDirectory(const std::filesystem::path& directory)
{
    const int fd = open(directory.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (fd < 0)
        return;
    fsync(fd);
    close(fd);
}

}  // namespace

void WavFileWriter::IgnoreFileSizeSignal()
{
    struct sigaction current {};
    if (sigaction(SIGXFSZ, nullptr, &current) != 0 || current.sa_handler != SIG_DFL)
        return;
    struct sigaction ignore {};
    ignore.sa_handler = SIG_IGN;
    sigemptyset(&ignore.sa_mask);
    sigaction(SIGXFSZ, &ignore, nullptr);
}

WavFileWriter::WavFileWriter(const std::filesystem::path& destination, Writeback writeback)
    : destination_(destination), writeback_(writeback)
{
    IgnoreFileSizeSignal();
    openStatus_ = CreateTemporaryFile();
    if (openStatus_ == B_OK)
        openStatus_ = CreateMuxer();
    NoteFailure(openStatus_);
}

WavFileWriter::~WavFileWriter()
{
    Discard();
    avformat_free_context(muxer_);
    if (io_ != nullptr)
        av_freep(&io_->buffer);
    avio_context_free(&io_);
}

status_t WavFileWriter::CreateTemporaryFile()
{
    bool replacing = false;
    struct stat existing {};
    const status_t allowed = SaveDestination::CheckReplaceable(destination_, &replacing, &existing);
    if (allowed != B_OK)
        return allowed;
    SiblingTemporaryFile::RemoveAbandoned(destination_);
    const status_t status = SiblingTemporaryFile::Create(destination_, 0666, &fd_, &temporary_);
    // The new file takes the place of the old one, permissions included.
    if (status == B_OK && replacing)
        fchmod(fd_, existing.st_mode & 07777);
    return status;
}

status_t WavFileWriter::CreateMuxer()
{
    int error = avformat_alloc_output_context2(&muxer_, nullptr, "wav", nullptr);
    if (error < 0 || muxer_ == nullptr)
        return B_MEDIA_NO_HANDLER;
    auto* buffer = static_cast<unsigned char*>(av_malloc(kIOBufferSize));
    if (buffer == nullptr)
        return B_NO_MEMORY;
    io_ = avio_alloc_context(buffer, kIOBufferSize, 1, this, nullptr, WritePacket, Seek);
    if (io_ == nullptr) {
        av_free(buffer);
        return B_NO_MEMORY;
    }
    muxer_->pb = io_;
    // Bit-exact output leaves out the encoder's name, so the header is the
    // canonical 44 bytes.
    muxer_->flags |= AVFMT_FLAG_BITEXACT | AVFMT_FLAG_CUSTOM_IO;

    AVStream* stream = avformat_new_stream(muxer_, nullptr);
    if (stream == nullptr)
        return B_NO_MEMORY;
    AVCodecParameters* parameters = stream->codecpar;
    parameters->codec_type = AVMEDIA_TYPE_AUDIO;
    parameters->codec_id = AV_CODEC_ID_PCM_S16LE;
    parameters->sample_rate = kFrameRate;
    av_channel_layout_default(&parameters->ch_layout, kChannelCount);
    parameters->format = AV_SAMPLE_FMT_S16;
    parameters->bits_per_coded_sample = 16;
    parameters->block_align = kBytesPerFrame;
    parameters->bit_rate = int64_t(kFrameRate) * kBytesPerFrame * 8;
    stream->time_base = AVRational{1, kFrameRate};
    return B_OK;
}

status_t WavFileWriter::CommitHeader()
{
    if (openStatus_ != B_OK)
        return openStatus_;
    if (headerWritten_)
        return B_OK;
    AVDictionary* options = nullptr;
    av_dict_set(&options, "rf64", "never", 0);
    const int error = avformat_write_header(muxer_, &options);
    av_dict_free(&options);
    status_t status = StatusFromAVError(error);
    if (status == B_OK) {
        avio_flush(io_);
        status = IOStatus();
    }
    if (status == B_OK) {
        dataStart_ = avio_tell(io_);
        writebackStarted_ = writebackWaited_ = dataStart_;
    }
    headerWritten_ = status == B_OK;
    NoteFailure(status);
    return status;
}

status_t WavFileWriter::WriteFrames(const int16_t* frames, int64_t count)
{
    if (!headerWritten_)
        return B_NO_INIT;
    if (frames == nullptr || count <= 0 || count > INT32_MAX / kBytesPerFrame)
        return B_BAD_VALUE;
    if (firstFailure_ != B_OK)
        return firstFailure_;
    // The samples go to the file as they are, at the end of the data, past
    // the muxer: for 16-bit PCM it would only copy them through its buffer.
    // The muxer learns where the data ends before it writes the trailer.
    const size_t bytes = size_t(count) * kBytesPerFrame;
    status_t status = WriteAt(reinterpret_cast<const char*>(frames), bytes, dataStart_ + dataBytes_);
    if (status == B_OK) {
        dataBytes_ += int64_t(bytes);
        status = StartWriteback();
    }
    NoteFailure(status);
    return status;
}

status_t WavFileWriter::WriteAt(const char* bytes, size_t size, int64_t offset)
{
    size_t done = 0;
    while (done < size) {
        if (const int injected = InjectedError(WriteFaults::Step::Write))
            return ExactStatusFromErrno(injected);
        const ssize_t written = pwrite(fd_, bytes + done, size - done, off_t(offset + int64_t(done)));
        if (written < 0 && errno == EINTR)
            continue;
        if (written < 0)
            return ExactStatusFromErrno(errno);
        if (written == 0)
            return ExactStatusFromErrno(EIO);
        done += size_t(written);
    }
    return B_OK;
}

status_t WavFileWriter::StartWriteback()
{
    // The disk starts on each stretch of data as soon as it is complete, so
    // that it works while the rest is mixed and the final fsync has little
    // left to do. Stretches long written are waited for, which keeps the
    // dirty pages (and the final wait) bounded.
    const int64_t end = dataStart_ + dataBytes_;
    if (!writebackWorks_ || end - writebackStarted_ < writeback_.startEvery)
        return B_OK;
    if (sync_file_range(fd_, writebackStarted_, end - writebackStarted_, SYNC_FILE_RANGE_WRITE) != 0)
        return WritebackFailure(errno);
    writebackStarted_ = end;
    const int64_t waitUpTo = end - writeback_.waitBehind;
    if (waitUpTo > writebackWaited_) {
        if (sync_file_range(fd_, writebackWaited_, waitUpTo - writebackWaited_,
                            SYNC_FILE_RANGE_WAIT_BEFORE | SYNC_FILE_RANGE_WRITE | SYNC_FILE_RANGE_WAIT_AFTER)
            != 0)
            return WritebackFailure(errno);
        writebackWaited_ = waitUpTo;
    }
    return B_OK;
}

status_t WavFileWriter::WritebackFailure(int error)
{
    // A file system or kernel that does not offer this only loses the head
    // start; fsync still does all the work. Any other error is a failed
    // write: once reported here, fsync might not report it again.
    if (error == ENOSYS || error == EINVAL || error == ESPIPE || error == EOPNOTSUPP) {
        writebackWorks_ = false;
        return B_OK;
    }
    return ExactStatusFromErrno(error);
}

status_t WavFileWriter::Finish()
{
    if (firstFailure_ == B_OK && !headerWritten_)
        NoteFailure(B_NO_INIT);
    if (firstFailure_ == B_OK)
        NoteFailure(Complete());
    if (firstFailure_ != B_OK)
        Discard();
    return firstFailure_;
}

status_t WavFileWriter::Complete()
{
    // The trailer fills the sizes in from where the muxer stands, so it is
    // put at the end of the data written past it.
    const int64_t end = avio_seek(io_, dataStart_ + dataBytes_, SEEK_SET);
    if (end < 0)
        return ExactStatusFromAVError(int(end));
    status_t status = ExactStatusFromAVError(av_write_trailer(muxer_));
    avio_flush(io_);
    if (status == B_OK)
        status = IOStatus();
    if (status == B_OK)
        status = Sync();
    if (status != B_OK)
        return status;
    return Replace();
}

status_t WavFileWriter::Sync()
{
    if (const int injected = InjectedError(WriteFaults::Step::Sync))
        return ExactStatusFromErrno(injected);
    return fsync(fd_) == 0 ? B_OK : ExactStatusFromErrno(errno);
}

status_t WavFileWriter::Replace()
{
    // What is there may have changed while the file was written.
    bool exists = false;
    status_t status = SaveDestination::CheckReplaceable(destination_, &exists, nullptr);
    if (status != B_OK)
        return status;
    // Renamed while still open and locked, so that no other save takes the
    // file for one a killed save left behind.
    if (const int injected = InjectedError(WriteFaults::Step::Rename))
        return ExactStatusFromErrno(injected);
    if (rename(temporary_.c_str(), destination_.c_str()) != 0)
        return ExactStatusFromErrno(errno);
    temporary_.clear();
    const int closed = close(fd_);
    fd_ = -1;
    // The data reached the disk with the fsync, so a failed close is only
    // reported, never undone.
    if (closed != 0)
        status = ExactStatusFromErrno(errno);
    SyncDirectory(DirectoryOf(destination_));
    return status;
}

void WavFileWriter::Discard()
{
    if (fd_ >= 0) {
        close(fd_);
        fd_ = -1;
    }
    if (!temporary_.empty()) {
        unlink(temporary_.c_str());
        temporary_.clear();
    }
}

void WavFileWriter::NoteFailure(status_t status)
{
    if (firstFailure_ == B_OK)
        firstFailure_ = status;
}

status_t WavFileWriter::IOStatus() const
{
    return io_ == nullptr || io_->error == 0 ? B_OK : ExactStatusFromAVError(io_->error);
}

int WavFileWriter::WritePacket(void* opaque, uint8_t* buffer, int size)
{
    auto* writer = static_cast<WavFileWriter*>(opaque);
    int done = 0;
    while (done < size) {
        if (const int injected = InjectedError(WriteFaults::Step::Write))
            return AVERROR(injected);
        const ssize_t written = write(writer->fd_, buffer + done, size_t(size - done));
        if (written < 0 && errno == EINTR)
            continue;
        if (written <= 0)
            return AVERROR(written < 0 ? errno : EIO);
        done += int(written);
    }
    return done;
}

int64_t WavFileWriter::Seek(void* opaque, int64_t offset, int whence)
{
    auto* writer = static_cast<WavFileWriter*>(opaque);
    if (whence & AVSEEK_SIZE) {
        struct stat info {};
        return fstat(writer->fd_, &info) == 0 ? int64_t(info.st_size) : AVERROR(errno);
    }
    const off_t position = lseek(writer->fd_, off_t(offset), whence & ~AVSEEK_FORCE);
    return position < 0 ? AVERROR(errno) : int64_t(position);
}

}  // namespace glimmet
