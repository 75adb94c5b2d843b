#include "playback/PlaybackController.h"

#include "playback/AudioProducer.h"
#include "playback/PlaybackWindow.h"
#include "sound/ChannelManager.h"
#include "support/Diagnostics.h"
#include "support/Message.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"
#include "support/MessageTarget.h"

namespace glimmet {

PlaybackController::PlaybackController(ChannelManager* manager, MessageTarget* window, PlaybackWindow* view)
    : manager_(manager), window_(window), view_(view), graph_(manager, window)
{
}

PlaybackController::~PlaybackController() = default;

status_t PlaybackController::SetUp()
{
    const status_t status = graph_.SetupNodes();
    if (status != B_OK)
        Diagnostics::Print("Error setting up nodes!\n");
    return status;
}

void PlaybackController::TearDown()
{
    graph_.StopNodes();
    graph_.TearDownNodes();
}

bool PlaybackController::MessageReceived(const Message& message)
{
    switch (message.what) {
        case kMsgPlay:
            Play();
            return true;
        case kMsgPlayFromCursor:
            PlayFromCursor();
            return true;
        case kMsgTogglePlay:
            TogglePlayback(message);
            return true;
        case kMsgStop:
            Stop(message);
            return true;
        case kMsgUpdatePlaymark:
            UpdatePlaymark(message);
            return true;
        case kMsgPlaymarkUpdated:
            playmarkAcknowledged_ = true;
            return true;
        case kMsgPlayMode:
            SetPlayMode();
            return true;
        case kMsgLoop:
            SetLoop();
            return true;
        default:
            return false;
    }
}

void PlaybackController::Play()
{
    manager_->ResetCurrentFrame();
    if (!playing_)
        window_->PostMessage(kMsgTogglePlay);
}

void PlaybackController::PlayFromCursor()
{
    view_->SetPlaymarkToCursor();
    if (!playing_)
        window_->PostMessage(kMsgTogglePlay);
}

// The play mode button sends the mode it has just switched to (0 running,
// 1 stopped), which is the opposite of what the toggle below starts from;
// the keyboard sends no mode, and the button is then brought in line.
void PlaybackController::TogglePlayback(const Message& message)
{
    int32_t mode = 0;
    if (message.FindInt32(kFieldMode, &mode) == B_OK) {
        if (mode == 1)
            playing_ = true;
        else if (mode == 0)
            playing_ = false;
    } else {
        view_->SetPlayModeButtonMode(playing_ ? 1 : 0);
    }
    if (!playing_)
        graph_.StartNodes();
    else
        graph_.StopNodes();
    playing_ = !playing_;
}

void PlaybackController::Stop(const Message& message)
{
    if (IsFromAnEndedRun(message))
        return;
    if (playing_) {
        graph_.StopNodes();
        view_->SetPlayModeButtonMode(1);
        playing_ = false;
    }
    manager_->ResetCurrentFrame();
    view_->SetPlaymarkFrame(manager_->CurrentFrame());
    // Updates the stopped playback posted before it stopped may still be on
    // their way; were they shown, the mark would jump back from the start.
    if (AudioProducer* producer = graph_.Producer())
        producer->Relay().BeginNewRun();
}

void PlaybackController::UpdatePlaymark(const Message& message)
{
    int64_t frame = 0;
    if (message.FindInt64(kFieldCurrentFrame, &frame) != B_OK || IsFromAnEndedRun(message))
        return;
    // One move at a time: the view acknowledges each with 'pmup'.
    if (!playmarkAcknowledged_)
        return;
    view_->SetPlaymarkFrame(frame);
    playmarkAcknowledged_ = false;
}

bool PlaybackController::IsFromAnEndedRun(const Message& message) const
{
    const AudioProducer* producer = graph_.Producer();
    int32_t run = 0;
    return producer != nullptr && message.FindInt32(kFieldPlaybackRun, &run) == B_OK &&
           run != producer->Relay().CurrentRun();
}

void PlaybackController::SetPlayMode()
{
    const int32_t index = view_->MarkedPlayModeIndex();
    if (index >= 0)
        manager_->SetPlayMode(index);
}

void PlaybackController::SetLoop()
{
    manager_->SetLoop(view_->IsLoopChecked());
}

}  // namespace glimmet
