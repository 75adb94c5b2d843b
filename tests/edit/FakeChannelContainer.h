#pragma once

#include <memory>
#include <vector>

#include "edit/ChannelContainer.h"
#include "edit/ChannelView.h"

namespace glimmet::test {

/// A channel view that only counts its redraws.
class FakeChannelView : public ChannelView {
public:
    explicit FakeChannelView(Channel* channel) : channel(channel) {}

    bool IsFocus() const override { return focus; }
    void Update() override { updates++; }

    Channel* channel;
    bool focus = false;
    int updates = 0;
};

/// A container without widgets: a cursor frame, a focused index and a list
/// of fake views that the tests can inspect.
class FakeChannelContainer : public ChannelContainer {
public:
    int64_t CursorFrame() override { return cursor; }
    int32_t FocusedChannel() override { return focused; }
    int32_t CountChannelViews() override { return int32_t(views.size()); }

    ChannelView* ChannelViewAt(int32_t index) override
    {
        if (index < 0 || size_t(index) >= views.size())
            return nullptr;
        return views[size_t(index)].get();
    }

    ChannelView* AddChannel(Channel* channel) override
    {
        views.push_back(std::make_unique<FakeChannelView>(channel));
        return views.back().get();
    }

    void AddChannelAt(Channel* channel, int32_t index) override
    {
        if (index < 0 || size_t(index) > views.size())
            index = int32_t(views.size());
        views.insert(views.begin() + index, std::make_unique<FakeChannelView>(channel));
    }

    void RemoveSampleView(ChannelView* view) override
    {
        for (size_t i = 0; i < views.size(); i++) {
            if (views[i].get() == view) {
                views.erase(views.begin() + long(i));
                return;
            }
        }
    }

    void RemoveSampleViewAt(int32_t index) override
    {
        if (index >= 0 && size_t(index) < views.size())
            views.erase(views.begin() + index);
    }

    void UpdateAll() override { updateAllCalls++; }

    FakeChannelView* View(size_t index) { return views[index].get(); }

    int64_t cursor = 0;
    int32_t focused = 0;
    int updateAllCalls = 0;
    std::vector<std::unique_ptr<FakeChannelView>> views;
};

}  // namespace glimmet::test
