#include "edit/HistoryManager.h"

#include <gtest/gtest.h>

#include <memory>
#include <random>
#include <string>
#include <vector>

#include "edit/Action.h"

namespace glimmet {
namespace {

/// An action whose results the test chooses, and which tells when it dies.
class ScriptedAction : public Action {
public:
    ScriptedAction(std::string name, int* deaths) : Action(nullptr), name_(std::move(name)), deaths_(deaths) {}
    ~ScriptedAction() override { (*deaths_)++; }

    status_t InitCheck() override { return initStatus; }
    status_t Undo() override
    {
        if (history != nullptr)
            historyLockedDuringUndo = history->IsLockedByCurrentThread();
        undos++;
        return undoStatus;
    }
    status_t Redo() override
    {
        redos++;
        return redoStatus;
    }
    const char* Name() override { return name_.c_str(); }

    status_t initStatus = B_OK;
    status_t undoStatus = B_OK;
    status_t redoStatus = B_OK;
    int undos = 0;
    int redos = 0;
    HistoryManager* history = nullptr;
    bool historyLockedDuringUndo = false;

private:
    std::string name_;
    int* deaths_;
};

class HistoryManagerTest : public ::testing::Test {
protected:
    ScriptedAction* Make(const char* name) { return new ScriptedAction(name, &deaths); }

    ScriptedAction* Add(const char* name)
    {
        ScriptedAction* action = Make(name);
        std::unique_ptr<Action> owned(action);
        EXPECT_EQ(history.AddAction(owned), B_OK);
        return action;
    }

