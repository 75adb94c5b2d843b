#include "app/EditCommands.h"

#include <functional>
#include <memory>
#include <utility>

#include "app/ActionRunner.h"
#include "app/CommandTable.h"
#include "app/StretchProgress.h"
#include "edit/AddChannelAction.h"
#include "edit/CompressorAction.h"
#include "edit/CopyBuffer.h"
#include "edit/DistortAction.h"
#include "edit/EnvelopeAction.h"
#include "edit/FadeInAction.h"
#include "edit/FadeOutAction.h"
#include "edit/FilterAction.h"
#include "edit/MaximizeAction.h"
#include "edit/MoveSampleAction.h"
#include "edit/PasteAction.h"
#include "edit/RemoveAction.h"
#include "edit/RemoveChannelAction.h"
#include "edit/RevertAction.h"
#include "edit/RevertPhasesAction.h"
#include "edit/SelectionCopier.h"
#include "edit/StretchAction.h"
#include "edit/TruncateAction.h"
#include "edit/dialogs/CParameterWindow.h"
#include "edit/dialogs/CurveDialogLink.h"
#include "edit/dialogs/DParameterWindow.h"
#include "edit/dialogs/EParameterWindow.h"
#include "edit/dialogs/FParameterWindow.h"
#include "edit/dialogs/TSDialogLink.h"
#include "edit/dialogs/TSParameterWindow.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/Diagnostics.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"

namespace glimmet {

namespace {

using MakeAction = std::function<std::unique_ptr<Action>(MessageTarget* window)>;

template <typename T>
MakeAction Maker()
{
    return [](MessageTarget* window) { return std::make_unique<T>(window); };
}

/// The commands that make an action of their own, with no other work.
struct ActionCommand {
    uint32_t what;
    MakeAction make;
};

const std::vector<ActionCommand>& ActionCommands()
{
    static const std::vector<ActionCommand> commands{
        {kMsgRemove, Maker<RemoveAction>()},
        {kMsgTruncate, Maker<TruncateAction>()},
        {kMsgAddChannel, Maker<AddChannelAction>()},
        {kMsgRemoveChannel, Maker<RemoveChannelAction>()},
        {kMsgFadeIn, Maker<FadeInAction>()},
        {kMsgFadeOut, Maker<FadeOutAction>()},
        {kMsgMaximize, Maker<MaximizeAction>()},
        {kMsgRevert, Maker<RevertAction>()},
        {kMsgRevertPhases, Maker<RevertPhasesAction>()},
    };
    return commands;
}

using MakeCurveEffect = std::function<std::unique_ptr<Action>(MessageTarget* window, QWidget* dialogParent)>;

/// An effect whose action is made with its dialog open and waiting.
template <typename EffectAction, typename Dialog>
MakeCurveEffect CurveEffect()
{
    return [](MessageTarget* window, QWidget* dialogParent) {
        auto* dialog = new Dialog(dialogParent, window);
        dialog->ShowAtHome();
        return std::make_unique<EffectAction>(window, std::make_unique<CurveDialogLink>(dialog));
    };
}

struct CurveEffectCommand {
    uint32_t what;
    MakeCurveEffect make;
};

const std::vector<CurveEffectCommand>& CurveEffectCommands()
{
    static const std::vector<CurveEffectCommand> commands{
        {kMsgFilter, CurveEffect<FilterAction, FParameterWindow>()},
        {kMsgDistort, CurveEffect<DistortAction, DParameterWindow>()},
        {kMsgCompressor, CurveEffect<CompressorAction, CParameterWindow>()},
        {kMsgEnvelope, CurveEffect<EnvelopeAction, EParameterWindow>()},
    };
    return commands;
}

}  // namespace

EditCommands::EditCommands(MessageTarget& window, QWidget* dialogParent, ChannelManager& manager,
    ActionRunner& actions, CopyBuffer* copyBuffer)
    : window_(window), dialogParent_(dialogParent), manager_(manager), actions_(actions), copyBuffer_(copyBuffer),
      progress_(std::make_unique<StretchProgress>(dialogParent, actions))
{
}

EditCommands::~EditCommands() = default;

void EditCommands::AddTo(CommandTable& table)
{
    table.Add(kMsgActionGo, [this] {
        actions_.Go();
        progress_->Follow();
    });
    table.Add(kMsgActionCancel, [this] { actions_.Cancel(); });
    table.Add(kMsgUndo, [this] { actions_.Undo(); });
    table.Add(kMsgRedo, [this] { actions_.Redo(); });
    table.Add(kMsgClearHistory, [this] { actions_.DeleteHistory(); });
    table.Add(kMsgCopy, [this] { Copy(); });
    table.Add(kMsgCut, [this] { Cut(); });
    table.Add(kMsgPaste, [this] { Paste(); });
    table.Add(kMsgSampleMoved, [this](const Message& message) { SampleMoved(message); });
    table.Add(kMsgTimeStretch, [this] { TimeStretch(); });
    table.Add(kMsgStretchFinished, [this] {
        actions_.FinishStretch();
        progress_->Follow();
    });
    AddActionCommands(table);
    AddCurveEffectCommands(table);
}

void EditCommands::TimeStretch()
{
    // No menu item leads here: only a message from outside the menus. A
    // window that is still stretching takes no new stretch, and shows no
    // dialog for one.
    if (actions_.Stretching()) {
        Diagnostics::Print("Time stretch in progress: Time Stretch ignored\n");
        return;
    }
    auto* dialog = new TSParameterWindow(dialogParent_, &window_);
    dialog->ShowAtHome();
    actions_.SetupAction(std::make_unique<StretchAction>(&window_, std::make_unique<TSDialogLink>(dialog)));
}

void EditCommands::AddActionCommands(CommandTable& table)
{
    for (const ActionCommand& command : ActionCommands()) {
        const MakeAction& make = command.make;
        table.Add(command.what, [this, &make] { actions_.SetupAction(make(&window_)); });
    }
}

void EditCommands::AddCurveEffectCommands(CommandTable& table)
{
    for (const CurveEffectCommand& command : CurveEffectCommands()) {
        const MakeCurveEffect& make = command.make;
        table.Add(command.what, [this, &make] { actions_.SetupAction(make(&window_, dialogParent_)); });
    }
}

void EditCommands::Copy()
{
    if (copyBuffer_ != nullptr)
        SelectionCopier::CopySelection(manager_, *copyBuffer_);
}

void EditCommands::Cut()
{
    Copy();
    actions_.SetupAction(std::make_unique<RemoveAction>(&window_));
}

void EditCommands::Paste()
{
    actions_.SetupAction(std::make_unique<PasteAction>(&window_, copyBuffer_));
}

void EditCommands::SampleMoved(const Message& message)
{
    Channel* channel = nullptr;
    void* view = nullptr;
    int64_t offset = 0;
    if (message.FindPointer(kFieldChannel, &channel) != B_OK || message.FindPointer(kFieldSampleView, &view) != B_OK
        || message.FindInt64(kFieldOffset, &offset) != B_OK)
        return;
    auto action = std::make_unique<MoveSampleAction>(&window_);
    action->SetTo(&manager_, channel, offset);
    actions_.SetupBoundAction(std::move(action));
}

}  // namespace glimmet
