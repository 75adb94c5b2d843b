#include "app/BatchRunner.h"

#include <QApplication>
#include <QCoreApplication>
#include <QElapsedTimer>
#include <QEventLoop>
#include <QTimer>

#include <cerrno>
#include <chrono>
#include <cstring>
#include <fstream>
#include <iostream>

#include "app/ChannelScriptCommands.h"
#include "app/DialogScriptCommands.h"
#include "app/DocumentScriptCommands.h"
#include "app/FileScriptCommands.h"
#include "app/LoadQueue.h"
#include "app/Quillex.h"
#include "app/ReportScriptCommands.h"
#include "app/ScriptArguments.h"
#include "app/ViewScriptCommands.h"
#include "support/MessageEvent.h"

namespace glimmet {

namespace {

/// How long one line may take to settle. Work the window posts to itself
/// normally settles in a few rounds; this only ends a message loop that
/// keeps feeding itself.
constexpr int64_t kDrainLimitMilliseconds = 10000;

QtMessageHandler gToolkitMessages = nullptr;

/// The offscreen platform remarks on every window feature it lacks; those
/// remarks would bury a script's own error lines.
void FilterToolkitMessages(QtMsgType type, const QMessageLogContext& context, const QString& text)
{
    if (text.startsWith(QStringLiteral("This plugin does not support")))
        return;
    if (gToolkitMessages != nullptr)
        gToolkitMessages(type, context, text);
}

}  // namespace

BatchRunner::BatchRunner(Quillex& application, QuillexWindow* window, std::FILE* output, std::FILE* errors)
    : window_(window), output_(output), errors_(errors)
{
    DocumentScriptCommands::AddTo(*this, &saveAnswer_);
    ChannelScriptCommands::AddTo(*this);
    ViewScriptCommands::AddTo(*this);
    FileScriptCommands::AddTo(*this, application);
    ReportScriptCommands::AddTo(*this, output_);
    DialogScriptCommands::AddTo(*this, output_);
    // A script cannot click the alert's buttons; it says beforehand what the
    // question is to answer. Until then the default button answers.
    QuillexWindow::SetSaveQuestion([this](QuillexWindow*) { return saveAnswer_; });
}

BatchRunner::~BatchRunner()
{
    QuillexWindow::SetSaveQuestion(nullptr);
}

void BatchRunner::AddCommand(const std::string& name, int minimum, int maximum, Command command)
{
    commands_.Add(name, minimum, maximum, std::move(command));
}

int BatchRunner::Run(std::istream& script)
{
    DrainEvents();
    std::string line;
    for (int number = 1; std::getline(script, line); ++number) {
        std::string reason;
        if (!RunLine(line, &reason)) {
            std::fflush(output_);
            std::fprintf(errors_, "line %d: %s\n", number, reason.c_str());
            std::fflush(errors_);
            return kFailed;
        }
    }
    std::fflush(output_);
    return kSucceeded;
}

bool BatchRunner::RunLine(const std::string& line, std::string* reason)
{
    std::string name;
    Arguments arguments;
    if (!ScriptCommandTable::Parse(line, &name, &arguments))
        return true;
    if (!commands_.Has(name))
        return RunMessageCode(name, arguments, reason);
    if (!commands_.CheckCount(name, arguments.size(), reason) || !RequireWindow(reason))
        return false;
    if (!commands_.Run(name, arguments, reason))
        return false;
    DrainEvents();
    return true;
}

bool BatchRunner::RunMessageCode(const std::string& code, const Arguments& arguments, std::string* reason)
{
    uint32_t what = 0;
    if (!ScriptCommandTable::WindowCode(code, &what))
        return ScriptArguments::Fail(reason, "unknown command \"" + code + "\"");
    if (!arguments.empty())
        return ScriptArguments::Fail(reason, code + " takes no arguments");
    if (!RequireWindow(reason))
        return false;
    window_->PostMessage(what);
    DrainEvents();
    return true;
}

bool BatchRunner::RequireWindow(std::string* reason) const
{
    if (window_.isNull())
        return ScriptArguments::Fail(reason, "the window is closed");
    return true;
}

// ---------------------------------------------------------------------------
// Event loop

void BatchRunner::DrainEvents()
{
    // A file a line opened is in the document before the next line runs,
    // however long it takes to decode, so that a script does the same thing
    // on a slow machine as on a fast one.
    bool loading = false;
    do {
        QElapsedTimer timer;
        timer.start();
        do {
            QCoreApplication::sendPostedEvents();
            QCoreApplication::processEvents(QEventLoop::AllEvents);
        } while (MessageEvent::CountPendingFromMainThread() > 0 && timer.elapsed() < kDrainLimitMilliseconds);
        loading = LoadQueue::CountInFlight() > 0;
        if (loading)
            QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents, LoadQueue::kPollMilliseconds);
    } while (loading);
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
}

void BatchRunner::Wait(int64_t milliseconds)
{
    QEventLoop loop;
    QTimer::singleShot(std::chrono::milliseconds(milliseconds), &loop, &QEventLoop::quit);
    loop.exec();
}

// ---------------------------------------------------------------------------
// Program entry

int BatchRunner::Main(int argc, char** argv)
{
    if (argc != 3) {
        std::fprintf(stderr, "usage: %s --batch SCRIPT   (SCRIPT - reads standard input)\n", argv[0]);
        return kFailed;
    }
    const std::string scriptName = argv[2];
    std::ifstream scriptFile;
    if (scriptName != "-") {
        scriptFile.open(scriptName);
        if (!scriptFile) {
            std::fprintf(stderr, "cannot read the script %s: %s\n", scriptName.c_str(), std::strerror(errno));
            return kFailed;
        }
    }
    std::istream& script = scriptName == "-" ? std::cin : scriptFile;

    // No display is needed: the window is drawn off screen.
    qputenv("QT_QPA_PLATFORM", "offscreen");
    // One device pixel per pixel, whatever scaling the user's desktop asks
    // for, so that snapshots and "view" rectangles agree.
    qputenv("QT_SCALE_FACTOR", "1");
    qunsetenv("QT_SCREEN_SCALE_FACTORS");
    qputenv("QT_ENABLE_HIGHDPI_SCALING", "0");
    gToolkitMessages = qInstallMessageHandler(FilterToolkitMessages);
    QApplication toolkit(argc, argv);
    QApplication::setApplicationName(QStringLiteral("Glimmet"));
    QApplication::setQuitOnLastWindowClosed(false);

    Quillex application;
    // Closing the window from a script must not end the event loop under it.
    application.SetQuitHook([] {});
    QuillexWindow* window = application.NewWindow();
    BatchRunner runner(application, window);
    return runner.Run(script);
}

}  // namespace glimmet
