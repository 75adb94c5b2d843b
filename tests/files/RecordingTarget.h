#pragma once

#include <cstdint>
#include <filesystem>
#include <string>
#include <vector>

#include "../edit/DocumentMirror.h"
#include "edit/HistoryManager.h"
#include "files/LoadTarget.h"
#include "files/SaveTarget.h"
#include "sound/ChannelManager.h"

namespace glimmet::test {

/// Records what loading and saving tell the window they work for (its
/// title, file entry, posted commands and save item), for the tests of that
/// part of loading and saving; the document itself needs no window.
class RecordingTarget : public LoadTarget, public SaveTarget {
public:
    ChannelManager* DocumentManager() override { return withDocument ? &manager : nullptr; }
    HistoryManager* DocumentHistory() override { return &history; }
    bool IsAppendOnLoad() override { return appendOnLoad; }
    void DocumentReplaced() override { ++replacements; }
    void ReplaceFileEntry(const std::filesystem::path& path) override { entry = path; }
    void SetWindowTitle(const std::string& text) override { title = text; }
    status_t PostToSelf(uint32_t what) override
    {
        posted.push_back(what);
        return B_OK;
    }
    void SetSaveItemEnabled(bool enabled) override { saveItemEnabled = enabled; }

    ChannelManager manager{nullptr};
    DocumentMirror mirror{manager};
    HistoryManager history;
    bool withDocument = true;
    bool appendOnLoad = false;
    bool saveItemEnabled = true;
    std::filesystem::path entry;
    std::string title = "untitled";
    std::vector<uint32_t> posted;
    int replacements = 0;  // calls of DocumentReplaced
};

}  // namespace glimmet::test
