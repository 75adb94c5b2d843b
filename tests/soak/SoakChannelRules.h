#pragma once

#include <cstdint>

#include "SoakSamples.h"

namespace glimmet::test {

/// What the model knows of one channel: its samples on a timeline from a
/// first frame, and the flags the user sets.
struct SoakChannelState {
    SoakSamples samples;
    int64_t first = 0;
    bool selected = false;
    bool muted = false;
    int8_t pan = 0;
};

/// The channel editing rules written out again over compact samples, with
/// the documented quirks, and reads past the data giving 0. Only for
/// channels that hold an array (possibly emptied by edits), not for a fresh
/// channel that never held data.
class SoakChannelRules {
public:
    /// The most frames a channel holds: an edit that would make it longer
    /// leaves it as it was (an undo of a Truncate far before frame 0 can ask
    /// for more).
    static constexpr int64_t kLongestData = int64_t(UINT32_MAX);

    static int64_t End(const SoakChannelState& c) { return c.first + c.samples.Size(); }

    /// False, leaving buffer alone, for a request starting exactly at the end.
    static bool Fill(const SoakChannelState& c, SoakSamples& buffer, int64_t start, int64_t n);
    static void Insert(SoakChannelState& c, const SoakSamples& frames, int64_t at);
    static void Replace(SoakChannelState& c, const SoakSamples& frames, int64_t from, int64_t to);
    static void Remove(SoakChannelState& c, int64_t from, int64_t to);
};

}  // namespace glimmet::test
