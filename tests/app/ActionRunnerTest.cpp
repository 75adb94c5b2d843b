#include "app/ActionRunner.h"

#include <gtest/gtest.h>

#include <QAction>
#include <QWidget>

#include <memory>
#include <vector>

#include "PostedMessages.h"
#include "app/MenuBuilder.h"
#include "edit/Action.h"
#include "edit/DocumentMirror.h"
#include "edit/EditPosition.h"
#include "edit/HistoryManager.h"
#include "sound/ChannelManager.h"
#include "support/MessageCodes.h"
#include "support/MessageTarget.h"

namespace glimmet {
namespace {

using test::PostedMessages;

/// An edit that counts its runs and tells when it dies.
class CountingAction : public Action {
public:
    CountingAction(bool configured, int* deaths) : Action(nullptr), configured_(configured), deaths_(deaths) {}
    ~CountingAction() override { (*deaths_)++; }

    status_t Go() override
    {
        runs++;
        return B_OK;
    }
    status_t Undo() override { return B_OK; }
    status_t Redo() override { return B_OK; }
    const char* Name() override { return "Count"; }
    bool SupportsConfiguration() override { return configured_; }

    int runs = 0;

private:
    bool configured_;
    int* deaths_;
};

class ActionRunnerTest : public ::testing::Test {
protected:
    ActionRunnerTest() { menus.Build(&menuParent); }

    QAction* Item(KeptMenuItem which) const { return menus.Item(which); }

    std::unique_ptr<CountingAction> Make(bool configured) { return std::make_unique<CountingAction>(configured, &deaths); }

    int deaths = 0;
    /// Owns the menu bar whose items the runner relabels.
    QWidget menuParent;
    PostedMessages window;
    ChannelManager manager{nullptr};
    EditPosition position;
    test::DocumentMirror mirror{manager};
    HistoryManager history;
    MenuBuilder menus{[](const Message&) {}, [](const Message&) {}};
    std::unique_ptr<ActionRunner> runner
        = std::make_unique<ActionRunner>(window, manager, position, history, menus);
};

TEST_F(ActionRunnerTest, AnActionWithoutADialogIsBoundAndPostedToRun)
{
    auto owned = Make(false);
    CountingAction* action = owned.get();
    runner->SetupAction(std::move(owned));
    EXPECT_EQ(runner->PendingAction(), action);
    EXPECT_EQ(action->Manager(), &manager);
    EXPECT_EQ(action->Context(), &position);
    EXPECT_EQ(window.codes, std::vector<uint32_t>{kMsgActionGo});
    EXPECT_EQ(action->runs, 0);
}

TEST_F(ActionRunnerTest, GoRecordsRunsRedrawsAndNamesTheUndo)
{
    auto owned = Make(false);
    CountingAction* action = owned.get();
    runner->SetupAction(std::move(owned));
    runner->Go();
    EXPECT_EQ(action->runs, 1);
    EXPECT_EQ(runner->PendingAction(), nullptr);
    EXPECT_STREQ(history.UndoName(), "Count");
    EXPECT_EQ(mirror.allUpdates, 1);
    EXPECT_EQ(Item(KeptMenuItem::Undo)->text(), "Undo Count");
    EXPECT_TRUE(Item(KeptMenuItem::Undo)->isEnabled());
    EXPECT_TRUE(Item(KeptMenuItem::DeleteHistory)->isEnabled());
    EXPECT_TRUE(Item(KeptMenuItem::Save)->isEnabled());
    EXPECT_EQ(deaths, 0);
}

TEST_F(ActionRunnerTest, GoWithoutAPendingActionDoesNothing)
{
    runner->Go();
    EXPECT_EQ(mirror.allUpdates, 0);
    EXPECT_EQ(history.UndoName(), nullptr);
}

TEST_F(ActionRunnerTest, AnActionWithADialogWaitsAndCancelDeletesIt)
{
    auto owned = Make(true);
    CountingAction* action = owned.get();
    runner->SetupAction(std::move(owned));
    EXPECT_TRUE(window.codes.empty());
    EXPECT_EQ(runner->PendingAction(), action);
    runner->Cancel();
    EXPECT_EQ(runner->PendingAction(), nullptr);
    EXPECT_EQ(deaths, 1);
    EXPECT_EQ(history.UndoName(), nullptr);
}

TEST_F(ActionRunnerTest, AReplacedPendingActionLivesUntilTheRunnerEnds)
{
    runner->SetupAction(Make(true));
    runner->SetupAction(Make(true));
    EXPECT_EQ(deaths, 0);
    runner.reset();
    EXPECT_EQ(deaths, 2);
}

TEST_F(ActionRunnerTest, UndoRedoAndDeleteHistoryRelabelTheItems)
{
    runner->SetupAction(Make(false));
    runner->Go();
    runner->Undo();
    EXPECT_EQ(Item(KeptMenuItem::Undo)->text(), "Undo");
    EXPECT_FALSE(Item(KeptMenuItem::Undo)->isEnabled());
    EXPECT_EQ(Item(KeptMenuItem::Redo)->text(), "Redo Count");
    EXPECT_TRUE(Item(KeptMenuItem::Redo)->isEnabled());
    EXPECT_TRUE(Item(KeptMenuItem::DeleteHistory)->isEnabled());
    EXPECT_FALSE(Item(KeptMenuItem::Save)->isEnabled());
    runner->Redo();
    EXPECT_EQ(Item(KeptMenuItem::Undo)->text(), "Undo Count");
    runner->DeleteHistory();
    EXPECT_EQ(Item(KeptMenuItem::Undo)->text(), "Undo");
    EXPECT_FALSE(Item(KeptMenuItem::Redo)->isEnabled());
    EXPECT_FALSE(Item(KeptMenuItem::DeleteHistory)->isEnabled());
    EXPECT_EQ(mirror.allUpdates, 3);
}

TEST_F(ActionRunnerTest, AFailedUndoRedrawsNothing)
{
    runner->Undo();
    runner->Redo();
    EXPECT_EQ(mirror.allUpdates, 0);
}

TEST_F(ActionRunnerTest, ABoundActionSkipsTheBindingAndAnUnboundOneIsDropped)
{
    runner->SetupBoundAction(Make(false));
    EXPECT_EQ(runner->PendingAction(), nullptr);
    EXPECT_EQ(deaths, 1);
    EXPECT_TRUE(window.codes.empty());

    auto owned = Make(false);
    CountingAction* action = owned.get();
    ASSERT_EQ(action->SetTo(&manager, &position), B_OK);
    runner->SetupBoundAction(std::move(owned));
    EXPECT_EQ(runner->PendingAction(), action);
    EXPECT_EQ(window.codes, std::vector<uint32_t>{kMsgActionGo});
}

}  // namespace
}  // namespace glimmet
