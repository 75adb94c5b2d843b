#include "SoakChannelRules.h"

#include <algorithm>

namespace glimmet::test {

bool SoakChannelRules::Fill(const SoakChannelState& c, SoakSamples& buffer, int64_t start, int64_t n)
{
    const int64_t end = End(c);
    const int64_t last = start + n - 1;
    if (start == end)
        return false;
    if (start >= c.first && start < end) {
        buffer = c.samples.Slice(start - c.first, n);
    } else if (start < c.first && last > c.first) {
        const int64_t gap = c.first - start;
        buffer = SoakSamples::Zeros(gap);
        buffer.Append(c.samples.Slice(0, n - gap));
    } else {
        // A request ending exactly at the first frame reads nothing of it.
        buffer = SoakSamples::Zeros(n);
    }
    return true;
}

void SoakChannelRules::Insert(SoakChannelState& c, const SoakSamples& frames, int64_t at)
{
    if (frames.Empty())
        return;
    const int64_t end = End(c);
    const int64_t grown = at >= end ? at - c.first + frames.Size() : c.samples.Size() + frames.Size() + std::max<int64_t>(c.first - at, 0);
    if (grown > kLongestData)
        return;
    if (at >= c.first && at < end) {
        c.samples.Insert(at - c.first, frames);
    } else if (at >= end) {
        c.samples.Resize(at - c.first);
        c.samples.Append(frames);
    } else {
        SoakSamples fresh = frames;
        fresh.AppendZeros(c.first - at);
        fresh.Append(c.samples);
        c.samples = std::move(fresh);
        c.first = at;
    }
}

void SoakChannelRules::Replace(SoakChannelState& c, const SoakSamples& frames, int64_t from, int64_t to)
{
    if (frames.Empty() || from > to || from < 0)
        return;
    const int64_t end = End(c);
    const int64_t size = c.samples.Size();
    SoakSamples fresh;
    if (from >= c.first) {
        fresh = c.samples.Slice(0, std::min(from, end) - c.first);
        fresh.Resize(from - c.first);
        fresh.Append(frames);
        if (to < end)
            fresh.Append(c.samples.Slice(to - c.first + 1, size - (to - c.first + 1)));
    } else {
        fresh = frames;
        if (to >= end) {
            // nothing of the old data is kept
        } else if (to >= c.first) {
            fresh.Append(c.samples.Slice(to - c.first + 1, size - (to - c.first + 1)));
        } else {
            fresh.AppendZeros(c.first - to - 1);
            fresh.Append(c.samples);
        }
    }
    if (fresh.Size() > kLongestData)
        return;
    c.first = std::min(from, c.first);
    c.samples = std::move(fresh);
}

void SoakChannelRules::Remove(SoakChannelState& c, int64_t from, int64_t to)
{
    const int64_t end = End(c);
    if (from < 0 || from > to || from > end)
        return;
    to = std::min(to, end - 1);
    if (c.first <= from) {
        if (to >= from)
            c.samples.Erase(from - c.first, to - c.first + 1);
    } else if (to >= c.first) {
        // The kept part starts at the sample at `to` itself; the sample
        // that does not fit is dropped.
        const int64_t length = c.samples.Size() - (to - c.first + 1);
        c.samples = c.samples.Slice(to - c.first, length);
        c.first = from;
    } else {
        c.first -= to - from + 1;
    }
}

}  // namespace glimmet::test
