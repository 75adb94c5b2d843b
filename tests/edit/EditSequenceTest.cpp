#include <gtest/gtest.h>

#include <random>

#include "ModelChannel.h"
#include "TestDocument.h"
#include "TransformCases.h"
#include "edit/CopyBuffer.h"
#include "edit/HistoryManager.h"
#include "edit/MoveSampleAction.h"
#include "edit/PasteAction.h"
#include "edit/RemoveAction.h"
#include "edit/TruncateAction.h"

namespace glimmet {
namespace {

using test::ChannelState;
using test::DocumentState;
using test::ModelChannel;
using test::TestDocument;

enum class Kind { FadeIn, FadeOut, Maximize, Revert, RevertPhases, Remove, Paste, Truncate, Move };

/// What the model remembers of one recorded action.
struct Record {
    Kind kind;
    int64_t start = 0;
    int64_t end = 0;
    int64_t cursor = 0;
    int32_t focused = 0;
    // Base snapshot: channel index and its range at binding time.
    std::vector<std::pair<int32_t, std::vector<int16_t>>> snapshot;
    // Paste: what Go found.
    int64_t pasteStart = 0;
    int64_t pasteEnd = 0;
    int32_t firstChannel = -1;
    int32_t pasted = 0;
    // Whether the last Go had a buffer: an empty paste's undo only gives
    // back the range and the selection.
    bool hadBuffer = false;
    // Truncate: per selected channel, index, first frame, head and tail.
    struct Kept {
        int32_t index;
        int64_t first;
        bool hasHead;
        std::vector<int16_t> head;
        std::vector<int16_t> tail;
    };
    std::vector<Kept> kept;
    // Move.
    int32_t channel = 0;
    int64_t offset = 0;
};

/// The document as the test expects it, changed by the documented rules of
/// every action, written independently of the actions.
class EditModel {
public:
    DocumentState s;
    std::vector<std::vector<int16_t>> copyBuffer;

    int64_t Total() const
    {
        int64_t total = 0;
        for (const ChannelState& c : s.channels)
            total = std::max(total, ModelChannel::End(c));
        return total;
    }

    void SetRangeStart(int64_t frame)
    {
        const int64_t total = Total();
        s.rangeStart = frame >= total ? total - 1 : frame;
        if (s.rangeStart > s.rangeEnd)
            s.rangeEnd = frame;
    }

    void SetRangeEnd(int64_t frame)
    {
        const int64_t total = Total();
        s.rangeEnd = frame >= total ? total - 1 : frame;
        if (s.rangeStart > s.rangeEnd)
            s.rangeStart = frame;
    }

    Record Bind(Kind kind, int64_t cursor, int32_t focused)
    {
        Record r;
        r.kind = kind;
        r.start = s.rangeStart;
        r.end = s.rangeEnd;
        r.cursor = cursor;
        r.focused = focused;
        const int64_t n = r.end - r.start + 1;
        for (size_t i = 0; i < s.channels.size(); i++) {
            const ChannelState& c = s.channels[i];
            if (!c.selected)
                continue;
            if (kind == Kind::Truncate) {
                Record::Kept k{int32_t(i), c.first, false, {}, {}};
                if (c.first <= r.start) {
                    k.hasHead = true;
                    if (!ModelChannel::Fill(c, k.head, c.first, r.start - c.first))
                        k.head.assign(size_t(r.start - c.first), 0);
                }
                const int64_t tail = ModelChannel::End(c) - r.end - 1;
                if (tail > 0 && !ModelChannel::Fill(c, k.tail, r.end + 1, tail))
                    k.tail.assign(size_t(tail), 0);
                r.kept.push_back(k);
            } else if (n >= 1) {
                std::vector<int16_t> data;
                if (!ModelChannel::Fill(c, data, r.start, n))
                    data.assign(size_t(n), 0);
                r.snapshot.emplace_back(int32_t(i), data);
            }
        }
        return r;
    }

    void Go(Record& r)
    {
        switch (r.kind) {
        case Kind::Remove: return GoRemove(r);
        case Kind::Paste: return GoPaste(r);
        case Kind::Truncate: return GoTruncate(r);
        case Kind::Move: return;
        default: return GoTransform(r);
        }
    }

