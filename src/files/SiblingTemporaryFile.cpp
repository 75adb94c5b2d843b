#include "files/SiblingTemporaryFile.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <random>

#include "files/ErrnoStatus.h"
#include "files/WriteFaults.h"

namespace glimmet {

namespace {

constexpr const char* kNameStart = ".glimmet-";
constexpr const char* kNameEnd = ".tmp";

std::filesystem::path DirectoryOf(const std::filesystem::path& file)
{
    const std::filesystem::path parent = file.parent_path();
    return parent.empty() ? std::filesystem::path(".") : parent;
}

/// FNV-1a: stable across runs and builds, which std::hash need not be.
uint32_t NameHash(const std::string& name)
{
    uint32_t hash = 2166136261u;
    for (const char c : name) {
        hash ^= uint8_t(c);
        hash *= 16777619u;
    }
    return hash;
}

std::string Hex8(uint32_t value)
{
    char text[9];
    std::snprintf(text, sizeof(text), "%08x", unsigned(value));
    return text;
}

uint32_t RandomPart()
{
    static thread_local std::mt19937 generator{std::random_device{}()};
    return uint32_t(generator());
}

bool SameFile(const struct stat& a, const struct stat& b)
{
    return a.st_dev == b.st_dev && a.st_ino == b.st_ino;
}

/// Whether no save holds the file at path (opened as fd), so that it may go.
bool IsAbandoned(int fd, const std::filesystem::path& path)
{
    struct stat opened {};
    struct stat named {};
    if (fstat(fd, &opened) != 0 || !S_ISREG(opened.st_mode))
        return false;
    // A lock that cannot be taken for any reason (held, or not offered by
    // the file system) leaves the file alone.
    if (flock(fd, LOCK_EX | LOCK_NB) != 0)
        return false;
    return lstat(path.c_str(), &named) == 0 && SameFile(opened, named);
}

}  // namespace

std::string SiblingTemporaryFile::PrefixFor(const std::filesystem::path& target)
{
    return kNameStart + Hex8(NameHash(target.filename().string())) + "-";
}

bool SiblingTemporaryFile::Belongs(const std::string& name, const std::filesystem::path& target)
{
    const std::string prefix = PrefixFor(target);
    const std::string end = kNameEnd;
    return name.size() == kNameLength && name.compare(0, prefix.size(), prefix) == 0
        && name.compare(name.size() - end.size(), end.size(), end) == 0;
}

status_t SiblingTemporaryFile::Create(const std::filesystem::path& target, mode_t mode, int* fd,
                                      std::filesystem::path* temporary)
{
    *fd = -1;
    const std::filesystem::path directory = DirectoryOf(target);
    const std::string prefix = PrefixFor(target);
    for (int attempt = 0; attempt < kNameAttempts; ++attempt) {
        const std::filesystem::path candidate = directory / (prefix + Hex8(RandomPart()) + kNameEnd);
        if (const int injected = WriteFaults::ErrorFor(WriteFaults::Step::Create))
            return ExactStatusFromErrno(injected);
        const int opened = open(candidate.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, mode);
        if (opened < 0 && errno == EEXIST)
            continue;
        if (opened < 0)
            return ExactStatusFromErrno(errno);
        if (!LockAndConfirm(opened, candidate)) {
            close(opened);
            continue;
        }
        *fd = opened;
        *temporary = candidate;
        return B_OK;
    }
    return ExactStatusFromErrno(EEXIST);
}

bool SiblingTemporaryFile::LockAndConfirm(int fd, const std::filesystem::path& path)
{
    // Another save cleaning up may have taken the new file for abandoned
    // between its creation and this lock, and removed it: then the name no
    // longer leads to it, and another name is tried.
    while (flock(fd, LOCK_EX) != 0) {
        if (errno != EINTR)
            break;  // no locks here: nobody can take it for abandoned either
    }
    struct stat opened {};
    struct stat named {};
    return fstat(fd, &opened) == 0 && lstat(path.c_str(), &named) == 0 && SameFile(opened, named);
}

int SiblingTemporaryFile::RemoveAbandoned(const std::filesystem::path& target)
{
    const std::filesystem::path directory = DirectoryOf(target);
    DIR* listing = opendir(directory.c_str());
    if (listing == nullptr)
        return 0;
    int removed = 0;
    while (const dirent* entry = readdir(listing)) {
        if (!Belongs(entry->d_name, target))
            continue;
        const std::filesystem::path path = directory / entry->d_name;
        const int fd = open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC);
        if (fd < 0)
            continue;
        if (IsAbandoned(fd, path) && unlink(path.c_str()) == 0)
            ++removed;
        close(fd);
    }
    closedir(listing);
    return removed;
}

}  // namespace glimmet
