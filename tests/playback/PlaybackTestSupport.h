#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>
#include <memory>
#include <mutex>
#include <thread>
#include <random>
#include <string>
#include <vector>

#include "playback/PlaybackController.h"
#include "playback/PlaybackWindow.h"
#include "sound/ChannelManager.h"
#include "sound/DocumentWindow.h"
#include "support/Handler.h"
#include "support/Locker.h"
#include "support/Message.h"

namespace glimmet::test {

/// Frames in one producer buffer as negotiated with a device that leaves the
/// buffer size open (2048 bytes of stereo float).
inline constexpr int64_t kBufferFrames = 256;

/// A temporary folder, removed with everything in it at the end.
class TemporaryFolder {
public:
    TemporaryFolder();
    ~TemporaryFolder();
    const std::filesystem::path& Path() const { return path_; }

private:
    std::filesystem::path path_;
};

/// Points SDL at its disk driver, writing to a file in a temporary folder
/// without any pacing, for the lifetime of the object.
class DiskAudio {
public:
    DiskAudio();
    ~DiskAudio();
    std::filesystem::path File() const { return folder_.Path() / "output.raw"; }
    /// Every float the device wrote.
    std::vector<float> ReadOutput() const;

private:
    TemporaryFolder folder_;
};

/// How one channel of a test document is made.
struct ChannelRecipe {
    std::vector<int16_t> samples;
    int64_t firstFrame = 0;
    int8_t pan = 0;
    bool muted = false;
};

/// Samples in [low, high] with a random sign... or all positive when
/// positive is true, so that a sum is never 0.
std::vector<int16_t> RandomSamples(std::mt19937& random, int64_t count, int16_t low, int16_t high);

/// The stereo float stream that playback of a document must produce,
/// worked out here from the channels' samples and the mixer's rules, not by
/// the mixer itself. Sums must stay within the curve's straight part
/// (|x| <= 0.3), which Mix checks.
class ReferencePlayback {
public:
    ReferencePlayback(std::vector<ChannelRecipe> channels, int32_t mode, bool loop, int64_t rangeStart,
        int64_t rangeEnd, int64_t visibleFirst, int64_t visibleLast);

    /// The frames of count buffers played from the play position current.
    std::vector<float> Play(int64_t current, int64_t buffers, int64_t frames = kBufferFrames) const;
    /// Where the play position lies after those buffers.
    int64_t PositionAfter(int64_t current, int64_t buffers, int64_t frames = kBufferFrames) const;
    /// The play position after each of those buffers.
    std::vector<int64_t> Positions(int64_t current, int64_t buffers, int64_t frames = kBufferFrames) const;
    int64_t FrameCount() const;

private:
    void PlayRange(int64_t* start, int64_t* end) const;
    /// One buffer; false when the play range is shorter than the buffer.
    bool Buffer(int64_t* current, int64_t frames, std::vector<float>* out) const;
    void MixFrame(int64_t frame, float* left, float* right) const;

    std::vector<ChannelRecipe> channels_;
    int32_t mode_;
    bool loop_;
    int64_t rangeStart_;
    int64_t rangeEnd_;
    int64_t visibleFirst_;
    int64_t visibleLast_;
};

/// Builds a channel for the manager from a recipe.
void AddChannels(ChannelManager* manager, const std::vector<ChannelRecipe>& channels);

/// A document window without widgets: it queues messages through Qt like
/// the real one, answers the mixer's visible-frames query, records every
/// message it receives and every call the controller makes, and acts as the
/// views would (a play-mark move posts 'pmup', the cursor sets the play
/// position).
class FakePlaybackWindow : public DocumentWindow, public PlaybackWindow {
public:
    FakePlaybackWindow();
    ~FakePlaybackWindow() override;

    /// Makes the manager and the controller; call before use.
    void Attach(ChannelManager* manager, PlaybackController* controller);

    status_t PostMessage(const Message& message) override;
    using DocumentWindow::PostMessage;
    bool LockWithTimeout(int64_t timeoutMicros) override;
    void UnlockWindow() override;
    void GetVisibleFrames(int64_t* first, int64_t* last) override;

    void SetPlaymarkFrame(int64_t frame) override;
    void SetPlaymarkToCursor() override;
    void SetPlayModeButtonMode(int32_t mode) override;
    int32_t MarkedPlayModeIndex() override { return markedPlayMode; }
    bool IsLoopChecked() override { return loopChecked; }

    /// Runs the event loop until done() or the time limit; true when done.
    bool ProcessUntil(const std::function<bool()>& done, int64_t limitMicros = 20000000);
    /// Runs the event loop until nothing is posted any more.
    void ProcessPending();

    /// The code of every message received, in order.
    std::vector<uint32_t> received;
    /// Frames of every 'udpm' received, in order.
    std::vector<int64_t> playmarkUpdates;
    std::vector<int64_t> playmarkUpdateTimes;
    /// Frames handed to SetPlaymarkFrame, in order.
    std::vector<int64_t> playmarkMoves;
    std::vector<int32_t> buttonModes;
    int stopMessages = 0;
    int toggleMessages = 0;
    int64_t cursorFrame = 0;
    int64_t visibleFirst = 0;
    int64_t visibleLast = 0;
    int32_t markedPlayMode = 0;
    bool loopChecked = true;
    /// When false the view does not answer play-mark moves with 'pmup'.
    bool acknowledgePlaymark = true;

private:
    class Inbox;
    void Receive(const Message& message);
    /// Hands the messages that other threads posted to the event loop.
    void ForwardForeignMessages();

    std::unique_ptr<Inbox> inbox_;
    ChannelManager* manager_ = nullptr;
    PlaybackController* controller_ = nullptr;
    Locker windowLock_;
    // Messages posted by other threads (the mixer's 'stop') wait here, under
    // a lock that ThreadSanitizer can see, until the test's thread moves
    // them into its event loop; Qt's own queue lock is invisible to it.
    std::thread::id ownThread_;
    std::mutex foreignMutex_;
    std::vector<Message> foreignMessages_;
};

/// Where the played part begins in a device's output: the index of the
/// first float that is not 0, or -1.
int64_t FirstSound(const std::vector<float>& output);

/// How many times `what` stands in the text (overlaps counted).
int CountOccurrences(const std::string& text, const std::string& what);

}  // namespace glimmet::test
