#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "support/Locker.h"
#include "support/Status.h"

namespace glimmet {

class Action;
class HistorySpill;

/// A document's undo and redo stacks.
///
/// The history is its own lock (the history lock): every operation holds it
/// for its whole duration, including the call into the action, so the lock
/// order is always history lock, then document lock. Both stacks grow
/// without bound; the blocks only they hold stay in memory up to a budget,
/// those farthest from the next undo or redo move beyond it to a scratch
/// file (see HistorySpill).
/// Every operation runs on the thread that edits the document.
class HistoryManager : public Locker {
public:
    HistoryManager();
    ~HistoryManager();
    HistoryManager(const HistoryManager&) = delete;
    HistoryManager& operator=(const HistoryManager&) = delete;

    /// Records an action that is about to be performed and discards
    /// everything that could have been redone.
    ///
    /// On B_OK the history has taken the action and action is null. A
    /// refused action stays with the caller, untouched, in action: one that
    /// fails its InitCheck (its status is the result), or null (B_ERROR).
    /// The caller may keep a plain pointer to run the action after handing
    /// it over, whichever way it went.
    status_t AddAction(std::unique_ptr<Action>& action);

    /// Takes back the last action; B_ERROR with nothing to undo. An action
    /// whose Undo fails leaves the history for good.
    status_t Undo();
    /// Performs the last undone action again; B_ERROR with nothing to redo.
    /// An action whose Redo fails leaves the history for good.
    status_t Redo();

    /// Name of the action Undo would take back; null when there is none.
    const char* UndoName();
    /// Name of the action Redo would perform; null when there is none.
    const char* RedoName();

    /// Deletes every recorded action. The saved marker is kept.
    void Clear();
    /// Marks the present state as the one on disk.
    void Save();
    /// True with nothing to undo, or when the last action is the one that
    /// was on top when the document was last saved.
    bool IsSaved();

    /// Bytes of blocks only the history holds that may stay in memory; by
    /// default HistorySpill::DefaultBudget().
    void SetMemoryBudget(int64_t bytes);
    int64_t MemoryBudget();
    /// Moves the farthest blocks beyond the budget out of memory: drops what
    /// has been written, hands more to the writer. Every change of the
    /// history does it; the owner calls it after an action has run and
    /// when the writer reports (see SetSpillWrittenCallback).
    void TrimMemory();
    /// Called on the writer's thread when it has written all it was given;
    /// the owner runs TrimMemory on its own thread in answer.
    void SetSpillWrittenCallback(std::function<void()> callback);
    /// Trims, waits for the writer and trims again, until everything beyond
    /// the budget is out of memory (tests, benchmarks).
    void SettleMemory();
    /// The scratch file's descriptor, -1 without one (tests).
    int SpillDescriptor();

private:
    /// A recorded action with the serial number it got when it was added.
    /// The saved marker compares serials rather than addresses, so an action
    /// deleted by Clear can never be mistaken for a new one.
    struct Entry {
        std::unique_ptr<Action> action;
        uint64_t serial = 0;
    };
    using Stack = std::vector<Entry>;

    static const char* TopName(const Stack& stack);
    /// Pops the top of from, runs step on it and pushes it on to when step
    /// succeeds; otherwise the action goes to the dropped list.
    template <typename Step>
    status_t Move(Stack& from, Stack& to, Step step);
    /// Hands every kept block reference to the spill, the lock held.
    void Trim();

    // All fields are guarded by the history lock (this object).
    Stack undoStack_;
    Stack redoStack_;
    /// Serial of the action on top of the undo stack at the last Save; 0
    /// before any save that had something to mark.
    uint64_t savedSerial_ = 0;
    uint64_t nextSerial_ = 1;
    /// Actions whose undo or redo failed: out of the history, but kept alive
    /// as they were never deleted; freed with the history.
    std::vector<std::unique_ptr<Action>> dropped_;
    std::unique_ptr<HistorySpill> spill_;
};

}  // namespace glimmet
