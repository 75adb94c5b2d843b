#pragma once

#include <QPointer>

#include <cstdint>
#include <cstdio>
#include <istream>
#include <string>

#include "app/QuillexWindow.h"
#include "app/ScriptCommandTable.h"

namespace glimmet {

class Quillex;

/// Runs an editing script against one document window, headless. Every line
/// becomes the messages or input a user would cause, delivered to that
/// window, and the event queue is drained before the next line runs.
///
/// A line is a command name and its arguments separated by blanks; blank
/// lines and lines starting with '#' are skipped. The first unknown command
/// or bad argument stops the script: "line N: reason" goes to the error
/// stream and Run returns 2. What the document itself prints (diagnostics)
/// still goes to standard output, and so does `print`.
///
/// Commands live in a table keyed by name, so later features (the effect
/// dialogs) add their own with AddCommand. The built-in ones come in groups
/// by what they act on (the *ScriptCommands classes).
class BatchRunner {
public:
    using Arguments = ScriptCommandTable::Arguments;
    /// Runs one command; returns false with a reason for a bad argument.
    using Command = ScriptCommandTable::Command;

    static constexpr int kSucceeded = 0;
    static constexpr int kFailed = 2;

    /// The application supplies the open panel and the copy buffer; the
    /// window is the document the script edits.
    BatchRunner(Quillex& application, QuillexWindow* window, std::FILE* output = stdout,
        std::FILE* errors = stderr);
    ~BatchRunner();
    BatchRunner(const BatchRunner&) = delete;
    BatchRunner& operator=(const BatchRunner&) = delete;

    /// Runs the script to its end or to its first error: kSucceeded or
    /// kFailed.
    int Run(std::istream& script);
    /// Runs one line; false with the reason when it is unknown or bad.
    bool RunLine(const std::string& line, std::string* reason);

    /// Adds (or replaces) a command. minimum and maximum bound the number of
    /// arguments; a maximum of -1 takes any number.
    void AddCommand(const std::string& name, int minimum, int maximum, Command command);

    /// Lets queued work run until every message the main thread posted has
    /// been delivered.
    static void DrainEvents();
    /// Keeps the event loop running for the given time.
    static void Wait(int64_t milliseconds);

    QuillexWindow* Window() const { return window_.data(); }

    /// Program entry of `glimmet --batch SCRIPT` ("-" reads standard input):
    /// makes the window on the offscreen platform and runs the script.
    /// arguments are the whole command line.
    static int Main(int argc, char** argv);

private:
    bool RunMessageCode(const std::string& code, const Arguments& arguments, std::string* reason);
    bool RequireWindow(std::string* reason) const;

    QPointer<QuillexWindow> window_;
    std::FILE* output_;
    std::FILE* errors_;
    ScriptCommandTable commands_;
    /// What the "Save changes?" question answers in a script.
    int saveAnswer_ = QuillexWindow::kDontQuit;
};

}  // namespace glimmet
