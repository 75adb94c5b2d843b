#include "SoakModel.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "SoakActions.h"
#include "sound/Channel.h"
#include "support/FrameArithmetic.h"

namespace glimmet::test {

using Kind = SoakRecord::Kind;

const char* SoakKindName(Kind kind)
{
    switch (kind) {
    case Kind::FadeIn: return "Fade In";
    case Kind::FadeOut: return "Fade Out";
    case Kind::Maximize: return "Maximize";
    case Kind::Revert: return "Revert";
    case Kind::RevertPhases: return "Revert Phases";
    case Kind::Remove: return "Remove";
    case Kind::Paste: return "Paste";
    case Kind::Truncate: return "Truncate";
    case Kind::Move: return "Move Sample";
    case Kind::AddChannel: return "Add Channel";
    case Kind::RemoveChannel: return "Remove Channel";
    case Kind::Filter: return "FIR Filter";
    case Kind::Distort: return "Distortion";
    case Kind::PeakDistort: return "Peak Distort";
    case Kind::Envelope: return "Envelope";
    case Kind::Stretch: return "Time Stretch";
    }
    return "";
}

namespace {

/// The actions that rewrite the range in place, whose range starting
/// before frame 0 is never written back.
bool IsTransform(Kind kind)
{
    switch (kind) {
    case Kind::FadeIn: case Kind::FadeOut: case Kind::Maximize: case Kind::Revert: case Kind::RevertPhases:
    case Kind::Filter: case Kind::Distort: case Kind::PeakDistort: case Kind::Envelope: return true;
    default: return false;
    }
}

}  // namespace

int64_t SoakModel::Total() const
{
    int64_t total = 0;
    for (const SoakChannel& c : channels)
        total = std::max(total, SoakChannelRules::End(c.state));
    return total;
}

void SoakModel::SetRangeStart(int64_t frame)
{
    const int64_t total = Total();
    rangeStart = frame >= total ? total - 1 : frame;
    if (rangeStart > rangeEnd)
        rangeEnd = frame;
}

void SoakModel::SetRangeEnd(int64_t frame)
{
    const int64_t total = Total();
    rangeEnd = frame >= total ? total - 1 : frame;
    if (rangeStart > rangeEnd)
        rangeStart = frame;
}

SoakChannel* SoakModel::WithId(uint64_t id)
{
    for (SoakChannel& c : channels) {
        if (c.id == id)
            return &c;
    }
    return nullptr;
}

void SoakModel::Insert(SoakChannel& c, const SoakSamples& frames, int64_t at)
{
    if (frames.Empty())
        return;
    if (frames.Size() > SoakChannelRules::kLongestData)
        return;
    if (!c.hasData) {
        // Nothing to keep: the frames become the data where they go.
        c.state.samples = frames;
        c.state.first = at;
        c.hasData = true;
        return;
    }
    SoakChannelRules::Insert(c.state, frames, at);
}

void SoakModel::Replace(SoakChannel& c, const SoakSamples& frames, int64_t from, int64_t to)
{
    if (frames.Empty() || from > to || from < 0 || frames.Size() > SoakChannelRules::kLongestData)
        return;
    if (!c.hasData) {
        c.state.samples = frames;
        c.state.first = from;
        c.hasData = true;
        return;
    }
    SoakChannelRules::Replace(c.state, frames, from, to);
}

void SoakModel::Remove(SoakChannel& c, int64_t from, int64_t to)
{
    const int64_t end = SoakChannelRules::End(c.state);
    if (from < 0 || from > to || from > end)
        return;
    // Both cutting branches build the data again, even when nothing is cut,
    // which gives a data-less channel an empty array of its own.
    if (c.state.first <= from || std::min(to, end - 1) >= c.state.first)
        c.hasData = true;
    SoakChannelRules::Remove(c.state, from, to);
}

SoakRecord SoakModel::Bind(Kind kind, int64_t cursor, int32_t focused)
{
    SoakRecord r;
    r.kind = kind;
    r.start = rangeStart;
    r.end = rangeEnd;
    r.cursor = cursor;
    r.focused = focused;
    const int64_t n = r.end - r.start + 1;
    for (size_t i = 0; i < channels.size(); i++) {
        const SoakChannelState& c = channels[i].state;
        if (!c.selected)
            continue;
        if (kind == Kind::Truncate) {
            SoakRecord::Kept k{int32_t(i), c.first, false, {}, {}};
            if (c.first <= r.start) {
                k.hasHead = true;
                if (!SoakChannelRules::Fill(c, k.head, c.first, r.start - c.first))
                    k.head = SoakSamples::Zeros(r.start - c.first);
            }
            const int64_t tail = SoakChannelRules::End(c) - r.end - 1;
            if (tail > 0 && !SoakChannelRules::Fill(c, k.tail, r.end + 1, tail))
                k.tail = SoakSamples::Zeros(tail);
            r.kept.push_back(k);
        } else if (n >= 1) {
            SoakSamples data;
            // A transform's range starting before frame 0 is never written
            // back, so its frames need not be kept (they may be billions).
            if (!(IsTransform(kind) && r.start < 0) && !SoakChannelRules::Fill(c, data, r.start, n))
                data = SoakSamples::Zeros(n);
            r.snapshot.emplace_back(int32_t(i), data);
        }
    }
    return r;
}

void SoakModel::Perform(Kind kind, int64_t cursor, int32_t focused)
{
    SoakRecord r = Bind(kind, cursor, focused);
    Go(r);
    undo.push_back(std::move(r));
    redo.clear();
}

void SoakModel::PerformWith(SoakRecord record, int64_t cursor, int32_t focused)
{
    SoakRecord r = Bind(record.kind, cursor, focused);
    r.curve = record.curve;
    r.taps = record.taps;
    r.dialog = record.dialog;
    r.stretch = record.stretch;
    Go(r);
    undo.push_back(std::move(r));
    redo.clear();
}

void SoakModel::RecordMove(uint64_t id, int64_t before, int64_t after)
{
    SoakRecord r;
    r.kind = Kind::Move;
    r.channelId = id;
    r.offset = before - after;
    undo.push_back(std::move(r));
    redo.clear();
}

void SoakModel::RecordAddChannel(uint64_t id, int32_t focused)
{
    SoakRecord r;
    r.kind = Kind::AddChannel;
    r.focused = focused;
    SoakChannel fresh;
    fresh.id = id;
    fresh.hasData = false;
    fresh.state.first = 0;
    fresh.state.pan = Channel::kPanMiddle;
    channels.push_back(fresh);
    r.held.id = id;
    undo.push_back(std::move(r));
    redo.clear();
}

bool SoakModel::Undo()
{
    if (undo.empty())
        return false;
    if (undo.back().kind == Kind::Stretch) {
        undo.pop_back();
        return false;
    }
    UndoRecord(undo.back());
    redo.push_back(std::move(undo.back()));
    undo.pop_back();
    return true;
}

bool SoakModel::Redo()
{
    if (redo.empty())
        return false;
    RedoRecord(redo.back());
    undo.push_back(std::move(redo.back()));
    redo.pop_back();
    return true;
}

bool SoakModel::Copy()
{
    const int64_t n = rangeEnd - rangeStart + 1;
    std::vector<SoakSamples> copied;
    for (const SoakChannel& c : channels) {
        if (!c.state.selected)
            continue;
        if (n < 1)
            return false;
        SoakSamples data;
        // A range starting exactly at a channel's end reads nothing from it
        // ("what the....?"): its part of the copy is silence.
        if (!SoakChannelRules::Fill(c.state, data, rangeStart, n))
            data = SoakSamples::Zeros(n);
        copied.push_back(std::move(data));
    }
    if (copied.empty())
        return false;
    copyBuffer = std::move(copied);
    return true;
}

void SoakModel::Go(SoakRecord& r)
{
    SoakActions::Go(*this, r);
}

void SoakModel::Shift(uint64_t id, int64_t frames, bool back)
{
    SoakChannel* c = WithId(id);
    if (c == nullptr)
        return;
    // The first frame saturates instead of wrapping, then is kept between
    // frame 0 and the latest first frame a channel may have.
    const int64_t moved = back ? SaturatingAdd(c->state.first, frames) : SaturatingSubtract(c->state.first, frames);
    c->state.first = std::clamp<int64_t>(moved, 0, Channel::kLastFirstFrame);
}

void SoakModel::UndoRecord(SoakRecord& r)
{
    switch (r.kind) {
    case Kind::Move: return Shift(r.channelId, r.offset, true);
    case Kind::AddChannel: {
        auto found = std::find_if(channels.begin(), channels.end(), [&](const SoakChannel& c) { return c.id == r.held.id; });
        if (found != channels.end()) {
            r.held = *found;
            r.removedOne = true;
            channels.erase(found);
        }
        return;
    }
    case Kind::RemoveChannel:
        if (r.removedOne && size_t(r.index) <= channels.size())
            channels.insert(channels.begin() + r.index, r.held);
        return;
    case Kind::Truncate: return UndoTruncate(r);
    case Kind::Paste: return UndoPaste(r);
    default: break;
    }
    std::vector<int32_t> indexes;
    for (const auto& entry : r.snapshot)
        indexes.push_back(entry.first);
    Walk(indexes, [&](SoakChannel& c, size_t k) {
        const SoakSamples& data = r.snapshot[k].second;
        if (r.kind == Kind::Remove)
            Insert(c, data, r.start);
        else
            Replace(c, data, r.start, r.end);
    });
    RestoreRange(r);
}

void SoakModel::UndoTruncate(const SoakRecord& r)
{
    std::vector<int32_t> indexes;
    for (const auto& kept : r.kept)
        indexes.push_back(kept.index);
    Walk(indexes, [&](SoakChannel& c, size_t k) {
        const SoakRecord::Kept& kept = r.kept[k];
        c.state.first = std::max<int64_t>(kept.first, 0);
        if (kept.hasHead)
            Insert(c, kept.head, kept.first);
        if (!kept.tail.Empty())
            Insert(c, kept.tail, r.end + 1);
    });
    RestoreRange(r);
}

void SoakModel::UndoPaste(const SoakRecord& r)
{
    std::vector<int32_t> indexes;
    for (const auto& entry : r.snapshot)
        indexes.push_back(entry.first);
    if (!r.hadBuffer) {
        Walk(indexes, nullptr);
    } else if (r.snapshot.empty()) {
        for (int32_t i = 0; i < r.pasted && size_t(r.firstChannel + i) < channels.size(); i++) {
            Remove(channels[size_t(r.firstChannel + i)], r.pasteStart, r.pasteEnd);
            channels[size_t(r.firstChannel + i)].state.selected = true;
        }
    } else {
        Walk(indexes, [&](SoakChannel& c, size_t k) { Replace(c, r.snapshot[k].second, r.pasteStart, r.pasteEnd); });
    }
    RestoreRange(r);
}

void SoakModel::RedoRecord(SoakRecord& r)
{
    switch (r.kind) {
    case Kind::Move: return Shift(r.channelId, r.offset, false);
    case Kind::AddChannel:
        if (r.removedOne) {
            channels.push_back(r.held);
            r.removedOne = false;
        }
        return;
    case Kind::RemoveChannel:
        if (r.removedOne) {
            r.held = channels[size_t(r.index)];
            channels.erase(channels.begin() + r.index);
        }
        return;
    default: break;
    }
    RestoreRange(r);
    std::vector<int32_t> indexes;
    if (r.kind == Kind::Truncate) {
        for (const auto& kept : r.kept)
            indexes.push_back(kept.index);
    } else {
        for (const auto& entry : r.snapshot)
            indexes.push_back(entry.first);
    }
    Walk(indexes, nullptr);
    Go(r);
}

void SoakModel::Walk(const std::vector<int32_t>& indexes, const std::function<void(SoakChannel&, size_t)>& visit)
{
    size_t next = 0;
    for (size_t i = 0; i < channels.size() && next < indexes.size(); i++) {
        if (indexes[next] != int32_t(i)) {
            channels[i].state.selected = false;
            continue;
        }
        channels[i].state.selected = true;
        if (visit)
            visit(channels[i], next);
        next++;
    }
}

void SoakModel::RestoreRange(const SoakRecord& r)
{
    SetRangeStart(r.start);
    SetRangeEnd(r.end);
}

}  // namespace glimmet::test
