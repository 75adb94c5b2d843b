#pragma once

#include <cstdint>
#include <filesystem>

#include "support/Status.h"

namespace glimmet {

class ChannelManager;
class FrameWriter;
class HistoryManager;
class SaveTarget;

/// Saves a document as a stereo, 16-bit, 44100 Hz WAV file: the whole mix of
/// its channels with their pan and mute settings. A window that implements
/// SaveTarget saves with `return DocumentSaver::SaveFile(path, *this);` and
/// prints "error writing file. (%s)\n" when that fails.
class DocumentSaver {
public:
    /// Stereo frames per write buffer (4096 bytes).
    static constexpr int64_t kFramesPerBuffer = 1024;
    static constexpr const char* kWavType = "audio/x-wav";

    /// Writes target's document to file (following a link to the file it
    /// names). Once the file's track exists the history is marked saved and
    /// the save item disabled, whatever happens next. A failed write leaves
    /// the old file as it was and prints "Error releasing tracks: %s\n".
    /// Returns the result of setting the file's type attribute to
    /// "audio/x-wav", not that of the writing.
    static status_t SaveFile(const std::filesystem::path& file, SaveTarget& target);
    /// The same for a document on its own: history (may be null) is marked
    /// saved, and *created (may be null) set, once the file's track exists.
    static status_t SaveFile(const std::filesystem::path& file, ChannelManager* document, HistoryManager* history,
                             bool* created = nullptr);

    /// Mixes the whole document from frame 0 into writer, kFramesPerBuffer
    /// frames at a time, holding the document lock throughout; stops at the
    /// first write error, which it returns. Leaves the current frame at the
    /// end of what was mixed. A null manager writes nothing.
    static status_t WriteDocument(ChannelManager* manager, FrameWriter& writer);

private:
    /// The type attribute's result; B_ENTRY_NOT_FOUND, B_IS_A_DIRECTORY or
    /// B_BAD_VALUE when no regular file is there to take it.
    static status_t SetTypeOfSavedFile(const std::filesystem::path& destination);
    static std::filesystem::path FollowLinks(const std::filesystem::path& file);
};

}  // namespace glimmet
