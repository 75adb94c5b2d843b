#include "files/SaveDestination.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <vector>

#include "files/ErrnoStatus.h"

namespace glimmet {

namespace {

/// The text of a link (a path that may be relative to the link's folder).
status_t ReadLink(const std::filesystem::path& link, std::filesystem::path* target)
{
    std::vector<char> text(PATH_MAX + 1);
    const ssize_t length = readlink(link.c_str(), text.data(), text.size());
    if (length < 0)
        return ExactStatusFromErrno(errno);
    if (size_t(length) >= text.size())
        return ExactStatusFromErrno(ENAMETOOLONG);
    *target = std::filesystem::path(std::string(text.data(), size_t(length)));
    return B_OK;
}

}  // namespace

status_t SaveDestination::Resolve(const std::filesystem::path& file, std::filesystem::path* destination)
{
    std::filesystem::path current = file;
    for (int followed = 0; followed <= kMaxLinks; ++followed) {
        struct stat info {};
        // Anything but a link (including nothing at all, or a path that
        // cannot be looked at) is written as it is; creating the file will
        // name any problem.
        if (lstat(current.c_str(), &info) != 0 || !S_ISLNK(info.st_mode)) {
            *destination = current;
            return B_OK;
        }
        std::filesystem::path target;
        const status_t status = ReadLink(current, &target);
        if (status != B_OK)
            return status;
        current = target.is_absolute() ? target : current.parent_path() / target;
    }
    return ExactStatusFromErrno(ELOOP);
}

status_t SaveDestination::CheckReplaceable(const std::filesystem::path& destination, bool* exists,
                                           struct stat* existing)
{
    struct stat info {};
    *exists = false;
    if (lstat(destination.c_str(), &info) != 0)
        return errno == ENOENT ? B_OK : ExactStatusFromErrno(errno);
    *exists = true;
    if (existing != nullptr)
        *existing = info;
    if (S_ISDIR(info.st_mode))
        return B_IS_A_DIRECTORY;
    if (!S_ISREG(info.st_mode))
        return B_NOT_A_REGULAR_FILE;
    if (access(destination.c_str(), W_OK) != 0)
        return ExactStatusFromErrno(errno);
    // The superuser passes access() whatever the mode: a file its owner made
    // read-only is still not to be replaced behind the owner's back.
    if ((info.st_mode & S_IWUSR) == 0)
        return ExactStatusFromErrno(EACCES);
    return B_OK;
}

}  // namespace glimmet
