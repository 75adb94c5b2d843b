#pragma once

#include <cstdint>

#include "playback/PlaybackGraph.h"
#include "support/Status.h"

namespace glimmet {

class ChannelManager;
class Message;
class MessageTarget;
class PlaybackWindow;

/// The document window's playback commands: play from the start or from the
/// cursor, toggle, stop, play mode, loop, and the play-mark throttle that
/// lets at most one play-mark move wait for the view at a time.
///
/// The window owns one, forwards 'play', 'pfcr', 'cnpl', 'stop', 'udpm',
/// 'pmup', 'plmd' and 'loop' to MessageReceived, calls SetUp when it has
/// been built and TearDown when it closes. The controller owns the window's
/// playback graph; its producer relays 'udpm' to the window, and 'stop' at
/// the end of a range that does not loop.
///
/// Thread use: window thread only, with the document lock not held.
class PlaybackController {
public:
    /// window receives the commands the controller posts to itself ('cnpl')
    /// and the producer's 'udpm'; view is how it reaches the views.
    PlaybackController(ChannelManager* manager, MessageTarget* window, PlaybackWindow* view);
    ~PlaybackController();
    PlaybackController(const PlaybackController&) = delete;
    PlaybackController& operator=(const PlaybackController&) = delete;

    /// Sets up the graph; prints "Error setting up nodes!" when that fails.
    /// The editor works on without sound either way.
    status_t SetUp();
    /// Stops and dismantles the graph.
    void TearDown();

    /// Handles the eight playback codes; false for any other message.
    bool MessageReceived(const Message& message);

    bool IsPlaying() const { return playing_; }
    bool IsPlaymarkAcknowledged() const { return playmarkAcknowledged_; }
    PlaybackGraph& Graph() { return graph_; }

private:
    void Play();
    void PlayFromCursor();
    void TogglePlayback(const Message& message);
    void Stop(const Message& message);
    void UpdatePlaymark(const Message& message);
    /// True for an update or a stop posted by a playback that has since
    /// been stopped; messages without a run come from the window itself.
    bool IsFromAnEndedRun(const Message& message) const;
    void SetPlayMode();
    void SetLoop();

    ChannelManager* manager_;  // not owned
    MessageTarget* window_;    // not owned
    PlaybackWindow* view_;     // not owned
    PlaybackGraph graph_;
    bool playing_ = false;
    bool playmarkAcknowledged_ = true;
};

}  // namespace glimmet
