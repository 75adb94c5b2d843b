#include "files/FileTypeAttribute.h"

#include <sys/xattr.h>

#include <cerrno>

#include "files/ErrnoStatus.h"

namespace glimmet {

namespace {

// More than any MIME type needs.
constexpr size_t kMaxTypeLength = 256;

}  // namespace

status_t SetFileType(const std::filesystem::path& file, const std::string& mimeType)
{
    if (setxattr(file.c_str(), kFileTypeAttribute, mimeType.data(), mimeType.size(), 0) == 0)
        return B_OK;
    if (errno == ENOTSUP || errno == EOPNOTSUPP)
        return B_OK;
    return StatusFromErrno(errno);
}

std::string FileType(const std::filesystem::path& file)
{
    char value[kMaxTypeLength];
    const ssize_t length = getxattr(file.c_str(), kFileTypeAttribute, value, sizeof(value));
    if (length <= 0)
        return {};
    return std::string(value, size_t(length));
}

}  // namespace glimmet
