#include "views/SummaryBuilder.h"

#include <chrono>

#include "sound/Channel.h"
#include "views/BlockSummary.h"

namespace glimmet {

SummaryBuilder::SummaryBuilder(Channel* channel, const int16_t* rowTable) : channel_(channel), rowTable_(rowTable)
{
    timer_.setSingleShot(true);
    // Never early: the wait is there to let other work go first.
    timer_.setTimerType(Qt::PreciseTimer);
    QObject::connect(&timer_, &QTimer::timeout, this, [this] { BuildSlice(kSliceNanoseconds); });
}

void SummaryBuilder::Request(std::span<const SampleSpan> spans, const std::vector<const SampleBlock*>& wanted)
{
    const bool wasIdle = jobs_.empty();
    const std::unordered_set<const SampleBlock*> blocks(wanted.begin(), wanted.end());
    int64_t start = 0;
    for (const SampleSpan& span : spans) {
        if (span.block != nullptr && blocks.count(span.block) != 0 && queued_.insert(span.block->Id()).second)
            jobs_.push_back(Job{start - span.offset, span.block->Id()});
        start += span.count;
    }
    // Later requests join the work under way and do not put it off again:
    // the play mark asks on every step.
    if (wasIdle && !jobs_.empty())
        timer_.start(kQuietMilliseconds);
}

void SummaryBuilder::Finish()
{
    timer_.stop();
    while (!jobs_.empty())
        BuildSlice(INT64_MAX);
}

void SummaryBuilder::BuildSlice(int64_t nanoseconds)
{
    using Clock = std::chrono::steady_clock;
    const Clock::time_point start = Clock::now();
    // Made once per slice: the view's table may have changed since the
    // request, and the summary must fit the table renders will use.
    const uint64_t tableKey = BlockSummary::KeyOf(rowTable_);
    while (!jobs_.empty()) {
        const Job job = jobs_.front();
        jobs_.pop_front();
        queued_.erase(job.id);
        Build(job, tableKey);
        if (std::chrono::duration_cast<std::chrono::nanoseconds>(Clock::now() - start).count() >= nanoseconds)
            break;
    }
    if (!jobs_.empty())
        timer_.start(0);
}

void SummaryBuilder::Build(const Job& job, uint64_t tableKey)
{
    // The block must still be where the render saw it; only then is it
    // known to be alive (the channel holds it, and only this thread edits).
    const SampleBlock* block = nullptr;
    channel_->ReadSpans(job.index, 1, [&](const SampleSpan& span) {
        if (span.block != nullptr && span.block->Id() == job.id && span.offset == 0)
            block = span.block;
    });
    if (block == nullptr)
        return;
    const std::shared_ptr<const BlockSummary> existing = block->Summary();
    if (existing != nullptr && existing->TableKey() == tableKey)
        return;  // another view of a shared block made it
    std::shared_ptr<const BlockSummary> summary =
        BlockSummary::Make(block->Samples(), block->Count(), rowTable_, tableKey);
    if (summary != nullptr) {
        block->SetSummary(std::move(summary));
        ++summariesMade_;
    }
}

}  // namespace glimmet
