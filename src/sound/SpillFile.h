#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <vector>

namespace glimmet {

/// A scratch file for sample blocks that are out of memory.
///
/// The file has no name from the moment it exists (O_TMPFILE, or a name
/// removed at once), so nothing is left on disk whatever way the program
/// ends; it is closed when the last holder lets go. Space given back by
/// Release is punched out of the file and reused for blocks of the same size.
/// Every member may be called from any thread.
class SpillFile {
public:
    /// A new file in $TMPDIR, or /tmp when that is unset or unusable; null
    /// when no file can be made.
    static std::shared_ptr<SpillFile> Create();
    ~SpillFile();
    SpillFile(const SpillFile&) = delete;
    SpillFile& operator=(const SpillFile&) = delete;

    /// Stores bytes bytes from data; their offset, or -1 when the write
    /// failed (a full disk).
    int64_t Write(const void* data, int64_t bytes);
    /// Reads back what Write stored at offset; false on a short read.
    bool Read(int64_t offset, void* data, int64_t bytes) const;
    /// Gives the space of a stored run back.
    void Release(int64_t offset, int64_t bytes);

    int Descriptor() const { return fd_; }
    /// Bytes of stored runs not released yet.
    int64_t StoredBytes() const;

private:
    explicit SpillFile(int fd) : fd_(fd) {}
    int64_t Reserve(int64_t bytes);

    const int fd_;
    mutable std::mutex lock_;
    int64_t end_ = 0;
    int64_t stored_ = 0;
    /// Released offsets by run size: most runs are whole blocks of one size.
    std::map<int64_t, std::vector<int64_t>> free_;
};

}  // namespace glimmet