    void Undo(const Record& r)
    {
        if (r.kind == Kind::Move) {
            Shift(r.channel, r.offset);
            return;
        }
        if (r.kind == Kind::Truncate) {
            Walk(KeptIndexes(r), [&](ChannelState& c, size_t k) {
                const Record::Kept& kept = r.kept[k];
                c.first = std::max<int64_t>(kept.first, 0);
                if (kept.hasHead)
                    ModelChannel::Insert(c, kept.head, kept.first);
                if (!kept.tail.empty())
                    ModelChannel::Insert(c, kept.tail, r.end + 1);
            });
            RestoreRange(r);
            return;
        }
        if (r.kind == Kind::Paste && !r.hadBuffer) {
            Walk(SnapshotIndexes(r), [](ChannelState&, size_t) {});
            RestoreRange(r);
            return;
        }
        if (r.kind == Kind::Paste && r.snapshot.empty()) {
            for (int32_t i = 0; i < r.pasted && size_t(r.firstChannel + i) < s.channels.size(); i++) {
                ModelChannel::Remove(s.channels[size_t(r.firstChannel + i)], r.pasteStart, r.pasteEnd);
                s.channels[size_t(r.firstChannel + i)].selected = true;
            }
            RestoreRange(r);
            return;
        }
        Walk(SnapshotIndexes(r), [&](ChannelState& c, size_t k) {
            const std::vector<int16_t>& data = r.snapshot[k].second;
            if (r.kind == Kind::Remove)
                ModelChannel::Insert(c, data, r.start);
            else if (r.kind == Kind::Paste)
                ModelChannel::Replace(c, data, r.pasteStart, r.pasteEnd);
            else
                ModelChannel::Replace(c, data, r.start, r.end);
        });
        RestoreRange(r);
    }

    void Redo(Record& r)
    {
        if (r.kind == Kind::Move) {
            Shift(r.channel, -r.offset);
            return;
        }
        RestoreRange(r);
        Walk(r.kind == Kind::Truncate ? KeptIndexes(r) : SnapshotIndexes(r), nullptr);
        Go(r);
    }

    void Shift(int32_t channel, int64_t frames)
    {
        ChannelState& c = s.channels[size_t(channel)];
        c.first = std::max<int64_t>(c.first + frames, 0);
    }

private:
    static std::vector<int32_t> SnapshotIndexes(const Record& r)
    {
        std::vector<int32_t> indexes;
        for (const auto& entry : r.snapshot)
            indexes.push_back(entry.first);
        return indexes;
    }

    static std::vector<int32_t> KeptIndexes(const Record& r)
    {
        std::vector<int32_t> indexes;
        for (const auto& kept : r.kept)
            indexes.push_back(kept.index);
        return indexes;
    }

    void Walk(const std::vector<int32_t>& indexes, const std::function<void(ChannelState&, size_t)>& visit)
    {
        size_t next = 0;
        for (size_t i = 0; i < s.channels.size() && next < indexes.size(); i++) {
            if (indexes[next] != int32_t(i)) {
                s.channels[i].selected = false;
                continue;
            }
            s.channels[i].selected = true;
            if (visit)
                visit(s.channels[i], next);
            next++;
        }
    }

    void RestoreRange(const Record& r)
    {
        SetRangeStart(r.start);
        SetRangeEnd(r.end);
    }

