#pragma once

#include <cstdint>

namespace glimmet {

/// A 32-bit status code: 0 for success, negative for a failure. The numeric
/// values are those of the platform the editor's diagnostics were first
/// written for, because texts and tests compare them.
using status_t = int32_t;

inline constexpr status_t kGeneralErrorBase = INT32_MIN;
inline constexpr status_t kMediaErrorBase = kGeneralErrorBase + 0x4000;
inline constexpr status_t kStorageErrorBase = kGeneralErrorBase + 0x6000;
/// C library errors that have no code of their own below keep their errno
/// value above this base, so that their text is the C library's own.
inline constexpr status_t kPosixErrorBase = kGeneralErrorBase + 0x7000;
inline constexpr int kPosixErrorCount = 0x1000;

inline constexpr status_t B_OK = 0;
inline constexpr status_t B_ERROR = -1;
inline constexpr status_t B_NO_MEMORY = kGeneralErrorBase + 0;
inline constexpr status_t B_IO_ERROR = kGeneralErrorBase + 1;
inline constexpr status_t B_PERMISSION_DENIED = kGeneralErrorBase + 2;
inline constexpr status_t B_BAD_INDEX = kGeneralErrorBase + 3;
inline constexpr status_t B_BAD_TYPE = kGeneralErrorBase + 4;
inline constexpr status_t B_BAD_VALUE = kGeneralErrorBase + 5;
inline constexpr status_t B_NAME_NOT_FOUND = kGeneralErrorBase + 7;
inline constexpr status_t B_TIMED_OUT = kGeneralErrorBase + 9;
inline constexpr status_t B_NO_INIT = kGeneralErrorBase + 13;
inline constexpr status_t B_BAD_DATA = kGeneralErrorBase + 16;

inline constexpr status_t B_ENTRY_NOT_FOUND = kStorageErrorBase + 3;
inline constexpr status_t B_IS_A_DIRECTORY = kStorageErrorBase + 9;
inline constexpr status_t B_DEVICE_FULL = kStorageErrorBase + 10;
/// Something other than a regular file (a device, a FIFO, a socket) is where
/// a file was to be written; it is left alone.
inline constexpr status_t B_NOT_A_REGULAR_FILE = kStorageErrorBase + 0x40;

inline constexpr status_t B_MEDIA_BAD_FORMAT = kMediaErrorBase + 0x10;
inline constexpr status_t B_MEDIA_NO_HANDLER = kMediaErrorBase + 0x1a;
inline constexpr status_t B_LAST_BUFFER_ERROR = kMediaErrorBase + 0x24;
inline constexpr status_t B_MEDIA_BAD_NODE = kMediaErrorBase + 0x101;
inline constexpr status_t B_MEDIA_NOT_CONNECTED = kMediaErrorBase + 0x10a;
inline constexpr status_t B_MEDIA_SYSTEM_FAILURE = kMediaErrorBase + 0x100;
inline constexpr status_t B_MEDIA_BAD_SOURCE = kMediaErrorBase + 0x107;
inline constexpr status_t B_MEDIA_BAD_DESTINATION = kMediaErrorBase + 0x108;
inline constexpr status_t B_MEDIA_ALREADY_CONNECTED = kMediaErrorBase + 0x109;

/// The status that carries the C library's errno value error unchanged (B_OK
/// for 0, B_ERROR for a value out of range); its text is strerror's.
status_t StatusFromSystemError(int error);

/// The human-readable text of a status code, as printed by diagnostics
/// ("Error doing undo: %s\n"). Never returns null; unknown codes get a
/// generic text.
const char* StatusText(status_t status);

}  // namespace glimmet
