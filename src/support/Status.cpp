#include "support/Status.h"

#include <cstring>

namespace glimmet {

status_t StatusFromSystemError(int error)
{
    if (error == 0)
        return B_OK;
    if (error < 0 || error >= kPosixErrorCount)
        return B_ERROR;
    return kPosixErrorBase + error;
}

const char* StatusText(status_t status)
{
    if (status > kPosixErrorBase && status < kPosixErrorBase + kPosixErrorCount)
        return std::strerror(int(status - kPosixErrorBase));
    switch (status) {
        case B_OK: return "No error";
        case B_ERROR: return "General system error";
        case B_NO_MEMORY: return "Out of memory";
        case B_IO_ERROR: return "I/O error";
        case B_PERMISSION_DENIED: return "Permission denied";
        case B_BAD_INDEX: return "Index not in range for the data set";
        case B_BAD_TYPE: return "Bad argument type passed to function";
        case B_BAD_VALUE: return "Bad value";
        case B_NAME_NOT_FOUND: return "Name not found";
        case B_TIMED_OUT: return "Operation timed out";
        case B_NO_INIT: return "Initialization failed";
        case B_BAD_DATA: return "Bad data";
        case B_ENTRY_NOT_FOUND: return "No such file or directory";
        case B_IS_A_DIRECTORY: return "Is a directory";
        case B_DEVICE_FULL: return "No space left on device";
        case B_NOT_A_REGULAR_FILE: return "Not a regular file";
        case B_MEDIA_BAD_FORMAT: return "Bad media format";
        case B_MEDIA_NO_HANDLER: return "No handler for this media format";
        case B_LAST_BUFFER_ERROR: return "Last buffer";
        case B_MEDIA_BAD_NODE: return "Bad media node";
        case B_MEDIA_NOT_CONNECTED: return "Media nodes not connected";
        case B_MEDIA_SYSTEM_FAILURE: return "Media system failure";
        case B_MEDIA_BAD_SOURCE: return "Bad media source";
        case B_MEDIA_BAD_DESTINATION: return "Bad media destination";
        case B_MEDIA_ALREADY_CONNECTED: return "Media nodes already connected";
        default: return "Unknown error";
    }
}

}  // namespace glimmet
