#include "SoakSession.h"

#include <algorithm>
#include <sstream>

#include "SoakComparison.h"
#include "SoakDialogs.h"
#include "SoakFiles.h"

#include "edit/AddChannelAction.h"
#include "edit/FadeInAction.h"
#include "edit/FadeOutAction.h"
#include "edit/MaximizeAction.h"
#include "edit/MoveSampleAction.h"
#include "edit/PasteAction.h"
#include "edit/RemoveAction.h"
#include "edit/RemoveChannelAction.h"
#include "edit/RevertAction.h"
#include "edit/RevertPhasesAction.h"
#include "edit/SelectionCopier.h"
#include "edit/TruncateAction.h"
#include "sound/SampleBlock.h"
#include "support/FrameArithmetic.h"

namespace glimmet::test {

using Kind = SoakRecord::Kind;

namespace {

// Long enough for ranges and channels to span several blocks (32768
// samples), short enough for thousands of steps a second.
constexpr int64_t kLongRange = 100000;
constexpr int64_t kLongDocument = 300000;

std::unique_ptr<Action> MakeAction(Kind kind, const CopyBuffer* copyBuffer)
{
    switch (kind) {
    case Kind::FadeIn: return std::make_unique<FadeInAction>(nullptr);
    case Kind::FadeOut: return std::make_unique<FadeOutAction>(nullptr);
    case Kind::Maximize: return std::make_unique<MaximizeAction>(nullptr);
    case Kind::Revert: return std::make_unique<RevertAction>(nullptr);
    case Kind::RevertPhases: return std::make_unique<RevertPhasesAction>(nullptr);
    case Kind::Remove: return std::make_unique<RemoveAction>(nullptr);
    case Kind::Paste: return std::make_unique<PasteAction>(nullptr, copyBuffer);
    case Kind::Truncate: return std::make_unique<TruncateAction>(nullptr);
    case Kind::AddChannel: return std::make_unique<AddChannelAction>(nullptr);
    case Kind::RemoveChannel: return std::make_unique<RemoveChannelAction>(nullptr);
    default: break;
    }
    return nullptr;
}

/// The actions made with a dialog, whose parameters the record carries.
bool HasDialog(Kind kind)
{
    return kind == Kind::Filter || kind == Kind::Distort || kind == Kind::PeakDistort || kind == Kind::Envelope
        || kind == Kind::Stretch;
}

std::string NameOr(const char* name)
{
    return name != nullptr ? name : "(none)";
}

}  // namespace

SoakSession::SoakSession(uint64_t seed) : random_(seed)
{
    // Channels long enough to span several blocks, at different places.
    const int8_t pans[3] = {Channel::kPanLeft, Channel::kPanMiddle, Channel::kPanRight};
    for (int c = 0; c < 3; c++) {
        std::mt19937 samples{uint32_t(random_())};
        const size_t length = size_t(40000 + random_() % 60000);
        const int64_t first = c == 2 ? int64_t(random_() % 5000) : 0;
        Channel* channel = document_.AddChannel(RandomSamples(samples, length), first, true);
        channel->SetPanPosition(pans[c]);
        channel->SetMuted(c == 1);
        const ChannelState state = TestDocument::StateOf(channel);
        model_.channels.push_back(
            {channel->Id(), {SoakSamples(state.samples), state.first, state.selected, state.muted, state.pan}, true});
    }
    document_.SetRange(0, 10);
    model_.SetRangeStart(0);
    model_.SetRangeEnd(10);
}

std::string SoakSession::Difference()
{
    if (!mismatch_.empty())
        return mismatch_;
    const int32_t count = document_.manager.CountChannels();
    std::ostringstream out;
    if (size_t(count) != model_.channels.size()) {
        out << count << " channels, expected " << model_.channels.size();
        return out.str();
    }
    if (document_.mirror.shown.size() != size_t(count))
        return "the channel list announced differs from the document";
    for (int32_t i = 0; i < count; i++) {
        Channel* channel = document_.manager.ChannelAt(i);
        const SoakChannel& expected = model_.channels[size_t(i)];
        if (channel->Id() != expected.id || document_.mirror.shown[size_t(i)] != channel) {
            out << "channel " << i << " is not the expected one";
            return out.str();
        }
        const std::string difference = SoakComparison::Difference(size_t(i), channel, expected.state);
        if (!difference.empty())
            return difference;
    }
    if (document_.manager.RangeStart() != model_.rangeStart || document_.manager.RangeEnd() != model_.rangeEnd) {
        out << "range " << document_.manager.RangeStart() << ".." << document_.manager.RangeEnd() << ", expected "
            << model_.rangeStart << ".." << model_.rangeEnd;
        return out.str();
    }
    const std::string undo = NameOr(history_.UndoName());
    const std::string redo = NameOr(history_.RedoName());
    const std::string undoExpected = model_.undo.empty() ? "(none)" : SoakKindName(model_.undo.back().kind);
    const std::string redoExpected = model_.redo.empty() ? "(none)" : SoakKindName(model_.redo.back().kind);
    if (undo != undoExpected || redo != redoExpected)
        return "undo/redo names " + undo + "/" + redo + ", expected " + undoExpected + "/" + redoExpected;
    return {};
}

int64_t SoakSession::Frame(uint64_t r) const
{
    const int64_t total = model_.Total();
    const uint64_t v = r >> 8;
    switch (r % 16) {
    case 0: return -1;
    case 1: return total + int64_t(v % 3);
    case 2: return 0;
    case 3: return total - 1;
    default: return int64_t(v % uint64_t(total + 1));
    }
}

void SoakSession::ChooseSelection(uint64_t bits)
{
    const bool all = bits % 5 == 0;
    for (size_t c = 0; c < model_.channels.size(); c++) {
        const bool selected = all || ((bits >> (c + 8)) & 1) != 0;
        model_.channels[c].state.selected = selected;
        document_.manager.ChannelAt(int32_t(c))->SetSelected(selected);
    }
}

void SoakSession::ChooseRange(const SoakStep& step, bool shorten)
{
    const int64_t total = model_.Total();
    int64_t start = 0;
    int64_t end = 0;
    if (step.huge) {
        const int64_t starts[4] = {INT32_MIN, -1000000000, -1, 0};
        const int64_t ends[4] = {INT32_MAX, 100, -999999990, total - 1};
        start = starts[step.r[2] % 4];
        end = ends[step.r[3] % 4];
    } else {
        start = Frame(step.r[2]);
        const uint64_t v = step.r[3] >> 8;
        switch (step.r[3] % 8) {
        case 0: end = start - 1 - int64_t(v % 20); break;
        case 1: end = Frame(step.r[3] >> 4); break;
        case 2: case 3: case 4: end = start + int64_t(v % 60); break;
        default: end = start + int64_t(v % uint64_t(std::min<int64_t>(total / 2, kLongRange) + 1));
        }
        if (shorten) {
            start = int64_t(step.r[2] % uint64_t(total / 2 + 1));
            end = start + total / 4;
        }
    }
    document_.SetRange(start, end);
    model_.SetRangeStart(start);
    model_.SetRangeEnd(end);
}

std::string SoakSession::Act(Kind kind, const SoakStep& step)
{
    SoakRecord record;
    record.kind = kind;
    return Act(record, step);
}

std::string SoakSession::Act(SoakRecord record, const SoakStep& step)
{
    const Kind kind = record.kind;
    const int64_t cursor = step.r[0] % 4 == 0 ? model_.rangeStart : Frame(step.r[3] >> 3);
    const int32_t focus = int32_t((step.r[3] >> 50) % (model_.channels.size() + 1)) - 1;
    document_.position.SetCursorFrame(cursor);
    document_.position.SetFocusIndex(focus);
    model_.focus = focus;
    std::unique_ptr<Action> action = HasDialog(kind) ? SoakDialogs::Make(record) : MakeAction(kind, &copyBuffer_);
    std::ostringstream out;
    out << SoakKindName(kind) << " over " << model_.rangeStart << ".." << model_.rangeEnd << ", cursor " << cursor
        << ", focus " << focus << ", selected";
    for (const SoakChannel& c : model_.channels)
        out << ' ' << (c.state.selected ? 1 : 0);
    if (kind == Kind::Stretch)
        out << ", factor " << record.stretch;
    else if (HasDialog(kind))
        out << ", curve " << record.curve.y0 << ".." << record.curve.y1 << (record.curve.readable ? "" : " unreadable")
            << (kind == Kind::Filter ? ", taps " + std::to_string(record.taps) : std::string());
    if (action->SetTo(&document_.manager, &document_.position) != B_OK)
        return out.str() + " (refused to bind)";
    Action* raw = action.get();
    if (history_.AddAction(action) != B_OK)
        return out.str() + " (refused by the history)";
    raw->Go();
    if (kind == Kind::AddChannel)
        model_.RecordAddChannel(document_.manager.ChannelAt(document_.manager.CountChannels() - 1)->Id(), focus);
    else if (HasDialog(kind))
        model_.PerformWith(record, cursor, focus);
    else
        model_.Perform(kind, cursor, focus);
    return out.str();
}

std::string SoakSession::CopyStep()
{
    const bool copied = SelectionCopier::CopySelection(document_.manager, copyBuffer_);
    const bool expected = model_.Copy();
    std::ostringstream out;
    out << "Copy " << model_.rangeStart << ".." << model_.rangeEnd << (copied ? "" : " (nothing)");
    if (copied != expected)
        mismatch_ = std::string("the copy was ") + (copied ? "made" : "refused") + " in the document only";
    return out.str();
}

std::string SoakSession::ForeignCopy(const SoakStep& step)
{
    // What another window's Copy leaves in the shared buffer.
    const size_t channels = size_t(1 + step.r[1] % 3);
    const size_t frames = size_t(1 + (step.r[2] % 8 == 0 ? step.r[3] % 70000 : step.r[3] % 60));
    std::mt19937 samples(uint32_t(step.r[0]));
    std::vector<CopyBuffer::Samples> arrays;
    model_.copyBuffer.clear();
    for (size_t c = 0; c < channels; c++) {
        const std::vector<int16_t> random = RandomSamples(samples, frames);
        model_.copyBuffer.push_back(SoakSamples(random));
        arrays.push_back(Channel::Allocate(int64_t(frames)));
        std::copy(random.begin(), random.end(), arrays.back().get());
    }
    copyBuffer_.SetCopyBuffer(std::move(arrays), int64_t(frames));
    return "a copy from elsewhere: " + std::to_string(channels) + " x " + std::to_string(frames) + " frames";
}

std::string SoakSession::Edit(const SoakStep& step)
{
    SoakStep::Op op = step.op;
    // Keep the document from wasting away to nothing.
    if (model_.Total() < 40 && (op == SoakStep::Remove || op == SoakStep::Cut || op == SoakStep::Truncate)) {
        ForeignCopy(step);
        op = SoakStep::Paste;
    }
    // Nor grow without bound: ranges reaching past the data and pastes
    // lengthen channels, and a long document makes every step slow.
    if (model_.Total() > kLongDocument
        && (op == SoakStep::Transform || op == SoakStep::Paste || op == SoakStep::CurveEffect || op == SoakStep::Stretch))
        op = SoakStep::Remove;
    ChooseSelection(step.r[1]);
    ChooseRange(step, op == SoakStep::Remove && model_.Total() > kLongDocument);
    if (op == SoakStep::Stretch)
        ChooseShortRange(step);
    static const Kind kCurveKinds[4] = {Kind::Filter, Kind::Distort, Kind::PeakDistort, Kind::Envelope};
    switch (op) {
    case SoakStep::CurveEffect: return Act(SoakDialogs::Draw(kCurveKinds[step.r[0] % 4], step), step);
    case SoakStep::Stretch: return Act(SoakDialogs::Draw(Kind::Stretch, step), step);
    case SoakStep::Transform: return Act(Kind(step.r[0] % 5), step);
    case SoakStep::Remove: return Act(Kind::Remove, step);
    case SoakStep::Cut: return CopyStep() + "; " + Act(Kind::Remove, step);
    case SoakStep::Paste: return Act(Kind::Paste, step);
    case SoakStep::Truncate: return Act(Kind::Truncate, step);
    default: return CopyStep();
    }
}

std::string SoakSession::Move(const SoakStep& step, bool huge)
{
    if (model_.channels.empty())
        return "Move: no channel";
    const size_t index = size_t(step.r[1] % model_.channels.size());
    Channel* channel = document_.manager.ChannelAt(int32_t(index));
    const int64_t deltas[6] = {INT64_MIN, INT64_MAX, 9223372036854775000, -9223372036854775000, int64_t(1) << 40,
        -(int64_t(1) << 41)};
    const int64_t delta = huge ? deltas[step.r[2] % 6] : int64_t(step.r[2] % 2001) - 1000;
    // The view moves the channel while it is dragged; the window then
    // records the distance back as the action.
    const int64_t before = channel->FirstFrame();
    channel->SetStartFrameOffset(SaturatingAdd(before, delta));
    const int64_t after = channel->FirstFrame();
    auto action = std::make_unique<MoveSampleAction>(nullptr);
    action->SetTo(&document_.manager, channel, before - after);
    std::unique_ptr<Action> recorded = std::move(action);
    history_.AddAction(recorded);
    model_.channels[index].state.first = std::clamp<int64_t>(SaturatingAdd(before, delta), 0, Channel::kLastFirstFrame);
    model_.RecordMove(model_.channels[index].id, before, model_.channels[index].state.first);
    std::string done = "Move channel " + std::to_string(index) + " by " + std::to_string(delta);
    // A channel left far out would make every later range billions of
    // frames long; the far move is taken back at once, and sometimes done
    // and taken back again.
    if (huge)
        done += "; " + Runs(true, 1) + (step.r[3] % 2 == 0 ? "; " + Runs(false, 1, true) + "; " + Runs(true, 1) : "");
    return done;
}

std::string SoakSession::Runs(bool undo, uint64_t count, bool far)
{
    uint64_t done = 0;
    for (uint64_t i = 0; i < count; i++) {
        // A far move is only ever done and taken back at once (see Move):
        // left done, every later range would be billions of frames long.
        if (!undo && !far && !model_.redo.empty() && model_.redo.back().kind == Kind::Move
            && (model_.redo.back().offset > kLongDocument || model_.redo.back().offset < -kLongDocument))
            break;
        const status_t status = undo ? history_.Undo() : history_.Redo();
        const bool expected = undo ? model_.Undo() : model_.Redo();
        if ((status == B_OK) != expected) {
            mismatch_ = std::string(undo ? "Undo" : "Redo") + ": the history " + (status == B_OK ? "had" : "lacked")
                + " an action";
            return mismatch_;
        }
        if (!expected)
            break;
        done++;
    }
    return std::string(undo ? "Undo x" : "Redo x") + std::to_string(done);
}

std::string SoakSession::ChannelStep(const SoakStep& step)
{
    const size_t count = model_.channels.size();
    const size_t index = count > 0 ? size_t(step.r[1] % count) : 0;
    Channel* channel = count > 0 ? document_.manager.ChannelAt(int32_t(index)) : nullptr;
    switch (step.op) {
    case SoakStep::AddChannel:
        if (count >= 6)
            return "Add Channel skipped: six channels";
        return Act(Kind::AddChannel, step);
    case SoakStep::RemoveChannel:
        if (count <= 1)
            return "Remove Channel skipped: one channel";
        return Act(Kind::RemoveChannel, step);
    case SoakStep::Mute: {
        if (channel == nullptr)
            return "Mute: no channel";
        const bool muted = !model_.channels[index].state.muted;
        channel->SetMuted(muted);
        model_.channels[index].state.muted = muted;
        return "Mute channel " + std::to_string(index) + (muted ? " on" : " off");
    }
    case SoakStep::Pan: {
        if (channel == nullptr)
            return "Pan: no channel";
        const int8_t values[4] = {Channel::kPanLeft, Channel::kPanMiddle, Channel::kPanRight, int8_t(step.r[3])};
        const int8_t pan = values[step.r[2] % 4];
        channel->SetPanPosition(pan);
        // Only the three positions exist; anything else is the middle.
        const bool known = pan == Channel::kPanLeft || pan == Channel::kPanMiddle || pan == Channel::kPanRight;
        model_.channels[index].state.pan = known ? pan : Channel::kPanMiddle;
        return "Pan channel " + std::to_string(index) + " to " + std::to_string(int(pan));
    }
    default: {
        if (channel == nullptr)
            return "Select: no channel";
        const bool selected = !model_.channels[index].state.selected;
        channel->SetSelected(selected);
        model_.channels[index].state.selected = selected;
        return "Select channel " + std::to_string(index) + (selected ? " on" : " off");
    }
    }
}

std::string SoakSession::DeleteHistory()
{
    history_.Clear();
    model_.undo.clear();
    model_.redo.clear();
    return "Delete History";
}

void SoakSession::ChooseShortRange(const SoakStep& step)
{
    // Short enough for the vocoder to leave the stretch silent (see
    // SoakEffects), sometimes empty, sometimes before frame 0.
    const int64_t start = Frame(step.r[2]);
    const int64_t length = int64_t((step.r[3] >> 8) % 3000) - (step.r[3] % 8 == 0 ? 1000 : 0);
    document_.SetRange(start, start + length);
    model_.SetRangeStart(start);
    model_.SetRangeEnd(start + length);
}

std::string SoakSession::Redraw(const SoakStep& step)
{
    // The effect on top of the undo stack is taken back first, so that
    // the dialog redrawn is the one the redo reads.
    std::string done;
    if ((model_.redo.empty() || model_.redo.back().dialog == nullptr) && !model_.undo.empty()
        && model_.undo.back().dialog != nullptr)
        done = Runs(true, 1) + "; ";
    if (model_.redo.empty() || model_.redo.back().dialog == nullptr)
        return "Redraw: no kept dialog to redo";
    SoakRecord& top = model_.redo.back();
    SoakDialogs::Redraw(top, SoakDialogs::DrawCurve(step.r[1]));
    std::ostringstream out;
    out << done << "Redraw the dialog of " << SoakKindName(top.kind) << " to " << top.curve.y0 << ".."
        << top.curve.y1 << (top.curve.readable ? "" : " unreadable");
    if (step.r[2] % 4 != 0)
        out << "; " << Runs(false, 1);
    return out.str();
}

std::string SoakSession::Apply(const SoakStep& step)
{
    // Undoing a long history can give back far more than the document
    // holds now (some undos lengthen channels); past a point the history
    // goes, as the user's "Delete History" would have it.
    if (model_.Total() > 4 * kLongDocument)
        DeleteHistory();
    switch (step.op) {
    case SoakStep::DeleteHistory: return DeleteHistory();
    case SoakStep::Transform:
    case SoakStep::Remove:
    case SoakStep::Cut:
    case SoakStep::Paste:
    case SoakStep::Truncate:
    case SoakStep::Copy:
    case SoakStep::CurveEffect:
    case SoakStep::Stretch: return Edit(step);
    case SoakStep::Redraw: return Redraw(step);
    case SoakStep::Save: return SoakFiles::SaveAndReopen(document_, history_, model_, mismatch_);
    case SoakStep::FailedSave: return SoakFiles::FailedSave(document_, history_, mismatch_);
    case SoakStep::ForeignCopy: return ForeignCopy(step);
    case SoakStep::Move: return Move(step, false);
    case SoakStep::HugeMove: return Move(step, true);
    case SoakStep::UndoRun: return Runs(true, step.r[1] % 10 == 0 ? 1000 : 1 + step.r[1] % 6);
    case SoakStep::RedoRun: return Runs(false, step.r[1] % 10 == 0 ? 1000 : 1 + step.r[1] % 6);
    default: return ChannelStep(step);
    }
}

}  // namespace glimmet::test
