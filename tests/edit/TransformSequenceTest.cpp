#include <gtest/gtest.h>

#include <map>
#include <random>

#include "TestDocument.h"
#include "TransformCases.h"
#include "edit/HistoryManager.h"

namespace glimmet {
namespace {

using test::ChannelState;
using test::DocumentState;
using test::TestDocument;
using test::TransformCase;

/// What the model remembers of one recorded transform: which one, its
/// range, and the samples its selected channels had there when it was bound.
struct ModelRecord {
    size_t transform;
    int64_t start;
    int64_t end;
    std::map<size_t, std::vector<int16_t>> snapshot;  // channel index -> range
};

/// The document as the test expects it, changed by the rules the actions
/// follow, written independently of them.
class ModelDocument {
public:
    explicit ModelDocument(DocumentState state) : state(std::move(state)) {}

    void Perform(const TransformCase& transform, int64_t start, int64_t end)
    {
        state = test::ExpectedAfter(transform, state, start, end);
    }

    ModelRecord Record(size_t transform)
    {
        ModelRecord record{transform, state.rangeStart, state.rangeEnd, {}};
        for (size_t i = 0; i < state.channels.size(); i++) {
            const auto& samples = state.channels[i].samples;
            if (state.channels[i].selected)
                record.snapshot[i] = {samples.begin() + record.start, samples.begin() + record.end + 1};
        }
        return record;
    }

    void Undo(const ModelRecord& record)
    {
        WalkSelection(record);
        for (const auto& [index, samples] : record.snapshot)
            std::copy(samples.begin(), samples.end(), state.channels[index].samples.begin() + record.start);
        state.rangeStart = record.start;
        state.rangeEnd = record.end;
    }

    void Redo(const ModelRecord& record, const TransformCase& transform)
    {
        state.rangeStart = record.start;
        state.rangeEnd = record.end;
        WalkSelection(record);
        Perform(transform, record.start, record.end);
    }

    DocumentState state;

private:
    // Recorded channels become selected, the others before the last
    // recorded one unselected; later channels keep their selection.
    void WalkSelection(const ModelRecord& record)
    {
        if (record.snapshot.empty())
            return;
        const size_t last = record.snapshot.rbegin()->first;
        for (size_t i = 0; i <= last; i++)
            state.channels[i].selected = record.snapshot.count(i) > 0;
    }
};

TEST(TransformSequenceTest, RandomTransformsUndosAndRedosFollowTheModel)
{
    const std::vector<TransformCase> transforms = test::AllTransforms();
    std::mt19937 random(2024);
    auto pick = [&random](int64_t low, int64_t high) {
        return std::uniform_int_distribution<int64_t>(low, high)(random);
    };
    constexpr int64_t kLength = 160;
    TestDocument document;
    for (int c = 0; c < 4; c++) {
        std::vector<int16_t> samples = test::RandomSamples(random, kLength);
        // Quieter channels give Maximize something to do now and then.
        if (c % 2 == 1) {
            for (int16_t& sample : samples)
                sample = int16_t(sample / 4);
        }
        document.AddChannel(samples, 0, c % 2 == 0);
    }
    document.SetRange(0, kLength - 1);
    ModelDocument model(document.State());
    HistoryManager history;
    std::vector<ModelRecord> undo;
    std::vector<ModelRecord> redo;

    for (int step = 0; step < 1500; step++) {
        const int64_t choice = pick(0, 9);
        if (choice < 4) {
            std::vector<bool> selected(4);
            for (size_t c = 0; c < 4; c++) {
                selected[c] = pick(0, 1) == 1;
                model.state.channels[c].selected = selected[c];
            }
            document.Select(selected);
            const int64_t start = pick(0, kLength - 1);
            const int64_t end = std::min(kLength - 1, start + pick(0, 40));
            document.SetRange(start, end);
            model.state.rangeStart = start;
            model.state.rangeEnd = end;
            const size_t which = size_t(pick(0, int64_t(transforms.size()) - 1));
            std::unique_ptr<Action> action = transforms[which].make();
            ASSERT_EQ(action->SetTo(&document.manager, &document.position), B_OK);
            Action* raw = action.get();
            ASSERT_EQ(history.AddAction(action), B_OK);
            ASSERT_EQ(raw->Go(), B_OK);
            undo.push_back(model.Record(which));
            redo.clear();
            model.Perform(transforms[which], start, end);
        } else if (choice < 6) {
            ASSERT_EQ(history.Undo(), undo.empty() ? B_ERROR : B_OK);
            if (!undo.empty()) {
                model.Undo(undo.back());
                redo.push_back(undo.back());
                undo.pop_back();
            }
        } else if (choice < 8) {
            ASSERT_EQ(history.Redo(), redo.empty() ? B_ERROR : B_OK);
            if (!redo.empty()) {
                model.Redo(redo.back(), transforms[redo.back().transform]);
                undo.push_back(redo.back());
                redo.pop_back();
            }
        } else {
            // The user clicks on a channel between commands.
            const size_t c = size_t(pick(0, 3));
            model.state.channels[c].selected = !model.state.channels[c].selected;
            document.manager.ChannelAt(int32_t(c))->SetSelected(model.state.channels[c].selected);
        }
        ASSERT_EQ(document.State(), model.state) << "step " << step;
    }
}

}  // namespace
}  // namespace glimmet
