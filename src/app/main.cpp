#include <QApplication>
#include <QDir>
#include <QStringList>

#include <SDL.h>

#include <cstdio>
#include <filesystem>
#include <string>
#include <string_view>

#include "app/BatchRunner.h"
#include "app/DocumentStateReport.h"
#include "app/InstanceServer.h"
#include "app/Quillex.h"
#include "app/QuillexWindow.h"
#include "files/WavFileWriter.h"

using glimmet::BatchRunner;
using glimmet::InstanceServer;
using glimmet::DocumentStateReport;
using glimmet::Quillex;
using glimmet::QuillexWindow;

namespace {

/// The command line's files as absolute paths, for a running instance whose
/// working folder is not ours; names that resolve to nothing are left out.
QStringList ResolvedFiles(const QStringList& arguments)
{
    QStringList files;
    for (qsizetype index = 1; index < arguments.size(); ++index) {
        std::filesystem::path resolved;
        if (Quillex::ResolvePath(std::filesystem::path(arguments[index].toStdString()), &resolved))
            files << QString::fromStdString(resolved.string());
    }
    return files;
}

/// One line of JSON per window, in the order of the window list.
std::string StateOfEveryWindow(Quillex& application)
{
    std::string lines;
    for (int32_t i = 0; i < application.CountWindows(); ++i) {
        if (QuillexWindow* window = application.WindowAt(i))
            lines += DocumentStateReport::LiveJson(*window) + "\n";
    }
    return lines;
}

int PrintRunningState(int argc, char** argv)
{
    QCoreApplication core(argc, argv);
    std::string state;
    if (!InstanceServer::QueryState(InstanceServer::DefaultName(), &state)) {
        std::fprintf(stderr, "no running editor answered\n");
        return 1;
    }
    std::fputs(state.c_str(), stdout);
    return 0;
}

}  // namespace

int main(int argc, char** argv)
{
    // The sound library would otherwise take over SIGINT and SIGTERM, and
    // the editor could no longer be ended from outside.
    SDL_SetHint(SDL_HINT_NO_SIGNAL_HANDLERS, "1");
    // Under a file-size limit (ulimit -f) a large write, ours or the sound
    // server client's, must fail with an error rather than kill the editor
    // with every open document.
    glimmet::WavFileWriter::IgnoreFileSizeSignal();
    // A script run is headless and stands alone: no display, no hand-over
    // to a running editor.
    if (argc >= 2 && std::string_view(argv[1]) == "--batch")
        return BatchRunner::Main(argc, argv);
    // A script asks the running editor what its windows show.
    if (argc == 2 && std::string_view(argv[1]) == "--state")
        return PrintRunningState(argc, argv);
    QApplication toolkit(argc, argv);
    QApplication::setApplicationName(QStringLiteral("Glimmet"));
    QApplication::setDesktopFileName(QStringLiteral("glimmet"));
    // Windows end through the application object, not by being closed.
    QApplication::setQuitOnLastWindowClosed(false);

    const QStringList arguments = QApplication::arguments();
    const QString instanceName = InstanceServer::DefaultName();
    if (InstanceServer::ForwardToRunningInstance(instanceName, ResolvedFiles(arguments)))
        return 0;

    Quillex application;
    InstanceServer server(instanceName, &application);
    server.SetStateReporter([&application] { return StateOfEveryWindow(application); });
    return application.Run(arguments);
}