    void GoTransform(const Record& r)
    {
        const int64_t n = r.end - r.start + 1;
        if (n < 1)
            return;
        std::vector<int16_t> buffer(size_t(n), 0);
        auto pass = [&](const std::function<void(std::vector<int16_t>&)>& change, bool write) {
            for (ChannelState& c : s.channels) {
                if (!c.selected)
                    continue;
                std::vector<int16_t> filled;
                if (ModelChannel::Fill(c, filled, r.start, n))
                    buffer = filled;
                change(buffer);
                if (write)
                    ModelChannel::Replace(c, buffer, r.start, r.end);
            }
        };
        using Ref = test::TransformReference;
        switch (r.kind) {
        case Kind::FadeIn: pass([](auto& b) { b = Ref::FadeIn(b); }, true); break;
        case Kind::FadeOut: pass([](auto& b) { b = Ref::FadeOut(b); }, true); break;
        case Kind::Revert: pass([](auto& b) { b = Ref::Revert(b); }, true); break;
        case Kind::RevertPhases: pass([](auto& b) { b = Ref::RevertPhases(b); }, true); break;
        default: {
            int peak = 0;
            pass([&peak](auto& b) {
                for (int16_t v : b) {
                    if (std::abs(int(v)) > std::abs(peak))
                        peak = v;
                }
            }, false);
            if (std::abs(peak) > 32766)
                break;
            const float factor = peak == 0 ? std::numeric_limits<float>::infinity() : std::fabs(32767.0f / float(peak));
            pass([factor](auto& b) {
                for (int16_t& v : b)
                    v = Ref::Low16(double(factor) * v);
            }, true);
        }
        }
    }

    void GoRemove(const Record& r)
    {
        bool cut = false;
        for (ChannelState& c : s.channels) {
            if (!c.selected)
                continue;
            ModelChannel::Remove(c, r.start, r.end);
            c.selected = false;
            cut = true;
        }
        if (cut) {
            SetRangeStart(-1);
            SetRangeEnd(-1);
        }
    }

    void GoPaste(Record& r)
    {
        r.firstChannel = -1;
        for (size_t i = 0; i < s.channels.size(); i++) {
            if (s.channels[i].selected) {
                r.firstChannel = int32_t(i);
                break;
            }
        }
        r.hadBuffer = !copyBuffer.empty();
        if (!r.hadBuffer)
            return;
        r.pasted = 0;
        const int64_t frames = int64_t(copyBuffer[0].size());
        const bool replace = r.firstChannel >= 0 && r.start >= 0 && r.start <= r.end;
        if (!replace)
            r.firstChannel = r.focused;
        for (size_t i = 0; i < copyBuffer.size(); i++) {
            const size_t target = size_t(r.firstChannel) + i;
            if (target >= s.channels.size())
                break;
            if (replace) {
                ModelChannel::Replace(s.channels[target], copyBuffer[i], r.start, r.end);
            } else {
                ModelChannel::Insert(s.channels[target], copyBuffer[i], r.cursor);
                s.channels[target].selected = true;
            }
            r.pasted++;
        }
        if (replace) {
            r.pasteStart = r.start;
            r.pasteEnd = r.cursor + frames - 1;
            SetRangeEnd(r.pasteEnd);
        } else {
            r.pasteStart = r.cursor;
            r.pasteEnd = r.cursor + frames - 1;
            SetRangeStart(r.pasteStart);
            SetRangeEnd(r.pasteEnd);
        }
    }

    void GoTruncate(const Record& r)
    {
        for (ChannelState& c : s.channels) {
            if (!c.selected)
                continue;
            ModelChannel::Remove(c, r.end + 1, ModelChannel::End(c) - 1);
            ModelChannel::Remove(c, 0, r.start - 1);
            c.selected = false;
        }
    }
};

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
    case Kind::Move: return std::make_unique<MoveSampleAction>(nullptr);
    }
    return nullptr;
}

class EditSequenceTest : public ::testing::TestWithParam<uint32_t> {
protected:
    CopyBuffer copyBuffer;
};

