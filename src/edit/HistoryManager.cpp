#include "edit/HistoryManager.h"

#include <mutex>

#include "edit/Action.h"
#include "edit/HistorySpill.h"

namespace glimmet {

HistoryManager::HistoryManager() : spill_(std::make_unique<HistorySpill>()) {}

HistoryManager::~HistoryManager()
{
    Clear();
    // The writer stops before the actions it might still be writing go.
    spill_.reset();
}

status_t HistoryManager::AddAction(std::unique_ptr<Action>& action)
{
    std::lock_guard guard(*this);
    if (!action)
        return B_ERROR;
    const status_t status = action->InitCheck();
    if (status != B_OK)
        return status;
    undoStack_.push_back(Entry{std::move(action), nextSerial_++});
    // Newest first, as popping the stack would delete them.
    while (!redoStack_.empty())
        redoStack_.pop_back();
    Trim();
    return B_OK;
}

template <typename Step>
status_t HistoryManager::Move(Stack& from, Stack& to, Step step)
{
    if (from.empty())
        return B_ERROR;
    Entry entry = std::move(from.back());
    from.pop_back();
    const status_t status = step(*entry.action);
    if (status == B_OK)
        to.push_back(std::move(entry));
    else
        dropped_.push_back(std::move(entry.action));
    return status;
}

status_t HistoryManager::Undo()
{
    std::lock_guard guard(*this);
    spill_->Pause();
    const status_t status = Move(undoStack_, redoStack_, [](Action& action) { return action.Undo(); });
    spill_->Resume();
    Trim();
    return status;
}

status_t HistoryManager::Redo()
{
    std::lock_guard guard(*this);
    spill_->Pause();
    const status_t status = Move(redoStack_, undoStack_, [](Action& action) { return action.Redo(); });
    spill_->Resume();
    Trim();
    return status;
}

const char* HistoryManager::TopName(const Stack& stack)
{
    if (stack.empty())
        return nullptr;
    return stack.back().action->Name();
}

const char* HistoryManager::UndoName()
{
    std::lock_guard guard(*this);
    return TopName(undoStack_);
}

const char* HistoryManager::RedoName()
{
    std::lock_guard guard(*this);
    return TopName(redoStack_);
}

void HistoryManager::Clear()
{
    std::lock_guard guard(*this);
    while (!undoStack_.empty())
        undoStack_.pop_back();
    while (!redoStack_.empty())
        redoStack_.pop_back();
    if (spill_ != nullptr)
        spill_->ReleaseFile();
}

void HistoryManager::Save()
{
    std::lock_guard guard(*this);
    if (!undoStack_.empty())
        savedSerial_ = undoStack_.back().serial;
}

bool HistoryManager::IsSaved()
{
    std::lock_guard guard(*this);
    if (undoStack_.empty())
        return true;
    return savedSerial_ != 0 && savedSerial_ == undoStack_.back().serial;
}

void HistoryManager::Trim()
{
    std::vector<const BlockList*> kept;
    const auto collect = [&kept](const Entry& entry) {
        entry.action->VisitKeptLists([&kept](const BlockList& list) { kept.push_back(&list); });
    };
    // Farthest from the document's state first: the next undo needs the top
    // of the undo stack and the next redo the top of the redo stack, so
    // those are the last to leave memory. At equal distance the redo entry
    // goes first, as undoing again is the likelier next step after an undo.
    size_t undo = 0;
    size_t redo = 0;
    while (undo < undoStack_.size() || redo < redoStack_.size()) {
        const size_t undoDistance = undoStack_.size() - undo;
        const size_t redoDistance = redoStack_.size() - redo;
        if (redo < redoStack_.size() && (undo == undoStack_.size() || redoDistance >= undoDistance))
            collect(redoStack_[redo++]);
        else
            collect(undoStack_[undo++]);
    }
    spill_->Trim(kept);
}

void HistoryManager::TrimMemory()
{
    std::lock_guard guard(*this);
    Trim();
}

void HistoryManager::SetMemoryBudget(int64_t bytes)
{
    std::lock_guard guard(*this);
    spill_->SetBudget(bytes);
}

int64_t HistoryManager::MemoryBudget()
{
    std::lock_guard guard(*this);
    return spill_->Budget();
}

void HistoryManager::SetSpillWrittenCallback(std::function<void()> callback)
{
    spill_->SetWrittenCallback(std::move(callback));
}

void HistoryManager::SettleMemory()
{
    // Each round drops what the last one wrote; a round that leaves the
    // history within the budget, or writes nothing, ends it.
    for (int round = 0; round < 64; ++round) {
        TrimMemory();
        spill_->WaitUntilWritten();
        std::lock_guard guard(*this);
        Trim();
        if (spill_->ResidentHistoryBytes() <= spill_->Budget())
            return;
    }
}

int HistoryManager::SpillDescriptor()
{
    return spill_->FileDescriptor();
}

}  // namespace glimmet
