#include "app/ViewScriptCommands.h"

#include <QCheckBox>
#include <QComboBox>
#include <QImage>
#include <QPixmap>

#include <vector>

#include "app/BatchRunner.h"
#include "app/DialogInput.h"
#include "app/ScriptArguments.h"
#include "support/MessageCodes.h"
#include "views/TransportButton.h"

namespace glimmet {

using Arguments = BatchRunner::Arguments;

void ViewScriptCommands::AddTo(BatchRunner& runner)
{
    AddPlaybackCommands(runner);
    AddWindowCommands(runner);
}

void ViewScriptCommands::AddPlaybackCommands(BatchRunner& runner)
{
    runner.AddCommand("playmode", 1, 1, [&runner](const Arguments& arguments, std::string* reason) {
        const std::vector<std::string> modes = {"all", "range", "visible"};
        for (size_t index = 0; index < modes.size(); ++index) {
            if (arguments[0] != modes[index])
                continue;
            runner.Window()->PlayModePopup()->setCurrentIndex(int(index));
            runner.Window()->PostMessage(kMsgPlayMode);
            return true;
        }
        return ScriptArguments::Fail(reason, "playmode takes all, range or visible");
    });
    runner.AddCommand("loop", 1, 1, [&runner](const Arguments& arguments, std::string* reason) {
        if (arguments[0] != "on" && arguments[0] != "off")
            return ScriptArguments::Fail(reason, "loop takes on or off");
        // A click toggles the box; a box already as asked is not clicked.
        QCheckBox* box = runner.Window()->LoopBox();
        if (box->isChecked() != (arguments[0] == "on"))
            box->click();
        return true;
    });
    // A press and a release in the middle of the button, as the mouse
    // delivers them.
    runner.AddCommand("press", 1, 3, [&runner](const Arguments& arguments, std::string* reason) {
        std::string name = arguments[0];
        size_t next = 1;
        if (name == "play" && arguments.size() > 1 && arguments[1] == "mode") {
            name = "play mode";
            next = 2;
        }
        TransportButton* button = runner.Window()->TransportButtonNamed(QString::fromStdString(name));
        if (button == nullptr || arguments.size() > next + 1)
            return ScriptArguments::Fail(reason, "press takes play, play mode or stop, then left or right");
        Qt::MouseButton mouseButton = Qt::LeftButton;
        if (arguments.size() > next) {
            if (arguments[next] == "right")
                mouseButton = Qt::RightButton;
            else if (arguments[next] != "left")
                return ScriptArguments::Fail(reason, "press takes left or right after the button's name");
        }
        DialogInput::Click(button, button->rect().center(), mouseButton);
        return true;
    });
    runner.AddCommand("wait", 1, 1, [](const Arguments& arguments, std::string* reason) {
        int64_t milliseconds = 0;
        if (!ScriptArguments::ParseInteger(arguments[0], &milliseconds) || milliseconds < 0
            || milliseconds > 3600000)
            return ScriptArguments::Fail(reason, "wait takes a number of milliseconds from 0 to 3600000");
        BatchRunner::Wait(milliseconds);
        return true;
    });
}

void ViewScriptCommands::AddWindowCommands(BatchRunner& runner)
{
    runner.AddCommand("size", 2, 2, [&runner](const Arguments& arguments, std::string* reason) {
        int64_t width = 0;
        int64_t height = 0;
        if (!ScriptArguments::ParseInteger(arguments[0], &width)
            || !ScriptArguments::ParseInteger(arguments[1], &height) || width < 1 || height < 1 || width > 16384
            || height > 16384)
            return ScriptArguments::Fail(reason, "size takes a width and a height from 1 to 16384 pixels");
        runner.Window()->resize(int(width), int(height));
        return true;
    });
    runner.AddCommand("snapshot", 1, 1, [&runner](const Arguments& arguments, std::string* reason) {
        BatchRunner::DrainEvents();
        const QImage image = runner.Window()->grab().toImage();
        if (!image.save(QString::fromStdString(arguments[0]), "PNG"))
            return ScriptArguments::Fail(reason, "cannot write " + arguments[0]);
        return true;
    });
}

}  // namespace glimmet
