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
/// Release is reused for runs of the same size, and PunchReleased hands its
/// disk space back. Every member may be called from any thread.
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

    /// One stored run to read back, and where to.
    struct Piece {
        int64_t offset = 0;
        void* data = nullptr;
        int64_t bytes = 0;
    };
    /// Reads back many stored runs, as few system calls as their places in
    /// the file allow (runs that lie end to end are read in one). Sorts
    /// pieces by offset. False when any of them could not be read whole.
    bool ReadMany(std::vector<Piece>& pieces) const;

    /// Gives the space of a stored run back. Cheap: no system call, so that
    /// reading many blocks back does not wait on the disk; the space is
    /// reused by later writes, and PunchReleased frees it on disk.
    void Release(int64_t offset, int64_t bytes);
    /// Hands the disk space of every run released since the last call back
    /// to the system (a slow call: the file system may first write out
    /// what those runs held, so it belongs on a worker thread).
    void PunchReleased();

    int Descriptor() const { return fd_; }
    /// Bytes of stored runs not released yet.
    int64_t StoredBytes() const;
    /// Bytes released and not punched yet.
    int64_t UnpunchedBytes() const;

private:
    using Runs = std::map<int64_t, std::vector<int64_t>>;  // offsets by run size

    explicit SpillFile(int fd) : fd_(fd) {}
    int64_t Reserve(int64_t bytes);
    static bool TakeRun(Runs& runs, int64_t bytes, int64_t* offset);
    /// Reads count pieces lying end to end in the file, from first on.
    bool ReadRun(const Piece* first, size_t count) const;

    const int fd_;
    mutable std::mutex lock_;
    int64_t end_ = 0;
    int64_t stored_ = 0;
    int64_t unpunched_ = 0;
    /// Released space already punched out, and space released since.
    Runs free_;
    Runs released_;
};

}  // namespace glimmet
