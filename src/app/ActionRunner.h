#pragma once

#include <memory>
#include <vector>

#include "app/StretchWorker.h"

namespace glimmet {

class Action;
class ChannelManager;
class EditContext;
class HistoryManager;
class MenuBuilder;
class MessageTarget;
class StretchAction;

/// The life of a document's edits: the pending action from its setup
/// through its dialog to the history, and undo, redo and delete history with
/// the menu items that name them.
///
/// An action runs as the command 'acgo', posted at once by SetupAction or
/// later by the action's parameter dialog; 'accc' drops it instead. Until
/// then the runner owns it; from then on the history does.
///
/// A time stretch runs its vocoder on a worker thread (StretchWorker);
/// until its result is written back ('tsfn') the document takes no edits:
/// new actions, undo, redo and delete history are refused with a line on
/// standard output.
///
/// GUI thread only.
class ActionRunner {
public:
    /// window receives 'acgo'; the document tells its views after every change.
    /// menus holds the undo, redo, delete history and save items.
    ActionRunner(MessageTarget& window, ChannelManager& manager, EditContext& context,
        HistoryManager& history, const MenuBuilder& menus);
    ~ActionRunner();
    ActionRunner(const ActionRunner&) = delete;
    ActionRunner& operator=(const ActionRunner&) = delete;

    /// Makes action the pending one, binds it to the document and, unless it
    /// asks for parameters first, posts the command that runs it. An action
    /// that fails its check after binding is deleted; null only drops the
    /// pending one.
    void SetupAction(std::unique_ptr<Action> action);
    /// Makes an action that is already bound the pending one and posts the
    /// command that runs it; one that is not ready or wants a dialog is
    /// dropped.
    void SetupBoundAction(std::unique_ptr<Action> action);

    /// 'acgo': records the pending action, performs it and redraws.
    void Go();
    /// 'accc': deletes the pending action unperformed.
    void Cancel();
    /// Undo and redo report a failure on standard output and change nothing
    /// on screen.
    void Undo();
    void Redo();
    void DeleteHistory();
    /// 'tsfn': writes a finished time stretch back and redraws.
    void FinishStretch();
    /// True while a time stretch is being computed.
    bool Stretching() const { return stretch_.Busy(); }
    /// How far the running time stretch has come, 0 to 1.
    double StretchProgress() const { return stretch_.Progress(); }

    /// Relabels and enables the undo, redo, delete history and save items
    /// from the history.
    void UpdateUndoMenu();

    Action* PendingAction() const { return pending_.get(); }

private:
    /// Replaces the pending action by action.
    void MakePending(std::unique_ptr<Action> action);
    void Redraw();
    /// Refuses an edit while a time stretch runs; true when refused.
    bool RefusedWhileStretching(const char* what);
    void StartStretch(StretchAction* action);

    MessageTarget& window_;
    ChannelManager& manager_;
    EditContext& context_;
    HistoryManager& history_;
    const MenuBuilder& menus_;
    std::unique_ptr<Action> pending_;
    /// Actions replaced while still pending, and ones the history refused:
    /// a dialog may still answer for them, so they live until the runner
    /// ends.
    std::vector<std::unique_ptr<Action>> superseded_;
    /// Declared last, so that it stops and joins its thread before the
    /// actions it may be working on go.
    StretchWorker stretch_;
};

}  // namespace glimmet
