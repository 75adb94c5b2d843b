#include "app/ChannelScriptCommands.h"

#include <QAction>
#include <QMenu>

#include <vector>

#include "app/BatchRunner.h"
#include "app/ScriptArguments.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "views/ChannelContainerView.h"
#include "views/SampleView.h"

namespace glimmet {

using Arguments = BatchRunner::Arguments;

void ChannelScriptCommands::AddTo(BatchRunner& runner)
{
    AddSelectionCommands(runner);
    AddMenuCommands(runner);
}

void ChannelScriptCommands::AddSelectionCommands(BatchRunner& runner)
{
    runner.AddCommand("move", 2, 2, [&runner](const Arguments& arguments, std::string* reason) {
        QuillexWindow* window = runner.Window();
        int32_t index = 0;
        int64_t frames = 0;
        if (!ScriptArguments::ChannelIndex(window, arguments[0], &index, reason))
            return false;
        if (!ScriptArguments::ParseInteger(arguments[1], &frames))
            return ScriptArguments::Fail(reason, "\"" + arguments[1] + "\" is not a number of frames");
        window->ContainerView()->MoveChannel(index, frames);
        return true;
    });
    runner.AddCommand("select", 0, -1, [&runner](const Arguments& arguments, std::string* reason) {
        QuillexWindow* window = runner.Window();
        ChannelManager* manager = window->Manager();
        std::vector<bool> selected(size_t(manager->CountChannels()), false);
        for (const std::string& argument : arguments) {
            int32_t index = 0;
            if (!ScriptArguments::ChannelIndex(window, argument, &index, reason))
                return false;
            selected[size_t(index)] = true;
        }
        for (size_t index = 0; index < selected.size(); ++index)
            manager->ChannelAt(int32_t(index))->SetSelected(selected[index]);
        window->ContainerView()->UpdateAll();
        return true;
    });
    runner.AddCommand("focus", 1, 1, [&runner](const Arguments& arguments, std::string* reason) {
        QuillexWindow* window = runner.Window();
        int32_t index = 0;
        if (!ScriptArguments::ChannelIndex(window, arguments[0], &index, reason))
            return false;
        window->activateWindow();
        window->ContainerView()->SampleViewAtIndex(index)->setFocus(Qt::OtherFocusReason);
        return true;
    });
}

void ChannelScriptCommands::AddMenuCommands(BatchRunner& runner)
{
    runner.AddCommand("mute", 1, 1, [&runner](const Arguments& arguments, std::string* reason) {
        QuillexWindow* window = runner.Window();
        int32_t index = 0;
        if (!ScriptArguments::ChannelIndex(window, arguments[0], &index, reason))
            return false;
        return TriggerChannelMenuItem(window, index, QStringLiteral("Mute"));
    });
    runner.AddCommand("pan", 2, 2, [&runner](const Arguments& arguments, std::string* reason) {
        QuillexWindow* window = runner.Window();
        int32_t index = 0;
        if (!ScriptArguments::ChannelIndex(window, arguments[0], &index, reason))
            return false;
        const std::string& side = arguments[1];
        if (side != "left" && side != "middle" && side != "right")
            return ScriptArguments::Fail(reason, "pan takes left, middle or right");
        QString label = QString::fromStdString(side);
        label[0] = label[0].toUpper();
        return TriggerChannelMenuItem(window, index, label);
    });
}

bool ChannelScriptCommands::TriggerChannelMenuItem(QuillexWindow* window, int32_t index, const QString& label)
{
    QMenu* menu = window->ContainerView()->ContextMenuForChannel(index);
    if (menu == nullptr)
        return false;
    for (QAction* item : menu->actions()) {
        if (item->text() == label) {
            item->trigger();
            break;
        }
    }
    delete menu;
    return true;
}

}  // namespace glimmet
