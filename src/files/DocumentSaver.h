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
/// prints "error writing file. (%s)\n" with StatusText when that fails.
class DocumentSaver {
public:
    /// Stereo frames per write buffer (4096 bytes).
    static constexpr int64_t kFramesPerBuffer = 1024;
    static constexpr const char* kWavType = "audio/x-wav";

    /// Writes target's document to file (following a link to the file it
    /// names, even one that does not exist yet). Only once all of it is in
    /// the file, in the old file's place, is the history marked saved and the
    /// save item disabled; a save that fails anywhere (creating, writing,
    /// flushing, renaming, or a destination that may not be replaced)
    /// enables it, leaves the history and whatever was at file as they were,
    /// and returns that failure, with the C library's error where one is
    /// the cause. A save that worked returns the result of setting the
    /// file's type attribute to "audio/x-wav".
    static status_t SaveFile(const std::filesystem::path& file, SaveTarget& target);
    /// The same for a document on its own: history (may be null) is marked
    /// saved, and *written (may be null) set, once the file is complete.
    static status_t SaveFile(const std::filesystem::path& file, ChannelManager* document, HistoryManager* history,
                             bool* written = nullptr);

    /// Mixes the whole document from frame 0 into writer, kFramesPerBuffer
    /// frames at a time, holding the document lock throughout; stops at the
    /// first write error, which it returns. Leaves the current frame at the
    /// end of what was mixed. A null manager writes nothing.
    static status_t WriteDocument(ChannelManager* manager, FrameWriter& writer);

private:
    /// The type attribute's result; B_ENTRY_NOT_FOUND, B_IS_A_DIRECTORY or
    /// B_BAD_VALUE when no regular file is there to take it.
    static status_t SetTypeOfSavedFile(const std::filesystem::path& destination);
    /// Writes the document into a new file at destination; the writer's
    /// first failure, or B_OK.
    static status_t WriteFile(const std::filesystem::path& destination, ChannelManager* document);
};

}  // namespace glimmet
