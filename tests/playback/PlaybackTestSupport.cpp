#include "PlaybackTestSupport.h"

#include <gtest/gtest.h>

#include <memory>

#include <QCoreApplication>
#include <QEventLoop>

#include <chrono>
#include <cmath>
#include <thread>
#include <cstdlib>
#include <fstream>

#include "sound/Channel.h"
#include "support/MessageCodes.h"
#include "support/SystemTime.h"

namespace glimmet::test {

TemporaryFolder::TemporaryFolder()
{
    std::string pattern = (std::filesystem::temp_directory_path() / "glimmet-playback-XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr)
        throw std::runtime_error("cannot make a temporary folder");
    path_ = pattern;
}

TemporaryFolder::~TemporaryFolder()
{
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

DiskAudio::DiskAudio()
{
    setenv("SDL_AUDIODRIVER", "disk", 1);
    setenv("SDL_DISKAUDIOFILE", File().c_str(), 1);
    setenv("SDL_DISKAUDIODELAY", "0", 1);
}

DiskAudio::~DiskAudio()
{
    unsetenv("SDL_AUDIODRIVER");
    unsetenv("SDL_DISKAUDIOFILE");
    unsetenv("SDL_DISKAUDIODELAY");
}

std::vector<float> DiskAudio::ReadOutput() const
{
    std::ifstream in(File(), std::ios::binary);
    std::vector<char> bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    std::vector<float> floats(bytes.size() / sizeof(float));
    std::memcpy(floats.data(), bytes.data(), floats.size() * sizeof(float));
    return floats;
}

std::vector<int16_t> RandomSamples(std::mt19937& random, int64_t count, int16_t low, int16_t high)
{
    std::uniform_int_distribution<int> value(low, high);
    std::vector<int16_t> samples(static_cast<size_t>(count));
    for (int16_t& sample : samples)
        sample = int16_t(value(random));
    return samples;
}

ReferencePlayback::ReferencePlayback(std::vector<ChannelRecipe> channels, int32_t mode, bool loop,
    int64_t rangeStart, int64_t rangeEnd, int64_t visibleFirst, int64_t visibleLast)
    : channels_(std::move(channels)), mode_(mode), loop_(loop), rangeStart_(rangeStart), rangeEnd_(rangeEnd),
      visibleFirst_(visibleFirst), visibleLast_(visibleLast)
{
}

int64_t ReferencePlayback::FrameCount() const
{
    int64_t total = 0;
    for (const ChannelRecipe& channel : channels_)
        total = std::max(total, channel.firstFrame + int64_t(channel.samples.size()));
    return total;
}

void ReferencePlayback::PlayRange(int64_t* start, int64_t* end) const
{
    const int64_t total = FrameCount();
    *start = 0;
    *end = total - 1;
    if (mode_ == 1 && rangeStart_ >= 0 && rangeStart_ <= rangeEnd_) {
        *start = rangeStart_;
        *end = rangeEnd_;
    } else if (mode_ == 2) {
        *start = visibleFirst_;
        *end = visibleLast_;
    }
    *start = std::max<int64_t>(*start, 0);
    *end = std::max<int64_t>(*end, 0);
    *start = std::min(*start, total - 1);
    *end = std::min(*end, total - 1);
    *end = std::max(*end, *start);
}

void ReferencePlayback::MixFrame(int64_t frame, float* left, float* right) const
{
    float sums[2] = {0.0f, 0.0f};
    int counts[2] = {0, 0};
    for (const ChannelRecipe& channel : channels_) {
        if (channel.muted)
            continue;
        const int64_t index = frame - channel.firstFrame;
        const int16_t sample = index >= 0 && index < int64_t(channel.samples.size()) ? channel.samples[size_t(index)] : 0;
        const float value = float(sample) * (1.0f / 32768.0f);
        if (channel.pan == 0 || channel.pan == -128) {
            sums[0] += value;
            counts[0]++;
        }
        if (channel.pan == 0 || channel.pan == 127) {
            sums[1] += value;
            counts[1]++;
        }
    }
    // The documents of these tests stay on the curve's straight part, where
    // more than one channel passes unchanged too.
    EXPECT_LE(std::fabs(sums[0]), 0.3f);
    EXPECT_LE(std::fabs(sums[1]), 0.3f);
    *left = counts[0] == 0 ? 0.0f : sums[0];
    *right = counts[1] == 0 ? 0.0f : sums[1];
}

bool ReferencePlayback::Buffer(int64_t* current, int64_t frames, std::vector<float>* out) const
{
    int64_t start = 0;
    int64_t end = 0;
    PlayRange(&start, &end);
    if (*current < start || *current > end)
        *current = start;
    std::vector<int64_t> source;  // the timeline frame of each output frame, -1 for silence
    if (*current + frames <= end) {
        for (int64_t i = 0; i < frames; i++)
            source.push_back(*current + i);
        *current += frames;
    } else if (frames > end - start + 1) {
        out->insert(out->end(), size_t(frames) * 2, 0.0f);
        return false;
    } else {
        for (int64_t frame = *current; frame <= end; frame++)
            source.push_back(frame);
        const int64_t tail = frames - int64_t(source.size());
        for (int64_t i = 0; i < tail; i++)
            source.push_back(loop_ ? start + i : -1);
        *current = loop_ ? start + tail : end + 1;
    }
    for (int64_t frame : source) {
        float left = 0.0f;
        float right = 0.0f;
        if (frame >= 0) {
            MixFrame(frame, &left, &right);
        } else {
            // Zeros from every channel: each side that hears a channel sums to 0.
            left = 0.0f;
            right = 0.0f;
        }
        out->push_back(left);
        out->push_back(right);
    }
    return true;
}

std::vector<float> ReferencePlayback::Play(int64_t current, int64_t buffers, int64_t frames) const
{
    std::vector<float> out;
    for (int64_t i = 0; i < buffers; i++)
        Buffer(&current, frames, &out);
    return out;
}

int64_t ReferencePlayback::PositionAfter(int64_t current, int64_t buffers, int64_t frames) const
{
    std::vector<float> ignored;
    for (int64_t i = 0; i < buffers; i++)
        Buffer(&current, frames, &ignored);
    return current;
}

std::vector<int64_t> ReferencePlayback::Positions(int64_t current, int64_t buffers, int64_t frames) const
{
    std::vector<int64_t> positions;
    std::vector<float> ignored;
    for (int64_t i = 0; i < buffers; i++) {
        ignored.clear();
        Buffer(&current, frames, &ignored);
        positions.push_back(current);
    }
    return positions;
}

void AddChannels(ChannelManager* manager, const std::vector<ChannelRecipe>& channels)
{
    for (const ChannelRecipe& recipe : channels) {
        auto* samples = new int16_t[recipe.samples.size()];
        std::copy(recipe.samples.begin(), recipe.samples.end(), samples);
        auto* channel = new Channel();
        channel->SetTo(samples, int64_t(recipe.samples.size()));
        channel->SetStartFrameOffset(recipe.firstFrame);
        channel->SetPanPosition(recipe.pan);
        channel->SetMuted(recipe.muted);
        manager->AddChannel(std::unique_ptr<Channel>(channel));
    }
}

class FakePlaybackWindow::Inbox : public Handler {
public:
    explicit Inbox(FakePlaybackWindow* window) : window_(window) {}
    void MessageReceived(const Message& message) override { window_->Receive(message); }

private:
    FakePlaybackWindow* window_;
};

FakePlaybackWindow::FakePlaybackWindow()
    : inbox_(std::make_unique<Inbox>(this)), ownThread_(std::this_thread::get_id())
{
}

FakePlaybackWindow::~FakePlaybackWindow() = default;

void FakePlaybackWindow::Attach(ChannelManager* manager, PlaybackController* controller)
{
    manager_ = manager;
    controller_ = controller;
}

status_t FakePlaybackWindow::PostMessage(const Message& message)
{
    if (std::this_thread::get_id() != ownThread_) {
        std::lock_guard guard(foreignMutex_);
        foreignMessages_.push_back(message);
        return B_OK;
    }
    return inbox_->PostMessage(message);
}

void FakePlaybackWindow::ForwardForeignMessages()
{
    std::vector<Message> messages;
    {
        std::lock_guard guard(foreignMutex_);
        messages.swap(foreignMessages_);
    }
    for (const Message& message : messages)
        inbox_->PostMessage(message);
}

bool FakePlaybackWindow::LockWithTimeout(int64_t timeoutMicros)
{
    return windowLock_.LockWithTimeout(timeoutMicros);
}

void FakePlaybackWindow::UnlockWindow()
{
    windowLock_.Unlock();
}

void FakePlaybackWindow::GetVisibleFrames(int64_t* first, int64_t* last)
{
    *first = visibleFirst;
    *last = visibleLast;
}

void FakePlaybackWindow::SetPlaymarkFrame(int64_t frame)
{
    playmarkMoves.push_back(frame);
    if (acknowledgePlaymark)
        PostMessage(kMsgPlaymarkUpdated);
}

void FakePlaybackWindow::SetPlaymarkToCursor()
{
    manager_->SetCurrentFrame(cursorFrame);
}

void FakePlaybackWindow::SetPlayModeButtonMode(int32_t mode)
{
    buttonModes.push_back(mode);
}

void FakePlaybackWindow::Receive(const Message& message)
{
    received.push_back(message.what);
    if (message.what == kMsgUpdatePlaymark) {
        int64_t frame = 0;
        int64_t time = 0;
        if (message.FindInt64("current frame", &frame) == B_OK && message.FindInt64("time", &time) == B_OK) {
            playmarkUpdates.push_back(frame);
            playmarkUpdateTimes.push_back(time);
        }
    } else if (message.what == kMsgStop) {
        stopMessages++;
    } else if (message.what == kMsgTogglePlay) {
        toggleMessages++;
    }
    if (controller_ != nullptr)
        controller_->MessageReceived(message);
}

bool FakePlaybackWindow::ProcessUntil(const std::function<bool()>& done, int64_t limitMicros)
{
    const int64_t deadline = system_time() + limitMicros;
    while (!done()) {
        if (system_time() > deadline)
            return false;
        ForwardForeignMessages();
        QCoreApplication::processEvents(QEventLoop::AllEvents);
        QCoreApplication::sendPostedEvents();
        // Leave the processor to the device thread between looks.
        if (!done())
            std::this_thread::sleep_for(std::chrono::microseconds(500));
    }
    return true;
}

void FakePlaybackWindow::ProcessPending()
{
    for (int i = 0; i < 5; i++) {
        ForwardForeignMessages();
        QCoreApplication::sendPostedEvents();
        QCoreApplication::processEvents(QEventLoop::AllEvents);
    }
}

int64_t FirstSound(const std::vector<float>& output)
{
    for (size_t i = 0; i < output.size(); i++) {
        if (output[i] != 0.0f)
            return int64_t(i);
    }
    return -1;
}

int CountOccurrences(const std::string& text, const std::string& what)
{
    int count = 0;
    for (size_t at = text.find(what); at != std::string::npos; at = text.find(what, at + 1))
        count++;
    return count;
}

}  // namespace glimmet::test
