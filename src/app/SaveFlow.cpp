#include "app/SaveFlow.h"

#include <QAction>
#include <QFileDialog>
#include <QMessageBox>
#include <QPushButton>

#include "app/QuillexWindow.h"
#include "edit/HistoryManager.h"
#include "files/DocumentSaver.h"
#include "support/Diagnostics.h"
#include "support/Message.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"
#include "support/MessageTarget.h"

namespace glimmet {

namespace {

SaveFlow::SaveQuestion& SaveQuestionHook()
{
    static SaveFlow::SaveQuestion question;
    return question;
}

QString TitleFor(const std::string& name)
{
    return QStringLiteral("Glimmet - ") + QString::fromStdString(name);
}

}  // namespace

SaveFlow::SaveFlow(QWidget& window, MessageTarget& target, ChannelManager& manager, HistoryManager& history,
    QAction& saveItem)
    : window_(window), target_(target), manager_(manager), history_(history), saveItem_(saveItem)
{
}

SaveFlow::~SaveFlow() = default;

void SaveFlow::Save()
{
    if (!fileEntry_) {
        ShowSavePanel();
        return;
    }
    SaveAndReport(*fileEntry_);
}

void SaveFlow::SaveAndReport(const std::filesystem::path& file)
{
    const status_t status = SaveFile(file);
    if (status != B_OK)
        Diagnostics::Print("error writing file. (%s)\n", StatusText(status));
}

void SaveFlow::ShowSavePanel()
{
    if (!savePanel_) {
        savePanel_ = std::make_unique<QFileDialog>(&window_);
        savePanel_->setOption(QFileDialog::DontUseNativeDialog);
        savePanel_->setAcceptMode(QFileDialog::AcceptSave);
        savePanel_->setFileMode(QFileDialog::AnyFile);
        savePanel_->selectFile(QStringLiteral("sound.wav"));
        QObject::connect(savePanel_.get(), &QFileDialog::fileSelected, &window_,
            [this](const QString& file) { PanelChose(file); });
    } else {
        // Re-reads the folder, which may have changed since the last save.
        savePanel_->setDirectory(savePanel_->directory());
    }
    savePanel_->show();
    savePanel_->raise();
}

void SaveFlow::PanelChose(const QString& file)
{
    const std::filesystem::path chosen(file.toStdString());
    Message message(kMsgSavePanelChoice);
    message.AddPath(kFieldDirectory, chosen.parent_path());
    message.AddString(kFieldName, chosen.filename().string());
    target_.PostMessage(message);
}

void SaveFlow::HandlePanelChoice(const Message& message)
{
    std::filesystem::path directory;
    std::string name;
    if (message.FindPath(kFieldDirectory, &directory) != B_OK || message.FindString(kFieldName, &name) != B_OK)
        return;
    std::error_code error;
    if (!std::filesystem::is_directory(directory, error))
        return;
    // A name that is a link saves into the file the link points to.
    std::filesystem::path entry = directory / name;
    const std::filesystem::path target = std::filesystem::weakly_canonical(entry, error);
    if (!error)
        entry = target;
    fileEntry_ = entry;
    window_.setWindowTitle(TitleFor(name));
    target_.PostMessage(kMsgSave);
}

status_t SaveFlow::SaveFile(const std::filesystem::path& file)
{
    return DocumentSaver::SaveFile(file, *this);
}

void SaveFlow::SetSaveItemEnabled(bool enabled)
{
    saveItem_.setEnabled(enabled);
}

bool SaveFlow::IsDocumentSaved()
{
    return !fileEntry_ || history_.IsSaved();
}

bool SaveFlow::AgreeToClose(QuillexWindow* window)
{
    if (IsDocumentSaved())
        return true;
    const SaveQuestion& question = SaveQuestionHook();
    const int answer = question ? question(window) : AskSaveChanges(window);
    if (answer == kDontQuit)
        return false;
    // A save that did not get the document into the file keeps the window,
    // and the edits, for another try. (One that only could not label the
    // file closes: the sound is safe.)
    if (answer == kSave && fileEntry_) {
        SaveAndReport(*fileEntry_);
        return history_.IsSaved();
    }
    return true;
}

void SaveFlow::SetSaveQuestion(SaveQuestion question)
{
    SaveQuestionHook() = std::move(question);
}

int SaveFlow::AskSaveChanges(QWidget* parent)
{
    QMessageBox alert(QMessageBox::Warning, QString(), QStringLiteral("Save changes?"), QMessageBox::NoButton,
        parent);
    alert.setObjectName(QStringLiteral("alert"));
    // One role for all three keeps them left to right in the order added.
    QPushButton* dontSave = alert.addButton(QStringLiteral("Nope!"), QMessageBox::ActionRole);
    QPushButton* save = alert.addButton(QStringLiteral("Yes, please."), QMessageBox::ActionRole);
    QPushButton* dontQuit = alert.addButton(QStringLiteral("Don't quit!"), QMessageBox::ActionRole);
    alert.setDefaultButton(dontQuit);
    alert.setEscapeButton(dontQuit);
    alert.exec();
    const QAbstractButton* clicked = alert.clickedButton();
    if (clicked == dontSave)
        return kDontSave;
    if (clicked == save)
        return kSave;
    return kDontQuit;
}

}  // namespace glimmet
