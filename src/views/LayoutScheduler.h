#pragma once

#include <functional>

#include <QObject>

namespace glimmet {

/// Runs a layout once, soon after it was first asked for, however often it
/// is asked for before then.
///
/// A file of many channels reaches the channel container one channel at a
/// time, and every channel changes the height of every view. Laying out all
/// views for each channel would cost the square of the channel count; asked
/// for through Schedule, the layout runs once for the whole batch. It runs
/// from an event posted at high priority, so that it comes before every
/// event already queued, and every handler sees the views laid out as they
/// would have been had each change been laid out at once.
///
/// GUI thread only.
class LayoutScheduler : public QObject {
public:
    explicit LayoutScheduler(std::function<void()> layout);
    ~LayoutScheduler() override;

    /// Asks for a layout; posts the event unless one is on its way.
    void Schedule();
    bool IsPending() const { return pending_; }
    /// Runs the pending layout now. False, doing nothing, when none is
    /// pending.
    bool Flush();
    /// Layouts asked for since the scheduler was made, and layouts run:
    /// lets tests see how many passes a batch of changes cost.
    int64_t CountScheduled() const { return scheduled_; }
    int64_t CountRun() const { return run_; }

protected:
    void customEvent(QEvent* event) override;

private:
    static int EventType();

    std::function<void()> layout_;
    bool pending_ = false;
    bool posted_ = false;
    int64_t scheduled_ = 0;
    int64_t run_ = 0;
};

}  // namespace glimmet
