#pragma once

#include <filesystem>

#include "support/Status.h"

struct stat;

namespace glimmet {

/// Where a save really writes, and whether it may replace what is there.
///
/// Links are followed to the file they name, even one that does not exist
/// yet (saving then creates it; the link stays). Only a regular file that the
/// user may write is ever replaced: a directory, device, FIFO or socket is
/// refused, and so is a write-protected file.
class SaveDestination {
public:
    /// Links followed before giving up (as the kernel does).
    static constexpr int kMaxLinks = 40;

    /// The path file's links lead to; file itself when it is no link.
    /// Fails only for a link that cannot be read or a loop of links.
    static status_t Resolve(const std::filesystem::path& file, std::filesystem::path* destination);

    /// B_OK when nothing is at destination (*exists false) or a regular file
    /// the user may replace is (*exists true, *existing its status).
    /// B_IS_A_DIRECTORY or B_NOT_A_REGULAR_FILE for anything else there;
    /// "Permission denied" for a file without its owner's write permission,
    /// even for the superuser (to whom access() grants everything), and the
    /// C library's error when access() refuses. existing may be null.
    static status_t CheckReplaceable(const std::filesystem::path& destination, bool* exists,
                                     struct stat* existing);
};

}  // namespace glimmet
