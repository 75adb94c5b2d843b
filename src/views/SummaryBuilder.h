#pragma once

#include <cstdint>
#include <deque>
#include <span>
#include <unordered_set>
#include <vector>

#include <QObject>
#include <QTimer>

#include "sound/SampleBlock.h"

namespace glimmet {

class Channel;

/// Makes the waveform summaries a sample view asked for, while the window is
/// idle, so that the first picture of a long channel costs no more than
/// reading its samples once. Later renders of the same blocks then read the
/// summaries. The picture is the same either way; only its cost changes.
///
/// Work runs on the window's thread in slices of a few milliseconds, between
/// other events, from a short while after the render that asked. That
/// thread is also the one that edits channels, so a block found in the
/// channel at the start of a slice stays alive for the slice; a block that
/// left the channel before its turn is simply skipped.
class SummaryBuilder : public QObject {
public:
    /// rowTable (8192 entries) is the view's, read when a summary is made:
    /// a summary is always made for the table the view has at that moment.
    SummaryBuilder(Channel* channel, const int16_t* rowTable);

    /// Queues summaries for the wanted blocks, found among spans (the
    /// channel's data from index 0 on, as the last render read them).
    void Request(std::span<const SampleSpan> spans, const std::vector<const SampleBlock*>& wanted);

    /// Makes summaries until the queue is empty, for tests and benchmarks.
    void Finish();
    bool Idle() const { return jobs_.empty(); }
    int64_t SummariesMade() const { return summariesMade_; }

private:
    struct Job {
        int64_t index;  // the block's first sample in the channel's data
        uint64_t id;
    };

    // A slice is short enough that input never waits noticeably for it.
    static constexpr int64_t kSliceNanoseconds = 8'000'000;
    // The first slice waits this long after the render that asked: a new
    // picture comes with the messages that settle the window (the zoom
    // slider's, a layout's), and those go first.
    static constexpr int kQuietMilliseconds = 100;

    void BuildSlice(int64_t nanoseconds);
    void Build(const Job& job, uint64_t tableKey);

    Channel* channel_;
    const int16_t* rowTable_;
    std::deque<Job> jobs_;
    std::unordered_set<uint64_t> queued_;
    QTimer timer_;
    int64_t summariesMade_ = 0;
};

}  // namespace glimmet
