#pragma once

#include <atomic>
#include <thread>

namespace glimmet {

class MessageTarget;
class StretchAction;

/// Runs the long middle step of a time stretch (StretchAction::Compute) on
/// a thread of its own, so that every window stays usable meanwhile. When
/// the work is done it posts 'tsfn' to the window, whose GUI thread then
/// calls Finish to write the result back under the document lock.
///
/// Ending the worker (the window closing, the program quitting) stops the
/// vocoder at its next frame and waits for the thread; nothing is written
/// back then.
class StretchWorker {
public:
    /// window receives 'tsfn'; not owned, outlives the worker.
    explicit StretchWorker(MessageTarget& window);
    ~StretchWorker();
    StretchWorker(const StretchWorker&) = delete;
    StretchWorker& operator=(const StretchWorker&) = delete;

    /// Starts computing action, whose dialog has been read; it must live
    /// until Finish or Stop. Does nothing while another one runs.
    void Start(StretchAction* action);
    /// True from Start until Finish or Stop.
    bool Busy() const { return action_ != nullptr; }
    /// How far the running stretch has come, 0 to 1; 0 when none runs.
    double Progress() const;
    /// Waits for the thread and writes the result back. False when there
    /// was nothing to finish.
    bool Finish();
    /// Stops the work, waits for the thread and drops the result.
    void Stop();

    /// How many stretches of all windows are started and not yet written
    /// back or stopped; scripts wait for this to reach 0.
    static int Running();

private:
    void Release();

    static std::atomic<int> running_;

    MessageTarget& window_;
    StretchAction* action_ = nullptr;
    std::atomic<bool> stop_{false};
    std::thread thread_;
};

}  // namespace glimmet