    int deaths = 0;
    HistoryManager history;
};

TEST_F(HistoryManagerTest, FreshHistoryHasNoNamesAndCountsAsSaved)
{
    EXPECT_EQ(history.UndoName(), nullptr);
    EXPECT_EQ(history.RedoName(), nullptr);
    EXPECT_TRUE(history.IsSaved());
}

TEST_F(HistoryManagerTest, UndoAndRedoOfAnEmptyHistoryFail)
{
    EXPECT_EQ(history.Undo(), B_ERROR);
    EXPECT_EQ(history.Redo(), B_ERROR);
    EXPECT_EQ(history.UndoName(), nullptr);
    EXPECT_EQ(history.RedoName(), nullptr);
}

TEST_F(HistoryManagerTest, AddNullFails)
{
    std::unique_ptr<Action> none;
    EXPECT_EQ(history.AddAction(none), B_ERROR);
}

TEST_F(HistoryManagerTest, ActionFailingItsCheckIsNotRecordedNorDeleted)
{
    ScriptedAction* bad = Make("bad");
    std::unique_ptr<Action> action(bad);
    bad->initStatus = B_NO_INIT;
    EXPECT_EQ(history.AddAction(action), B_NO_INIT);
    EXPECT_EQ(history.UndoName(), nullptr);
    EXPECT_EQ(deaths, 0);
}

TEST_F(HistoryManagerTest, ActionFailingItsCheckKeepsTheRedoStack)
{
    Add("a");
    ASSERT_EQ(history.Undo(), B_OK);
    ScriptedAction* bad = Make("bad");
    std::unique_ptr<Action> action(bad);
    bad->initStatus = B_ERROR;
    EXPECT_EQ(history.AddAction(action), B_ERROR);
    EXPECT_STREQ(history.RedoName(), "a");
}

TEST_F(HistoryManagerTest, AnAcceptedActionLeavesTheCallersPointerEmpty)
{
    ScriptedAction* taken = Make("a");
    std::unique_ptr<Action> action(taken);
    ASSERT_EQ(history.AddAction(action), B_OK);
    EXPECT_EQ(action, nullptr);
    EXPECT_STREQ(history.UndoName(), "a");
    EXPECT_EQ(deaths, 0);
    history.Clear();
    EXPECT_EQ(deaths, 1);
}

TEST_F(HistoryManagerTest, ARefusedActionIsHandedBackAlive)
{
    ScriptedAction* refused = Make("bad");
    refused->initStatus = B_NO_INIT;
    std::unique_ptr<Action> action(refused);
    ASSERT_EQ(history.AddAction(action), B_NO_INIT);
    EXPECT_EQ(action.get(), refused);
    // Still the caller's: ready now, it is accepted on a second try.
    refused->initStatus = B_OK;
    EXPECT_EQ(history.AddAction(action), B_OK);
    EXPECT_EQ(action, nullptr);
    EXPECT_STREQ(history.UndoName(), "bad");
    EXPECT_EQ(deaths, 0);
}

TEST_F(HistoryManagerTest, UndoMovesTheTopToTheRedoStack)
{
    Add("a");
    ScriptedAction* b = Add("b");
    EXPECT_STREQ(history.UndoName(), "b");
    EXPECT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(b->undos, 1);
    // The undone action's name is now the redo name.
    EXPECT_STREQ(history.RedoName(), "b");
    EXPECT_STREQ(history.UndoName(), "a");
    EXPECT_EQ(history.Redo(), B_OK);
    EXPECT_EQ(b->redos, 1);
    EXPECT_STREQ(history.UndoName(), "b");
    EXPECT_EQ(history.RedoName(), nullptr);
}

TEST_F(HistoryManagerTest, AddAfterUndoDeletesTheUndoneActions)
{
    Add("a");
    Add("b");
    ASSERT_EQ(history.Undo(), B_OK);
    ASSERT_EQ(history.Undo(), B_OK);
    Add("c");
    EXPECT_EQ(deaths, 2);
    EXPECT_EQ(history.Redo(), B_ERROR);
    EXPECT_EQ(history.RedoName(), nullptr);
    EXPECT_STREQ(history.UndoName(), "c");
}

TEST_F(HistoryManagerTest, FailedUndoDropsTheActionWithoutDeletingIt)
{
    Add("a");
    ScriptedAction* b = Add("b");
    b->undoStatus = B_NO_MEMORY;
    EXPECT_EQ(history.Undo(), B_NO_MEMORY);
    EXPECT_EQ(deaths, 0);
    EXPECT_EQ(b->undos, 1);
    EXPECT_STREQ(history.UndoName(), "a");
    EXPECT_EQ(history.RedoName(), nullptr);
    // Still alive: it can be asked for its name without harm.
    EXPECT_STREQ(b->Name(), "b");
}

TEST_F(HistoryManagerTest, FailedRedoDropsTheActionWithoutDeletingIt)
{
    ScriptedAction* a = Add("a");
    a->redoStatus = B_ERROR;
    ASSERT_EQ(history.Undo(), B_OK);
    EXPECT_EQ(history.Redo(), B_ERROR);
    EXPECT_EQ(deaths, 0);
    EXPECT_EQ(history.UndoName(), nullptr);
    EXPECT_EQ(history.RedoName(), nullptr);
}

TEST_F(HistoryManagerTest, ClearDeletesEveryRecordedAction)
{
    Add("a");
    Add("b");
    Add("c");
    ASSERT_EQ(history.Undo(), B_OK);
    history.Clear();
    EXPECT_EQ(deaths, 3);
    EXPECT_EQ(history.UndoName(), nullptr);
    EXPECT_EQ(history.RedoName(), nullptr);
}

TEST_F(HistoryManagerTest, DestructorDeletesRecordedAndDroppedActions)
{
    int localDeaths = 0;
    {
        HistoryManager local;
        std::unique_ptr<Action> a = std::make_unique<ScriptedAction>("a", &localDeaths);
        local.AddAction(a);
        auto* failing = new ScriptedAction("b", &localDeaths);
        failing->undoStatus = B_ERROR;
        std::unique_ptr<Action> b(failing);
        local.AddAction(b);
        local.Undo();
        std::unique_ptr<Action> c = std::make_unique<ScriptedAction>("c", &localDeaths);
        local.AddAction(c);
        local.Undo();
        EXPECT_EQ(localDeaths, 0);
    }
    EXPECT_EQ(localDeaths, 3);
}

TEST_F(HistoryManagerTest, SavedAfterUndoingAllAndRedoingAll)
{
    Add("a");
    Add("b");
    history.Save();
    EXPECT_TRUE(history.IsSaved());
    ASSERT_EQ(history.Undo(), B_OK);
    EXPECT_FALSE(history.IsSaved());
    ASSERT_EQ(history.Undo(), B_OK);
    // Undoing everything counts as saved, whatever the file holds.
    EXPECT_TRUE(history.IsSaved());
    ASSERT_EQ(history.Redo(), B_OK);
    EXPECT_FALSE(history.IsSaved());
    ASSERT_EQ(history.Redo(), B_OK);
    EXPECT_TRUE(history.IsSaved());
}

TEST_F(HistoryManagerTest, UnsavedAfterAnAddWithoutSave)
{
    Add("a");
    EXPECT_FALSE(history.IsSaved());
    history.Save();
    EXPECT_TRUE(history.IsSaved());
    Add("b");
    EXPECT_FALSE(history.IsSaved());
}

TEST_F(HistoryManagerTest, SaveOfAnEmptyHistoryKeepsTheOldMarker)
{
    Add("a");
    history.Save();
    ASSERT_EQ(history.Undo(), B_OK);
    history.Save();  // nothing to undo: the marker still names "a"
    ASSERT_EQ(history.Redo(), B_OK);
    EXPECT_TRUE(history.IsSaved());
}

TEST_F(HistoryManagerTest, ClearKeepsTheSavedMarkerButNewActionsAreUnsaved)
{
    Add("a");
    history.Save();
    history.Clear();
    EXPECT_TRUE(history.IsSaved());
    // Many fresh actions: none of them may pass for the deleted one, even
    // where the allocator hands out its address again.
    for (int i = 0; i < 50; i++) {
        Add("b");
        EXPECT_FALSE(history.IsSaved());
        history.Clear();
    }
}

TEST_F(HistoryManagerTest, HoldsItsLockWhileTheActionRuns)
{
    ScriptedAction* a = Add("a");
    a->history = &history;
    ASSERT_EQ(history.Undo(), B_OK);
    EXPECT_TRUE(a->historyLockedDuringUndo);
    EXPECT_FALSE(history.IsLockedByCurrentThread());
}

TEST_F(HistoryManagerTest, RandomSequencesAgreeWithAModel)
{
    std::mt19937 random(1234);
    // The model: names on the two stacks, and the name at the last save.
    std::vector<int> undo;
    std::vector<int> redo;
    int saved = -1;
    int next = 0;
    for (int step = 0; step < 2000; step++) {
        const int choice = std::uniform_int_distribution<int>(0, 4)(random);
        if (choice == 0) {
            Add(std::to_string(next).c_str());
            undo.push_back(next++);
            redo.clear();
        } else if (choice == 1) {
            EXPECT_EQ(history.Undo(), undo.empty() ? B_ERROR : B_OK);
            if (!undo.empty()) {
                redo.push_back(undo.back());
                undo.pop_back();
            }
        } else if (choice == 2) {
            EXPECT_EQ(history.Redo(), redo.empty() ? B_ERROR : B_OK);
            if (!redo.empty()) {
                undo.push_back(redo.back());
                redo.pop_back();
            }
        } else if (choice == 3) {
            history.Save();
            if (!undo.empty())
                saved = undo.back();
        } else if (std::uniform_int_distribution<int>(0, 20)(random) == 0) {
            history.Clear();
            undo.clear();
            redo.clear();
        }
        const bool expectSaved = undo.empty() || (saved >= 0 && saved == undo.back());
        ASSERT_EQ(history.IsSaved(), expectSaved) << "step " << step;
        const char* undoName = history.UndoName();
        const char* redoName = history.RedoName();
        ASSERT_EQ(undoName == nullptr, undo.empty());
        ASSERT_EQ(redoName == nullptr, redo.empty());
        if (undoName != nullptr) {
            ASSERT_EQ(std::string(undoName), std::to_string(undo.back()));
        }
        if (redoName != nullptr) {
            ASSERT_EQ(std::string(redoName), std::to_string(redo.back()));
        }
    }
}

}  // namespace
}  // namespace glimmet
