#pragma once

namespace glimmet {

class ChannelManager;
class HistoryManager;

/// What saving needs of the document window whose document it writes
/// (QuillexWindow implements it; tests implement it without widgets).
/// Called from the window's own thread.
class SaveTarget {
public:
    virtual ~SaveTarget() = default;

    /// The document to write; null writes an empty document.
    virtual ChannelManager* DocumentManager() = 0;
    /// The history to mark as saved; may be null.
    virtual HistoryManager* DocumentHistory() = 0;
    /// Enables or disables the window's "Save" menu item.
    virtual void SetSaveItemEnabled(bool enabled) = 0;
};

}  // namespace glimmet
