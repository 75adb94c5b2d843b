#pragma once

#include <sys/types.h>

#include <filesystem>
#include <string>

#include "support/Status.h"

namespace glimmet {

/// The hidden temporary file a save writes beside its target before renaming
/// it over the target.
///
/// Names are short whatever the target's (".glimmet-HHHHHHHH-RRRRRRRR.tmp":
/// a hash of the target's name, then a random part), so that a target with
/// the longest legal name still has room for one, and a temporary file can
/// be told apart as ours and as belonging to its target.
///
/// A save holds an exclusive flock on its temporary file for as long as it
/// writes. A temporary file nobody holds was left by a save that was killed,
/// and is removed the next time its target is saved. No age is needed to
/// tell: the kernel drops a killed process's locks at once.
class SiblingTemporaryFile {
public:
    /// Names tried before giving up.
    static constexpr int kNameAttempts = 100;
    /// Length of every temporary file's name.
    static constexpr size_t kNameLength = 30;

    /// Creates a new, empty temporary file beside target with the given
    /// permissions (umask applied), open for writing in *fd and locked until
    /// *fd is closed. Returns the C library's error when it cannot.
    static status_t Create(const std::filesystem::path& target, mode_t mode, int* fd,
                           std::filesystem::path* temporary);

    /// Removes the temporary files of earlier saves to target that no save
    /// holds any more. Returns how many it removed.
    static int RemoveAbandoned(const std::filesystem::path& target);

    /// ".glimmet-HHHHHHHH-": what the names of target's temporary files
    /// start with.
    static std::string PrefixFor(const std::filesystem::path& target);
    /// Whether name is that of one of target's temporary files.
    static bool Belongs(const std::string& name, const std::filesystem::path& target);

private:
    static bool LockAndConfirm(int fd, const std::filesystem::path& path);
};

}  // namespace glimmet
