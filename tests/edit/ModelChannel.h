#pragma once

#include <algorithm>
#include <cstdint>
#include <vector>

#include "TestDocument.h"

namespace glimmet::test {

/// The channel editing rules written out again over a ChannelState, as the
/// model documents' reference: samples on a timeline from a first frame,
/// with the documented quirks, and reads past the data giving 0. Only for
/// channels that hold an array (possibly emptied by edits), not for a fresh
/// channel that never held data.
struct ModelChannel {
    static int64_t End(const ChannelState& c) { return c.first + int64_t(c.samples.size()); }

    static int16_t At(const ChannelState& c, int64_t index)
    {
        return index >= 0 && index < int64_t(c.samples.size()) ? c.samples[size_t(index)] : int16_t(0);
    }

    /// False, leaving buffer alone, for a request starting exactly at the end.
    static bool Fill(const ChannelState& c, std::vector<int16_t>& buffer, int64_t start, int64_t n)
    {
        const int64_t end = End(c);
        const int64_t last = start + n - 1;
        if (start == end)
            return false;
        buffer.assign(size_t(n), 0);
        if (start >= c.first && start < end) {
            for (int64_t k = 0; k < n; k++)
                buffer[size_t(k)] = At(c, start - c.first + k);
        } else if (start < c.first && last > c.first) {
            const int64_t gap = c.first - start;
            for (int64_t k = gap; k < n; k++)
                buffer[size_t(k)] = At(c, k - gap);
        }
        return true;
    }

    static void Insert(ChannelState& c, const std::vector<int16_t>& frames, int64_t at)
    {
        if (frames.empty())
            return;
        const int64_t end = End(c);
        if (at >= c.first && at < end) {
            c.samples.insert(c.samples.begin() + (at - c.first), frames.begin(), frames.end());
        } else if (at >= end) {
            c.samples.resize(size_t(at - c.first), 0);
            c.samples.insert(c.samples.end(), frames.begin(), frames.end());
        } else {
            std::vector<int16_t> fresh = frames;
            fresh.resize(frames.size() + size_t(c.first - at), 0);
            fresh.insert(fresh.end(), c.samples.begin(), c.samples.end());
            c.samples = fresh;
            c.first = at;
        }
    }

    static void Replace(ChannelState& c, const std::vector<int16_t>& frames, int64_t from, int64_t to)
    {
        if (frames.empty() || from > to || from < 0)
            return;
        const int64_t end = End(c);
        std::vector<int16_t> fresh;
        if (from >= c.first) {
            const size_t head = size_t(std::min(from, end) - c.first);
            fresh.assign(c.samples.begin(), c.samples.begin() + long(head));
            fresh.resize(size_t(from - c.first), 0);
            fresh.insert(fresh.end(), frames.begin(), frames.end());
            if (to < end)
                fresh.insert(fresh.end(), c.samples.begin() + (to - c.first + 1), c.samples.end());
        } else {
            fresh = frames;
            if (to >= end) {
                // nothing of the old data is kept
            } else if (to >= c.first) {
                fresh.insert(fresh.end(), c.samples.begin() + (to - c.first + 1), c.samples.end());
            } else {
                fresh.resize(frames.size() + size_t(c.first - to - 1), 0);
                fresh.insert(fresh.end(), c.samples.begin(), c.samples.end());
            }
            c.first = from;
        }
        c.samples = fresh;
    }

    static void Remove(ChannelState& c, int64_t from, int64_t to)
    {
        const int64_t end = End(c);
        if (from < 0 || from > to || from > end)
            return;
        to = std::min(to, end - 1);
        if (c.first <= from) {
            if (to >= from)
                c.samples.erase(c.samples.begin() + (from - c.first), c.samples.begin() + (to - c.first + 1));
        } else if (to >= c.first) {
            // The kept part starts at the sample at `to` itself; the sample
            // that does not fit is dropped.
            const int64_t length = int64_t(c.samples.size()) - (to - c.first + 1);
            c.samples = std::vector<int16_t>(c.samples.begin() + (to - c.first), c.samples.begin() + (to - c.first) + length);
            c.first = from;
        } else {
            c.first -= to - from + 1;
        }
    }
};

}  // namespace glimmet::test
