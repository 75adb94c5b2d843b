#pragma once

#include <cstdint>
#include <random>
#include <string>

#include "SoakModel.h"
#include "SoakRunner.h"
#include "edit/CopyBuffer.h"
#include "edit/HistoryManager.h"
#include "edit/TestDocument.h"

namespace glimmet::test {

/// A document with its history and copy buffer, driven through the edit
/// layer the way the window's commands drive it, next to the model that
/// says what it must hold after each step.
///
/// The edit layer is driven directly rather than through the window's
/// message handling: a script step then costs microseconds instead of a
/// round trip through the event loop and a redraw, so a CI run covers
/// thousands of steps in seconds and a long soak millions. What the window
/// adds (menus enabling, dialogs) is covered by the application tests.
class SoakSession {
public:
    explicit SoakSession(uint64_t seed);

    /// Performs step on both, returning what it did in words.
    std::string Apply(const SoakStep& step);
    /// Empty while document and model agree, else the first difference.
    std::string Difference();
    int64_t Total() const { return model_.Total(); }

private:
    std::string Act(SoakRecord::Kind kind, const SoakStep& step);
    /// Binds, records and runs the action record names, with the
    /// parameters it carries when the action has a dialog.
    std::string Act(SoakRecord record, const SoakStep& step);
    std::string Redraw(const SoakStep& step);
    void ChooseShortRange(const SoakStep& step);
    std::string Edit(const SoakStep& step);
    std::string ChannelStep(const SoakStep& step);
    std::string Move(const SoakStep& step, bool huge);
    std::string CopyStep();
    std::string ForeignCopy(const SoakStep& step);
    std::string Runs(bool undo, uint64_t count, bool far = false);
    std::string DeleteHistory();
    void ChooseSelection(uint64_t bits);
    void ChooseRange(const SoakStep& step, bool shorten);
    int64_t Frame(uint64_t r) const;

    TestDocument document_;
    HistoryManager history_;
    CopyBuffer copyBuffer_;
    SoakModel model_;
    std::mt19937_64 random_;
    /// A step whose outcome differed in a way the states do not show.
    std::string mismatch_;
};

}  // namespace glimmet::test
