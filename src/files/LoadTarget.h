#pragma once

#include <cstdint>
#include <filesystem>
#include <string>

#include "support/Status.h"

namespace glimmet {

class ChannelManager;

/// What loading a sound file needs of the document window it loads into
/// (QuillexWindow implements it; tests implement it without widgets).
/// Every call comes from the window's own thread, while it loads.
class LoadTarget {
public:
    virtual ~LoadTarget() = default;

    /// The document the channels go into (its views follow it); null when
    /// the window has none, in which case audio tracks are skipped.
    virtual ChannelManager* DocumentManager() = 0;
    /// The append-on-load flag: when set, the file's channels go after the
    /// existing ones and the title stays.
    virtual bool IsAppendOnLoad() = 0;
    /// The file's channels replaced the document's: nothing done to the old
    /// ones can be undone any more, and the document is as on disk.
    virtual void DocumentReplaced() = 0;
    /// Replaces the window's file entry by this one (links already followed).
    virtual void ReplaceFileEntry(const std::filesystem::path& entry) = 0;
    /// Sets the window's title ("Glimmet - " and the file's name).
    virtual void SetWindowTitle(const std::string& title) = 0;
    /// Posts a bare command (no fields) to the window itself, for handling
    /// after the load has returned.
    virtual status_t PostToSelf(uint32_t what) = 0;
};

}  // namespace glimmet
