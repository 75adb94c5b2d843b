#include "sound/SpillFile.h"

#include <cerrno>
#include <cstdlib>
#include <fcntl.h>
#include <string>
#include <unistd.h>

namespace glimmet {

namespace {

int OpenUnnamed(const std::string& folder)
{
#ifdef O_TMPFILE
    const int fd = ::open(folder.c_str(), O_TMPFILE | O_RDWR | O_CLOEXEC, 0600);
    if (fd >= 0)
        return fd;
#endif
    // Filesystems without O_TMPFILE: a unique name removed right away.
    std::string pattern = folder + "/glimmet-history-XXXXXX";
    const int named = ::mkostemp(pattern.data(), O_CLOEXEC);
    if (named >= 0)
        ::unlink(pattern.c_str());
    return named;
}

}  // namespace

std::shared_ptr<SpillFile> SpillFile::Create()
{
    int fd = -1;
    const char* folder = std::getenv("TMPDIR");
    if (folder != nullptr && folder[0] != '\0')
        fd = OpenUnnamed(folder);
    if (fd < 0)
        fd = OpenUnnamed("/tmp");
    if (fd < 0)
        return nullptr;
    return std::shared_ptr<SpillFile>(new SpillFile(fd));
}

SpillFile::~SpillFile()
{
    ::close(fd_);
}

int64_t SpillFile::Reserve(int64_t bytes)
{
    std::lock_guard guard(lock_);
    stored_ += bytes;
    auto slot = free_.find(bytes);
    if (slot != free_.end() && !slot->second.empty()) {
        const int64_t offset = slot->second.back();
        slot->second.pop_back();
        return offset;
    }
    const int64_t offset = end_;
    end_ += bytes;
    return offset;
}

int64_t SpillFile::Write(const void* data, int64_t bytes)
{
    const int64_t offset = Reserve(bytes);
    const char* from = static_cast<const char*>(data);
    int64_t done = 0;
    while (done < bytes) {
        const ssize_t wrote = ::pwrite(fd_, from + done, size_t(bytes - done), off_t(offset + done));
        if (wrote < 0 && errno == EINTR)
            continue;
        if (wrote <= 0) {
            Release(offset, bytes);
            return -1;
        }
        done += wrote;
    }
    return offset;
}

bool SpillFile::Read(int64_t offset, void* data, int64_t bytes) const
{
    char* to = static_cast<char*>(data);
    int64_t done = 0;
    while (done < bytes) {
        const ssize_t got = ::pread(fd_, to + done, size_t(bytes - done), off_t(offset + done));
        if (got < 0 && errno == EINTR)
            continue;
        if (got <= 0)
            return false;
        done += got;
    }
    return true;
}

void SpillFile::Release(int64_t offset, int64_t bytes)
{
#ifdef FALLOC_FL_PUNCH_HOLE
    // Hand the disk space back now; the offset is reused later.
    ::fallocate(fd_, FALLOC_FL_PUNCH_HOLE | FALLOC_FL_KEEP_SIZE, off_t(offset), off_t(bytes));
#endif
    std::lock_guard guard(lock_);
    stored_ -= bytes;
    free_[bytes].push_back(offset);
}

int64_t SpillFile::StoredBytes() const
{
    std::lock_guard guard(lock_);
    return stored_;
}

}  // namespace glimmet
