#include "edit/HistoryManager.h"

#include <mutex>

#include "edit/Action.h"

namespace glimmet {

HistoryManager::HistoryManager() = default;

HistoryManager::~HistoryManager()
{
    Clear();
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
    return Move(undoStack_, redoStack_, [](Action& action) { return action.Undo(); });
}

status_t HistoryManager::Redo()
{
    std::lock_guard guard(*this);
    return Move(redoStack_, undoStack_, [](Action& action) { return action.Redo(); });
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

}  // namespace glimmet
