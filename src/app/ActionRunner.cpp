#include "app/ActionRunner.h"

#include <QAction>
#include <QString>

#include "app/MenuBuilder.h"
#include "edit/Action.h"
#include "edit/EditContext.h"
#include "edit/HistoryManager.h"
#include "edit/StretchAction.h"
#include "sound/ChannelManager.h"
#include "support/Diagnostics.h"
#include "support/MessageCodes.h"
#include "support/MessageTarget.h"

namespace glimmet {

namespace {

/// "Undo" or "Redo", with the action's name when there is one to take.
void Relabel(QAction* item, const char* verb, const char* name)
{
    const QString label = QString::fromUtf8(verb);
    item->setEnabled(name != nullptr);
    item->setText(name != nullptr ? label + QLatin1Char(' ') + QString::fromUtf8(name) : label);
}

}  // namespace

ActionRunner::ActionRunner(MessageTarget& window, ChannelManager& manager, EditContext& context,
    HistoryManager& history, const MenuBuilder& menus)
    : window_(window), manager_(manager), context_(context), history_(history), menus_(menus), stretch_(window)
{
}

ActionRunner::~ActionRunner() = default;

void ActionRunner::MakePending(std::unique_ptr<Action> action)
{
    // An action still waiting for its dialog stays alive (its dialog may yet
    // answer), but is no longer the one that runs.
    if (pending_)
        superseded_.push_back(std::move(pending_));
    pending_ = std::move(action);
}

bool ActionRunner::RefusedWhileStretching(const char* what)
{
    if (!stretch_.Busy())
        return false;
    Diagnostics::Print("Time stretch in progress: %s ignored\n", what);
    return true;
}

void ActionRunner::SetupAction(std::unique_ptr<Action> action)
{
    if (RefusedWhileStretching(action ? action->Name() : "edit"))
        return;
    MakePending(std::move(action));
    if (!pending_)
        return;
    pending_->SetTo(&manager_, &context_);
    if (pending_->InitCheck() != B_OK) {
        pending_.reset();
        return;
    }
    if (!pending_->SupportsConfiguration())
        window_.PostMessage(kMsgActionGo);
}

void ActionRunner::SetupBoundAction(std::unique_ptr<Action> action)
{
    if (RefusedWhileStretching(action ? action->Name() : "edit"))
        return;
    if (!action || action->InitCheck() != B_OK || action->SupportsConfiguration())
        return;
    MakePending(std::move(action));
    window_.PostMessage(kMsgActionGo);
}

void ActionRunner::Go()
{
    if (!pending_ || pending_->InitCheck() != B_OK)
        return;
    Action* action = pending_.get();
    // Refused, it stays ours so that it is freed with the runner.
    if (history_.AddAction(pending_) != B_OK)
        superseded_.push_back(std::move(pending_));
    if (auto* stretch = dynamic_cast<StretchAction*>(action)) {
        StartStretch(stretch);
        return;
    }
    action->Go();
    // Its undo data became the history's alone: time to look at the budget.
    history_.TrimMemory();
    Redraw();
}

void ActionRunner::StartStretch(StretchAction* action)
{
    // The dialog is read here, in the GUI thread it belongs to; the vocoder
    // then runs elsewhere and the result comes back with 'tsfn'.
    if (action->ReadDialog() != B_OK) {
        Redraw();
        return;
    }
    stretch_.Start(action);
}

void ActionRunner::FinishStretch()
{
    if (stretch_.Finish())
        Redraw();
}

void ActionRunner::Cancel()
{
    pending_.reset();
}

void ActionRunner::Undo()
{
    if (RefusedWhileStretching("undo"))
        return;
    const status_t status = history_.Undo();
    if (status != B_OK) {
        Diagnostics::Print("Error doing undo: %s\n", StatusText(status));
        return;
    }
    Redraw();
}

void ActionRunner::Redo()
{
    if (RefusedWhileStretching("redo"))
        return;
    const status_t status = history_.Redo();
    if (status != B_OK) {
        Diagnostics::Print("Error doing redo: %s\n", StatusText(status));
        return;
    }
    Redraw();
}

void ActionRunner::DeleteHistory()
{
    if (RefusedWhileStretching("delete history"))
        return;
    history_.Clear();
    UpdateUndoMenu();
}

void ActionRunner::Redraw()
{
    manager_.ChannelsChanged();
    UpdateUndoMenu();
}

void ActionRunner::UpdateUndoMenu()
{
    const char* undoName = history_.UndoName();
    const char* redoName = history_.RedoName();
    Relabel(menus_.Item(KeptMenuItem::Undo), "Undo", undoName);
    Relabel(menus_.Item(KeptMenuItem::Redo), "Redo", redoName);
    menus_.Item(KeptMenuItem::DeleteHistory)->setEnabled(undoName != nullptr || redoName != nullptr);
    menus_.Item(KeptMenuItem::Save)->setEnabled(!history_.IsSaved());
}

}  // namespace glimmet
