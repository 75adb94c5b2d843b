#include "sound/SpillFile.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <fcntl.h>
#include <string>
#include <sys/uio.h>
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

// Pieces per preadv call: the system's limit on an I/O vector.
constexpr size_t kMaxPiecesPerRead = IOV_MAX < 1024 ? size_t(IOV_MAX) : 1024;

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

bool SpillFile::TakeRun(Runs& runs, int64_t bytes, int64_t* offset)
{
    auto slot = runs.find(bytes);
    if (slot == runs.end() || slot->second.empty())
        return false;
    *offset = slot->second.back();
    slot->second.pop_back();
    return true;
}

int64_t SpillFile::Reserve(int64_t bytes)
{
    std::lock_guard guard(lock_);
    stored_ += bytes;
    int64_t offset = 0;
    if (TakeRun(free_, bytes, &offset))
        return offset;
    // Space not punched yet is as good: it is about to be overwritten.
    if (TakeRun(released_, bytes, &offset)) {
        unpunched_ -= bytes;
        return offset;
    }
    offset = end_;
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
    Piece piece{offset, data, bytes};
    return ReadRun(&piece, 1);
}

bool SpillFile::ReadRun(const Piece* first, size_t count) const
{
    std::vector<iovec> vector(count);
    int64_t total = 0;
    for (size_t i = 0; i < count; i++) {
        vector[i] = iovec{first[i].data, size_t(first[i].bytes)};
        total += first[i].bytes;
    }
    int64_t done = 0;
    size_t next = 0;  // the first piece not read whole
    while (done < total) {
        const ssize_t got = ::preadv(fd_, vector.data() + next, int(count - next), off_t(first->offset + done));
        if (got < 0 && errno == EINTR)
            continue;
        if (got <= 0)
            return false;
        done += got;
        // A short read: skip what arrived, and go on from the middle of the
        // piece it stopped in.
        size_t left = size_t(got);
        while (left > 0 && left >= vector[next].iov_len)
            left -= vector[next++].iov_len;
        if (left > 0) {
            vector[next].iov_base = static_cast<char*>(vector[next].iov_base) + left;
            vector[next].iov_len -= left;
        }
    }
    return true;
}

bool SpillFile::ReadMany(std::vector<Piece>& pieces) const
{
    std::sort(pieces.begin(), pieces.end(), [](const Piece& a, const Piece& b) { return a.offset < b.offset; });
    bool ok = true;
    size_t first = 0;
    while (first < pieces.size()) {
        size_t last = first;
        while (last + 1 < pieces.size() && last + 1 - first < kMaxPiecesPerRead
               && pieces[last].offset + pieces[last].bytes == pieces[last + 1].offset)
            ++last;
        ok = ReadRun(&pieces[first], last - first + 1) && ok;
        first = last + 1;
    }
    return ok;
}

void SpillFile::Release(int64_t offset, int64_t bytes)
{
    std::lock_guard guard(lock_);
    stored_ -= bytes;
    unpunched_ += bytes;
    released_[bytes].push_back(offset);
}

void SpillFile::PunchReleased()
{
    Runs punching;
    {
        // Out of reach of Reserve while the holes are made, so that no
        // write lands in a run being punched.
        std::lock_guard guard(lock_);
        punching.swap(released_);
        unpunched_ = 0;
    }
    if (punching.empty())
        return;
#ifdef FALLOC_FL_PUNCH_HOLE
    std::vector<std::pair<int64_t, int64_t>> runs;  // offset, bytes
    for (const auto& [bytes, offsets] : punching) {
        for (const int64_t offset : offsets)
            runs.emplace_back(offset, bytes);
    }
    std::sort(runs.begin(), runs.end());
    // Neighbouring runs go in one call.
    size_t first = 0;
    while (first < runs.size()) {
        int64_t end = runs[first].first + runs[first].second;
        size_t last = first;
        while (last + 1 < runs.size() && runs[last + 1].first == end)
            end += runs[++last].second;
        ::fallocate(fd_, FALLOC_FL_PUNCH_HOLE | FALLOC_FL_KEEP_SIZE, off_t(runs[first].first),
            off_t(end - runs[first].first));
        first = last + 1;
    }
#endif
    std::lock_guard guard(lock_);
    for (auto& [bytes, offsets] : punching) {
        std::vector<int64_t>& free = free_[bytes];
        free.insert(free.end(), offsets.begin(), offsets.end());
    }
}

int64_t SpillFile::StoredBytes() const
{
    std::lock_guard guard(lock_);
    return stored_;
}

int64_t SpillFile::UnpunchedBytes() const
{
    std::lock_guard guard(lock_);
    return unpunched_;
}

}  // namespace glimmet