TEST_P(EditSequenceTest, RandomEditsUndosAndRedosFollowTheModel)
{
    std::mt19937 random(GetParam());
    auto pick = [&random](int64_t low, int64_t high) {
        return std::uniform_int_distribution<int64_t>(low, high)(random);
    };
    TestDocument document;
    const int8_t pans[3] = {Channel::kPanLeft, Channel::kPanMiddle, Channel::kPanRight};
    for (int c = 0; c < 3; c++) {
        Channel* channel = document.AddChannel(test::RandomSamples(random, 120), 0, true);
        channel->SetPanPosition(pans[c]);
        channel->SetMuted(c == 1);
    }
    document.SetRange(0, 10);
    EditModel model;
    model.s = document.State();
    HistoryManager history;
    std::vector<Record> undo;
    std::vector<Record> redo;

    for (int step = 0; step < 1200; step++) {
        const int64_t total = model.Total();
        const int64_t choice = pick(0, 19);
        if (choice < 9) {
            // A new action on a fresh selection and range.
            Kind kind = Kind(pick(0, 7));
            if ((kind == Kind::Truncate || kind == Kind::Remove) && total < 60)
                kind = Kind::FadeOut;
            if (kind == Kind::Truncate && pick(0, 3) != 0)
                kind = Kind::Revert;
            for (size_t c = 0; c < model.s.channels.size(); c++) {
                model.s.channels[c].selected = pick(0, 2) != 0;
                document.manager.ChannelAt(int32_t(c))->SetSelected(model.s.channels[c].selected);
            }
            if (kind == Kind::Paste && pick(0, 3) == 0) {
                document.SetRange(-1, -1);
                model.SetRangeStart(-1);
                model.SetRangeEnd(-1);
            } else {
                const int64_t start = pick(0, std::max<int64_t>(total - 1, 0));
                const int64_t end = start + (kind == Kind::Truncate ? pick(30, 80) : pick(0, 30));
                document.SetRange(start, end);
                model.SetRangeStart(start);
                model.SetRangeEnd(end);
            }
            document.position.SetCursorFrame(kind == Kind::Paste && pick(0, 1) == 0 ? model.s.rangeStart : pick(0, total));
            document.position.SetFocusIndex(int32_t(pick(0, 2)));
            std::unique_ptr<Action> action = MakeAction(kind, &copyBuffer);
            Record record;
            if (kind == Kind::Move) {
                // The drag already moved the channel; the action records it.
                const int32_t c = int32_t(pick(0, 2));
                Channel* channel = document.manager.ChannelAt(c);
                const int64_t before = channel->FirstFrame();
                const int64_t after = pick(0, 25);
                channel->SetStartFrameOffset(after);
                model.s.channels[size_t(c)].first = after;
                ASSERT_EQ(static_cast<MoveSampleAction*>(action.get())->SetTo(&document.manager, channel, before - after), B_OK);
                record.kind = kind;
                record.channel = c;
                record.offset = before - after;
            } else {
                ASSERT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
                record = model.Bind(kind, document.position.CursorFrame(), document.position.FocusIndex());
            }
            Action* raw = action.get();
            ASSERT_EQ(history.AddAction(action), B_OK);
            ASSERT_EQ(raw->Go(), B_OK);
            model.Go(record);
            undo.push_back(record);
            redo.clear();
        } else if (choice < 13) {
            ASSERT_EQ(history.Undo(), undo.empty() ? B_ERROR : B_OK);
            if (!undo.empty()) {
                model.Undo(undo.back());
                redo.push_back(undo.back());
                undo.pop_back();
            }
        } else if (choice < 17) {
            ASSERT_EQ(history.Redo(), redo.empty() ? B_ERROR : B_OK);
            if (!redo.empty()) {
                model.Redo(redo.back());
                undo.push_back(redo.back());
                redo.pop_back();
            }
        } else if (choice < 18) {
            // Copy: a buffer of one to three channels.
            const size_t channels = size_t(pick(1, 3));
            const size_t frames = size_t(pick(1, 40));
            std::vector<CopyBuffer::Samples> arrays;
            model.copyBuffer.clear();
            for (size_t c = 0; c < channels; c++) {
                model.copyBuffer.push_back(test::RandomSamples(random, frames));
                arrays.emplace_back(new int16_t[frames]);
                std::copy(model.copyBuffer.back().begin(), model.copyBuffer.back().end(), arrays.back().get());
            }
            ASSERT_TRUE(copyBuffer.SetCopyBuffer(std::move(arrays), int64_t(frames)));
        } else {
            const size_t c = size_t(pick(0, 2));
            model.s.channels[c].selected = !model.s.channels[c].selected;
            document.manager.ChannelAt(int32_t(c))->SetSelected(model.s.channels[c].selected);
        }
        ASSERT_EQ(document.State(), model.s) << "step " << step;
    }
}

INSTANTIATE_TEST_SUITE_P(Seeds, EditSequenceTest, ::testing::Values(1u, 2u, 3u, 4u));

}  // namespace
}  // namespace glimmet
