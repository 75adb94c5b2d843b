#pragma once

#include <filesystem>
#include <string>

#include "support/Status.h"

namespace glimmet {

/// The extended attribute that holds a file's MIME type (the freedesktop
/// convention).
inline constexpr const char* kFileTypeAttribute = "user.mime_type";

/// Sets the file's type attribute. A file system without user attributes is
/// not an error (B_OK); a missing file is B_ENTRY_NOT_FOUND.
status_t SetFileType(const std::filesystem::path& file, const std::string& mimeType);

/// The file's type attribute; empty when it has none.
std::string FileType(const std::filesystem::path& file);

}  // namespace glimmet
