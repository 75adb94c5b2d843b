#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <unordered_map>
#include <vector>

#include "sound/Observable.h"
#include "support/Locker.h"

namespace glimmet {

class Channel;
class DocumentWindow;
class Mixer;

/// The document's sound: its ordered channels, frame rate, range, play mode,
/// loop flag and play position. The Mixer turns it into stereo for playback
/// (float) and for saving (16-bit); the manager keeps a mixer of its own for
/// the callers that are not the audio thread.
///
/// The document tells its listeners what changed (DocumentChange masks):
/// loading, actions and views change the document only, and the views follow
/// it by listening.
///
/// The channel list is guarded by the document lock (Lock/Unlock). The range,
/// current frame, play mode, loop flag and rate are plain values read without
/// the lock from any thread; they are atomics so that reading them while the
/// window thread writes them is well defined.
class ChannelManager {
public:
    static constexpr int32_t kPlayAll = 0;
    static constexpr int32_t kPlayRange = 1;
    static constexpr int32_t kPlayVisible = 2;

    explicit ChannelManager(DocumentWindow* window);
    ~ChannelManager();
    ChannelManager(const ChannelManager&) = delete;
    ChannelManager& operator=(const ChannelManager&) = delete;

    /// The document lock. Unlock by a thread that does not hold it does nothing.
    void Lock() { lock_.Lock(); }
    void Unlock() { lock_.Unlock(); }
    Locker& DocumentLock() { return lock_; }

    /// Appends the channel; the document owns it from now on. Returns it;
    /// null for a null channel.
    Channel* AddChannel(std::unique_ptr<Channel> channel);
    /// Inserts the channel at index (0 to CountChannels()). Returns null when
    /// the document took it; a null channel or an index out of range is
    /// refused, and the channel comes back to the caller.
    std::unique_ptr<Channel> AddChannel(std::unique_ptr<Channel> channel, int32_t index);
    /// Takes the channel out of the list without deleting it; ownership goes
    /// to the caller. Null when the channel is not in the list.
    std::unique_ptr<Channel> RemoveChannel(Channel* channel);
    /// Removes and deletes the channel at index; true if there was one.
    bool RemoveChannelAt(int32_t index);
    int32_t CountChannels();
    /// Null when index is out of range.
    Channel* ChannelAt(int32_t index);
    int32_t IndexOf(Channel* channel);
    /// The document's channel with that Channel::Id, or null when no channel
    /// of the document has it (it was removed, or belonged to a document
    /// this one replaced).
    Channel* ChannelWithId(uint64_t id);

    /// The largest first frame + frame count over all channels; 0 without any.
    int64_t FrameCount();

    int64_t RangeStart() const { return rangeStart_.load(std::memory_order_relaxed); }
    int64_t RangeEnd() const { return rangeEnd_.load(std::memory_order_relaxed); }
    void SetRangeStart(int64_t frame);
    void SetRangeEnd(int64_t frame);

    bool Loop() const { return loop_.load(std::memory_order_relaxed); }
    void SetLoop(bool loop);
    int32_t PlayMode() const { return playMode_.load(std::memory_order_relaxed); }
    void SetPlayMode(int32_t mode);

    int64_t CurrentFrame() const { return currentFrame_.load(std::memory_order_relaxed); }
    void SetCurrentFrame(int64_t frame) { currentFrame_.store(frame, std::memory_order_relaxed); }
    void ResetCurrentFrame();

    float FrameRate() const { return frameRate_.load(std::memory_order_relaxed); }
    /// Only a rate above 0 is stored.
    void SetFrameRate(float rate);

    DocumentWindow* Window() const { return window_; }

    /// Where listeners subscribe to the DocumentChange masks. GUI thread.
    Observable& Listeners() { return listeners_; }
    /// Tells the listeners that the channel's samples, first frame, mute,
    /// pan or selection changed; nothing for a channel not in the document.
    /// Call without holding the document lock.
    void ChannelChanged(Channel* channel);
    /// The same for every channel at once.
    void ChannelsChanged();

    /// For the Mixer, which holds the document lock for a whole buffer and
    /// reads the list once per channel: the count, and the channel at index
    /// (0 <= index < CountChannelsLocked()), without taking the lock again.
    /// The caller holds the document lock.
    int32_t CountChannelsLocked() const { return int32_t(channels_.size()); }
    Channel* ChannelAtLocked(int32_t index) const { return channels_[size_t(index)].get(); }
    /// FrameCount for a caller that holds the document lock.
    int64_t FrameCountLocked();

    /// Playback mix (see Mixer) for callers off the audio thread: the
    /// scratch grows as needed, and 'stop' is posted to the window straight
    /// away at the end of a range that does not loop. Playback itself mixes
    /// with the producer's own prepared Mixer.
    bool FillBuffer(float* out, int64_t frames);

    /// Save mix (see Mixer): up to *frames interleaved stereo 16-bit frames
    /// from the current frame to the end of the document; *frames becomes
    /// the number produced. False when the current frame has reached the end.
    bool FillBuffer(int16_t* out, int64_t* frames);

private:
    void NotifyChannel(uint32_t change, int32_t index);
    void PostToWindow(uint32_t what, const char* field = nullptr, int64_t value = 0);
    /// Where the channel, or the channel with the id, stands; -1 when it is
    /// not in the list. The caller holds lock_.
    int32_t IndexOfLocked(const Channel* channel);
    int32_t IndexOfIdLocked(uint64_t id);
    void RebuildIndexLocked();
    void IndexAppendedLocked();

    // Guarded by lock_.
    std::vector<std::unique_ptr<Channel>> channels_;
    // Each channel's place in channels_, by pointer and by id, so that a
    // document of thousands of channels finds one without a walk. Appending
    // keeps them up; any other change to the list drops them until the next
    // look-up.
    std::unordered_map<const Channel*, int32_t> indexByChannel_;
    std::unordered_map<uint64_t, int32_t> indexById_;
    bool indexValid_ = true;
    std::unique_ptr<Mixer> mixer_;

    DocumentWindow* window_;
    Observable listeners_;
    std::atomic<float> frameRate_{44100.0f};
    std::atomic<int64_t> currentFrame_{0};
    std::atomic<int32_t> playMode_{kPlayAll};
    std::atomic<bool> loop_{true};
    std::atomic<int64_t> rangeStart_{-1};
    std::atomic<int64_t> rangeEnd_{-1};
    Locker lock_;
};

}  // namespace glimmet
