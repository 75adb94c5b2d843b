#pragma once

#include <cstdint>
#include <functional>
#include <vector>

#include "SoakModel.h"

namespace glimmet::test {

/// What each recorded action does to the model document when it runs (its
/// first run and every redo), by the edits' own rules written out again.
class SoakActions {
public:
    static void Go(SoakModel& model, SoakRecord& r);

private:
    static void Transform(SoakModel& model, const SoakRecord& r);
    static void Maximize(SoakModel& model, const SoakRecord& r);
    static void Filter(SoakModel& model, const SoakRecord& r);
    static void Stretch(SoakModel& model, const SoakRecord& r);
    static void Remove(SoakModel& model, const SoakRecord& r);
    static void Paste(SoakModel& model, SoakRecord& r);
    static void Truncate(SoakModel& model, const SoakRecord& r);
    static void RemoveChannel(SoakModel& model, SoakRecord& r);
    /// Runs change over the range of every selected channel through one
    /// working buffer read from history frames before the range on, and
    /// writes the range back when write is set. A channel whose part cannot
    /// be read (it starts exactly at the channel's end) gets what the last
    /// one left in the buffer: transformed in place without history, as
    /// read with it. kept, when given, is the working buffer, shared with
    /// another pass.
    static void Pass(SoakModel& model, const SoakRecord& r, int64_t history,
        const std::function<void(std::vector<int16_t>&)>& change, bool write, std::vector<int16_t>* kept = nullptr);
};

}  // namespace glimmet::test
