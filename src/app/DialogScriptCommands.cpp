#include "app/DialogScriptCommands.h"

#include <QImage>
#include <QPixmap>
#include <QPushButton>

#include <QLineEdit>
#include <QThread>

#include <cmath>
#include <cstdlib>
#include <string>
#include <vector>

#include "app/BatchRunner.h"
#include "app/DialogInput.h"
#include "app/DocumentStateReport.h"
#include "app/ScriptArguments.h"
#include "app/StretchWorker.h"
#include "edit/dialogs/CurveParameterWindow.h"
#include "edit/dialogs/FParameterWindow.h"
#include "edit/dialogs/SpinButton.h"
#include "edit/dialogs/TSParameterWindow.h"
#include "views/SplineControl.h"

namespace glimmet {

using Arguments = BatchRunner::Arguments;

namespace {

/// A finite number written in full, nothing else.
bool ParseNumber(const std::string& text, double* value)
{
    if (text.empty())
        return false;
    char* end = nullptr;
    *value = std::strtod(text.c_str(), &end);
    return end == text.c_str() + text.size() && std::isfinite(*value);
}

/// The arguments from first on as numbers; false with the reason when one is
/// not a finite number.
bool ParsePoints(const Arguments& arguments, size_t first, std::vector<double>* numbers, std::string* reason)
{
    for (size_t i = first; i < arguments.size(); i++) {
        double value = 0;
        if (!ParseNumber(arguments[i], &value))
            return ScriptArguments::Fail(reason, "curve takes normalised coordinates, not " + arguments[i]);
        numbers->push_back(value);
    }
    return true;
}

/// The open dialog, or false with the reason.
bool RequireDialog(BatchRunner& runner, CurveParameterWindow** dialog, std::string* reason)
{
    *dialog = DialogScriptCommands::OpenDialog(runner.Window());
    if (*dialog == nullptr)
        return ScriptArguments::Fail(reason, "no parameter dialog is open");
    return true;
}

/// The buttons of whichever parameter dialog is open.
struct OpenButtons {
    QDialog* dialog = nullptr;
    QPushButton* ok = nullptr;
    QPushButton* cancel = nullptr;
    bool stretch = false;
};

/// The open dialog's buttons, or false with the reason.
bool RequireButtons(BatchRunner& runner, OpenButtons* buttons, std::string* reason)
{
    if (TSParameterWindow* stretch = DialogScriptCommands::OpenStretchDialog(runner.Window())) {
        *buttons = OpenButtons{stretch, stretch->OkButton(), stretch->CancelButton(), true};
        return true;
    }
    CurveParameterWindow* curve = nullptr;
    if (!RequireDialog(runner, &curve, reason))
        return false;
    *buttons = OpenButtons{curve, curve->OkButton(), curve->CancelButton(), false};
    return true;
}

bool RunField(BatchRunner& runner, const Arguments& arguments, std::string* reason)
{
    TSParameterWindow* dialog = DialogScriptCommands::OpenStretchDialog(runner.Window());
    if (dialog == nullptr)
        return ScriptArguments::Fail(reason, "no dialog with text fields is open");
    QLineEdit* field = dialog->FieldLabelled(QString::fromStdString(arguments[0]));
    if (field == nullptr)
        return ScriptArguments::Fail(reason, "the open dialog has no field labelled \"" + arguments[0] + "\"");
    DialogInput::TypeReplacing(field, QString::fromStdString(arguments[1]));
    return true;
}

bool RunCurve(BatchRunner& runner, const Arguments& arguments, std::string* reason)
{
    const std::string& verb = arguments[0];
    const size_t wanted = verb == "drag" ? 5 : 3;
    if ((verb != "click" && verb != "rightclick" && verb != "drag") || arguments.size() != wanted)
        return ScriptArguments::Fail(reason, "curve takes click X Y, rightclick X Y or drag X0 Y0 X1 Y1");
    std::vector<double> numbers;
    if (!ParsePoints(arguments, 1, &numbers, reason))
        return false;
    CurveParameterWindow* dialog = nullptr;
    if (!RequireDialog(runner, &dialog, reason))
        return false;
    SplineControl* control = dialog->Control();
    const QPoint from = DialogInput::CurvePixel(*control, numbers[0], numbers[1]);
    if (verb == "drag")
        DialogInput::Drag(control, from, DialogInput::CurvePixel(*control, numbers[2], numbers[3]));
    else
        DialogInput::Click(control, from, verb == "click" ? Qt::LeftButton : Qt::RightButton);
    return true;
}

}  // namespace

CurveParameterWindow* DialogScriptCommands::OpenDialog(QuillexWindow* window)
{
    if (window == nullptr)
        return nullptr;
    CurveParameterWindow* open = nullptr;
    for (CurveParameterWindow* dialog : window->findChildren<CurveParameterWindow*>()) {
        if (dialog->isVisible())
            open = dialog;
    }
    return open;
}

TSParameterWindow* DialogScriptCommands::OpenStretchDialog(QuillexWindow* window)
{
    if (window == nullptr)
        return nullptr;
    TSParameterWindow* open = nullptr;
    for (TSParameterWindow* dialog : window->findChildren<TSParameterWindow*>()) {
        if (dialog->isVisible())
            open = dialog;
    }
    return open;
}

void DialogScriptCommands::WaitForStretches()
{
    BatchRunner::DrainEvents();
    while (StretchWorker::Running() > 0) {
        QThread::msleep(2);
        BatchRunner::DrainEvents();
    }
}

void DialogScriptCommands::AddTo(BatchRunner& runner, std::FILE* output)
{
    AddCurveCommand(runner);
    AddButtonCommands(runner);
    AddFieldCommands(runner, output);
}

void DialogScriptCommands::AddCurveCommand(BatchRunner& runner)
{
    runner.AddCommand("curve", 3, 5, [&runner](const Arguments& arguments, std::string* reason) {
        return RunCurve(runner, arguments, reason);
    });
}

void DialogScriptCommands::AddButtonCommands(BatchRunner& runner)
{
    runner.AddCommand("ok", 0, 0, [&runner](const Arguments&, std::string* reason) {
        OpenButtons buttons;
        if (!RequireButtons(runner, &buttons, reason))
            return false;
        DialogInput::ClickCentre(buttons.ok);
        if (buttons.stretch)
            WaitForStretches();
        return true;
    });
    runner.AddCommand("cancel", 0, 0, [&runner](const Arguments&, std::string* reason) {
        OpenButtons buttons;
        if (!RequireButtons(runner, &buttons, reason))
            return false;
        DialogInput::ClickCentre(buttons.cancel);
        return true;
    });
    runner.AddCommand("close", 0, 0, [&runner](const Arguments&, std::string* reason) {
        OpenButtons buttons;
        if (!RequireButtons(runner, &buttons, reason))
            return false;
        // What the close box does: a close request the dialog may refuse.
        buttons.dialog->close();
        return true;
    });
}

void DialogScriptCommands::AddFieldCommands(BatchRunner& runner, std::FILE* output)
{
    runner.AddCommand("dialog", 0, 0, [&runner, output](const Arguments&, std::string*) {
        BatchRunner::DrainEvents();
        TSParameterWindow* stretch = OpenStretchDialog(runner.Window());
        const std::string json = stretch != nullptr ? DocumentStateReport::DialogJson(stretch)
                                                    : DocumentStateReport::DialogJson(OpenDialog(runner.Window()));
        std::fprintf(output, "%s\n", json.c_str());
        std::fflush(output);
        return true;
    });
    runner.AddCommand("field", 2, 2, [&runner](const Arguments& arguments, std::string* reason) {
        return RunField(runner, arguments, reason);
    });
    runner.AddCommand("passes", 1, 1, [&runner](const Arguments& arguments, std::string* reason) {
        CurveParameterWindow* dialog = nullptr;
        if (!RequireDialog(runner, &dialog, reason))
            return false;
        auto* filter = qobject_cast<FParameterWindow*>(dialog);
        if (filter == nullptr)
            return ScriptArguments::Fail(reason, "the open dialog has no \"Filter passes:\" field");
        DialogInput::TypeReplacing(filter->PassesField(), QString::fromStdString(arguments[0]));
        return true;
    });
    runner.AddCommand("dialogshot", 1, 1, [&runner](const Arguments& arguments, std::string* reason) {
        CurveParameterWindow* dialog = nullptr;
        if (!RequireDialog(runner, &dialog, reason))
            return false;
        BatchRunner::DrainEvents();
        QImage image = dialog->grab().toImage();
        image.setDevicePixelRatio(1.0);
        if (!image.save(QString::fromStdString(arguments[0]), "PNG"))
            return ScriptArguments::Fail(reason, "cannot write " + arguments[0]);
        return true;
    });
}

}  // namespace glimmet
