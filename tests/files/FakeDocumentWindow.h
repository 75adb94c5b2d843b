#pragma once

#include <cstdint>
#include <filesystem>
#include <string>
#include <vector>

#include "edit/ChannelContainer.h"
#include "edit/HistoryManager.h"
#include "files/LoadTarget.h"
#include "files/SaveTarget.h"
#include "sound/ChannelManager.h"

namespace glimmet::test {

/// A container view without widgets: it only keeps the list of channels it
/// was asked to show.
class FakeContainer : public ChannelContainer {
public:
    int64_t CursorFrame() override { return 0; }
    int32_t FocusedChannel() override { return 0; }
    int32_t CountChannelViews() override { return int32_t(shown.size()); }
    ChannelView* ChannelViewAt(int32_t) override { return nullptr; }
    ChannelView* AddChannel(Channel* channel) override
    {
        shown.push_back(channel);
        return nullptr;
    }
    void AddChannelAt(Channel* channel, int32_t index) override { shown.insert(shown.begin() + index, channel); }
    void RemoveSampleView(ChannelView*) override {}
    void RemoveSampleViewAt(int32_t index) override
    {
        if (index >= 0 && size_t(index) < shown.size())
            shown.erase(shown.begin() + index);
    }
    void UpdateAll() override {}

    std::vector<Channel*> shown;
};

/// The pieces of a document window that loading and saving touch.
class FakeDocumentWindow : public LoadTarget, public SaveTarget {
public:
    ChannelManager* DocumentManager() override { return withDocument ? &manager : nullptr; }
    ChannelContainer* DocumentContainer() override { return withDocument ? &container : nullptr; }
    HistoryManager* DocumentHistory() override { return &history; }
    bool IsAppendOnLoad() override { return appendOnLoad; }
    void ReplaceFileEntry(const std::filesystem::path& path) override { entry = path; }
    void SetWindowTitle(const std::string& text) override { title = text; }
    status_t PostToSelf(uint32_t what) override
    {
        posted.push_back(what);
        return B_OK;
    }
    void SetSaveItemEnabled(bool enabled) override { saveItemEnabled = enabled; }

    ChannelManager manager{nullptr};
    FakeContainer container;
    HistoryManager history;
    bool withDocument = true;
    bool appendOnLoad = false;
    bool saveItemEnabled = true;
    std::filesystem::path entry;
    std::string title = "untitled";
    std::vector<uint32_t> posted;
};

}  // namespace glimmet::test
