#include "app/DocumentScriptCommands.h"

#include <QCoreApplication>
#include <QKeyEvent>
#include <QLineEdit>

#include "app/BatchRunner.h"
#include "app/ScriptArguments.h"
#include "app/TextControl.h"
#include "views/ChannelContainerView.h"

namespace glimmet {

using Arguments = BatchRunner::Arguments;

void DocumentScriptCommands::AddTo(BatchRunner& runner, int* saveAnswer)
{
    runner.AddCommand("range", 2, 2, [&runner](const Arguments& arguments, std::string* reason) {
        int64_t start = 0;
        int64_t end = 0;
        if (!ScriptArguments::ParseInteger(arguments[0], &start) || !ScriptArguments::ParseInteger(arguments[1], &end))
            return ScriptArguments::Fail(reason, "range takes two frame numbers");
        TypeIntoField(runner.Window()->RangeStartField(), arguments[0]);
        BatchRunner::DrainEvents();
        TypeIntoField(runner.Window()->RangeEndField(), arguments[1]);
        return true;
    });
    runner.AddCommand("cursor", 1, 1, [&runner](const Arguments& arguments, std::string* reason) {
        int64_t frame = 0;
        if (!ScriptArguments::ParseInteger(arguments[0], &frame))
            return ScriptArguments::Fail(reason, "\"" + arguments[0] + "\" is not a frame number");
        runner.Window()->ContainerView()->SetCursorFrame(frame);
        return true;
    });
    runner.AddCommand("answer", 1, 1, [saveAnswer](const Arguments& arguments, std::string* reason) {
        if (arguments[0] == "nope")
            *saveAnswer = QuillexWindow::kDontSave;
        else if (arguments[0] == "yes")
            *saveAnswer = QuillexWindow::kSave;
        else if (arguments[0] == "dontquit")
            *saveAnswer = QuillexWindow::kDontQuit;
        else
            return ScriptArguments::Fail(reason, "answer takes nope, yes or dontquit");
        return true;
    });
}

void DocumentScriptCommands::TypeIntoField(TextControl* control, const std::string& text)
{
    QLineEdit* field = control->Field();
    field->setFocus(Qt::OtherFocusReason);
    field->selectAll();
    for (const char c : text) {
        const QString character(QChar::fromLatin1(c));
        const int key = c == '-' ? Qt::Key_Minus : Qt::Key_0 + (c - '0');
        QKeyEvent press(QEvent::KeyPress, key, Qt::NoModifier, character);
        QCoreApplication::sendEvent(field, &press);
        QKeyEvent release(QEvent::KeyRelease, key, Qt::NoModifier, character);
        QCoreApplication::sendEvent(field, &release);
    }
    QKeyEvent enter(QEvent::KeyPress, Qt::Key_Return, Qt::NoModifier);
    QCoreApplication::sendEvent(field, &enter);
    QKeyEvent enterUp(QEvent::KeyRelease, Qt::Key_Return, Qt::NoModifier);
    QCoreApplication::sendEvent(field, &enterUp);
}

}  // namespace glimmet
