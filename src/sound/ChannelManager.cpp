#include "sound/ChannelManager.h"

#include <algorithm>
#include <mutex>

#include "sound/Channel.h"
#include "sound/DocumentChange.h"
#include "sound/DocumentWindow.h"
#include "sound/Mixer.h"
#include "support/Message.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"

namespace glimmet {

ChannelManager::ChannelManager(DocumentWindow* window)
    : mixer_(std::make_unique<Mixer>(this, Mixer::Sizing::kGrowing)), window_(window)
{
}

ChannelManager::~ChannelManager() = default;

Channel* ChannelManager::AddChannel(std::unique_ptr<Channel> channel)
{
    Channel* added = channel.get();
    if (added == nullptr)
        return nullptr;
    int32_t index;
    {
        std::lock_guard guard(lock_);
        channels_.push_back(std::move(channel));
        index = int32_t(channels_.size()) - 1;
        IndexAppendedLocked();
    }
    NotifyChannel(DocumentChange::kChannelAdded, index);
    return added;
}

std::unique_ptr<Channel> ChannelManager::AddChannel(std::unique_ptr<Channel> channel, int32_t index)
{
    if (channel == nullptr)
        return channel;
    {
        std::lock_guard guard(lock_);
        if (index < 0 || size_t(index) > channels_.size())
            return channel;
        channels_.insert(channels_.begin() + index, std::move(channel));
        if (size_t(index) + 1 == channels_.size())
            IndexAppendedLocked();
        else
            indexValid_ = false;
    }
    NotifyChannel(DocumentChange::kChannelAdded, index);
    return nullptr;
}

Channel* ChannelManager::ChannelWithId(uint64_t id)
{
    std::lock_guard guard(lock_);
    const int32_t index = IndexOfIdLocked(id);
    return index < 0 ? nullptr : channels_[size_t(index)].get();
}

std::unique_ptr<Channel> ChannelManager::RemoveChannel(Channel* channel)
{
    std::unique_ptr<Channel> removed;
    int32_t index;
    {
        std::lock_guard guard(lock_);
        index = channel != nullptr ? IndexOfLocked(channel) : -1;
        if (index < 0)
            return nullptr;
        removed = std::move(channels_[size_t(index)]);
        channels_.erase(channels_.begin() + index);
        indexValid_ = false;
    }
    NotifyChannel(DocumentChange::kChannelRemoved, index);
    return removed;
}

bool ChannelManager::RemoveChannelAt(int32_t index)
{
    // The channel is freed only after the listeners have let go of it.
    std::unique_ptr<Channel> removed;
    {
        std::lock_guard guard(lock_);
        if (index < 0 || size_t(index) >= channels_.size())
            return false;
        removed = std::move(channels_[size_t(index)]);
        channels_.erase(channels_.begin() + index);
        indexValid_ = false;
    }
    NotifyChannel(DocumentChange::kChannelRemoved, index);
    return true;
}

void ChannelManager::NotifyChannel(uint32_t change, int32_t index)
{
    Message data;
    data.AddInt32(kFieldIndex, index);
    listeners_.Notify(change, &data);
}

void ChannelManager::ChannelChanged(Channel* channel)
{
    const int32_t index = IndexOf(channel);
    if (index >= 0)
        NotifyChannel(DocumentChange::kChannelData, index);
}

void ChannelManager::ChannelsChanged()
{
    listeners_.Notify(DocumentChange::kChannelData);
}

int32_t ChannelManager::CountChannels()
{
    std::lock_guard guard(lock_);
    return int32_t(channels_.size());
}

Channel* ChannelManager::ChannelAt(int32_t index)
{
    std::lock_guard guard(lock_);
    if (index < 0 || size_t(index) >= channels_.size())
        return nullptr;
    return channels_[size_t(index)].get();
}

int32_t ChannelManager::IndexOf(Channel* channel)
{
    std::lock_guard guard(lock_);
    return IndexOfLocked(channel);
}

int32_t ChannelManager::IndexOfLocked(const Channel* channel)
{
    if (!indexValid_)
        RebuildIndexLocked();
    const auto found = indexByChannel_.find(channel);
    return found == indexByChannel_.end() ? -1 : found->second;
}

int32_t ChannelManager::IndexOfIdLocked(uint64_t id)
{
    if (!indexValid_)
        RebuildIndexLocked();
    const auto found = indexById_.find(id);
    return found == indexById_.end() ? -1 : found->second;
}

// Removing the channels of a document one by one would rebuild the index
// after each; it is rebuilt only when a look-up needs it.
void ChannelManager::RebuildIndexLocked()
{
    indexByChannel_.clear();
    indexById_.clear();
    for (size_t i = 0; i < channels_.size(); ++i) {
        indexByChannel_[channels_[i].get()] = int32_t(i);
        indexById_[channels_[i]->Id()] = int32_t(i);
    }
    indexValid_ = true;
}

void ChannelManager::IndexAppendedLocked()
{
    if (!indexValid_)
        return;
    const int32_t index = int32_t(channels_.size()) - 1;
    indexByChannel_[channels_.back().get()] = index;
    indexById_[channels_.back()->Id()] = index;
}

int64_t ChannelManager::FrameCount()
{
    std::lock_guard guard(lock_);
    return FrameCountLocked();
}

int64_t ChannelManager::FrameCountLocked()
{
    int64_t total = 0;
    for (const std::unique_ptr<Channel>& channel : channels_)
        total = std::max(total, channel->EndFrame());
    return total;
}

void ChannelManager::PostToWindow(uint32_t what, const char* field, int64_t value)
{
    if (window_ == nullptr)
        return;
    Message message(what);
    if (field != nullptr)
        message.AddInt64(field, value);
    window_->PostMessage(message);
}

// The window hears only of values the manager chose on its own; a value
// stored exactly as asked is not announced.
void ChannelManager::SetRangeStart(int64_t frame)
{
    const int64_t total = FrameCount();
    if (frame >= total) {
        rangeStart_ = total - 1;
        PostToWindow(kMsgRangeStartChanged, kFieldRangeStart, total - 1);
    } else {
        rangeStart_ = frame;
    }
    // The end follows the argument as passed, not the clamped start.
    if (rangeStart_ > rangeEnd_) {
        rangeEnd_ = frame;
        PostToWindow(kMsgRangeEndChanged, kFieldRangeEnd, frame);
    }
}

void ChannelManager::SetRangeEnd(int64_t frame)
{
    const int64_t total = FrameCount();
    if (frame >= total) {
        rangeEnd_ = total - 1;
        PostToWindow(kMsgRangeEndChanged, kFieldRangeEnd, total - 1);
    } else {
        rangeEnd_ = frame;
    }
    if (rangeStart_ > rangeEnd_) {
        rangeStart_ = frame;
        PostToWindow(kMsgRangeStartChanged, kFieldRangeStart, frame);
    }
}

void ChannelManager::SetLoop(bool loop)
{
    std::lock_guard guard(lock_);
    loop_ = loop;
}

void ChannelManager::SetPlayMode(int32_t mode)
{
    std::lock_guard guard(lock_);
    playMode_ = mode;
}

void ChannelManager::ResetCurrentFrame()
{
    std::lock_guard guard(lock_);
    const int32_t mode = playMode_;
    if (mode == kPlayAll || mode == kPlayRange || mode == kPlayVisible)
        currentFrame_ = 0;
}

void ChannelManager::SetFrameRate(float rate)
{
    if (rate > 0)
        frameRate_ = rate;
}

bool ChannelManager::FillBuffer(float* out, int64_t frames)
{
    bool reachedEnd = false;
    const bool filled = mixer_->FillBuffer(out, frames, &reachedEnd);
    if (reachedEnd)
        PostToWindow(kMsgStop);
    return filled;
}

bool ChannelManager::FillBuffer(int16_t* out, int64_t* frames)
{
    return mixer_->FillBuffer(out, frames);
}

}  // namespace glimmet
