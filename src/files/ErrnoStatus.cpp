#include "files/ErrnoStatus.h"

#include <cerrno>

namespace glimmet {

status_t StatusFromErrno(int error)
{
    switch (error) {
        case 0: return B_OK;
        case ENOMEM: return B_NO_MEMORY;
        case ENOENT:
        case ENOTDIR: return B_ENTRY_NOT_FOUND;
        case EISDIR: return B_IS_A_DIRECTORY;
        case EACCES:
        case EPERM:
        case EROFS: return B_PERMISSION_DENIED;
        case ENOSPC:
        case EDQUOT:
        case EFBIG: return B_DEVICE_FULL;
        case EIO: return B_IO_ERROR;
        case EINVAL: return B_BAD_VALUE;
        default: return B_ERROR;
    }
}

status_t ExactStatusFromErrno(int error)
{
    switch (error) {
        case ENOENT: return B_ENTRY_NOT_FOUND;
        case EISDIR: return B_IS_A_DIRECTORY;
        case EACCES: return B_PERMISSION_DENIED;
        case ENOSPC: return B_DEVICE_FULL;
        default: return StatusFromSystemError(error);
    }
}

}  // namespace glimmet
