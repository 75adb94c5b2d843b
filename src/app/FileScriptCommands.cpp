#include "app/FileScriptCommands.h"

#include <QFileDialog>

#include <filesystem>

#include "app/BatchRunner.h"
#include "app/Quillex.h"
#include "app/ScriptArguments.h"
#include "files/panel/SndFilePanel.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"

namespace glimmet {

using Arguments = BatchRunner::Arguments;

void FileScriptCommands::AddTo(BatchRunner& runner, Quillex& application)
{
    runner.AddCommand("open", 1, 1, [&runner, &application](const Arguments& arguments, std::string* reason) {
        return OpenThroughPanel(runner, application, arguments[0], reason);
    });
    runner.AddCommand("append", 1, 1, [&runner](const Arguments& arguments, std::string* reason) {
        std::filesystem::path path;
        if (!Quillex::ResolvePath(arguments[0], &path))
            return ScriptArguments::Fail(reason, "no such file: " + arguments[0]);
        Message drop(kMsgSimpleData);
        drop.AddPath(kFieldRefs, path);
        drop.AddInt32(kFieldModifiers, int32_t(Qt::ShiftModifier));
        runner.Window()->PostMessage(drop);
        return true;
    });
    runner.AddCommand("save", 0, 0, [&runner](const Arguments&, std::string*) {
        runner.Window()->PostMessage(kMsgSave);
        return true;
    });
    runner.AddCommand("saveas", 1, 1, [&runner](const Arguments& arguments, std::string* reason) {
        return SaveThroughPanel(runner, arguments[0], reason);
    });
}

bool FileScriptCommands::OpenThroughPanel(BatchRunner& runner, Quillex& application, const std::string& path,
    std::string* reason)
{
    std::filesystem::path resolved;
    if (!Quillex::ResolvePath(path, &resolved))
        return ScriptArguments::Fail(reason, "no such file: " + path);
    std::error_code error;
    if (std::filesystem::is_directory(resolved, error))
        return ScriptArguments::Fail(reason, path + " is a folder");
    runner.Window()->PostMessage(kMsgOpen);
    BatchRunner::DrainEvents();
    QFileDialog* panel = application.OpenPanel();
    if (panel == nullptr || !panel->isVisible())
        return ScriptArguments::Fail(reason, "the open panel did not appear");
    panel->hide();
    emit panel->filesSelected(QStringList{QString::fromStdString(resolved.string())});
    return true;
}

bool FileScriptCommands::SaveThroughPanel(BatchRunner& runner, const std::string& path, std::string* reason)
{
    std::error_code error;
    const std::filesystem::path absolute = std::filesystem::absolute(path, error);
    if (error || !absolute.has_filename())
        return ScriptArguments::Fail(reason, "\"" + path + "\" does not name a file");
    if (!std::filesystem::is_directory(absolute.parent_path(), error))
        return ScriptArguments::Fail(reason, "no such folder: " + absolute.parent_path().string());
    runner.Window()->PostMessage(kMsgSaveAs);
    BatchRunner::DrainEvents();
    QFileDialog* panel = runner.Window()->SavePanel();
    if (panel == nullptr || !panel->isVisible())
        return ScriptArguments::Fail(reason, "the save panel did not appear");
    panel->hide();
    emit panel->fileSelected(QString::fromStdString(absolute.string()));
    return true;
}

}  // namespace glimmet
