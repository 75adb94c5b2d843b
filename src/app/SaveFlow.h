#pragma once

#include <QString>

#include <filesystem>
#include <functional>
#include <memory>
#include <optional>

#include "files/SaveTarget.h"
#include "support/Status.h"

class QAction;
class QFileDialog;
class QWidget;

namespace glimmet {

class ChannelManager;
class HistoryManager;
class Message;
class MessageTarget;
class QuillexWindow;

/// How a document gets to disk: "Save" to its file, "Save As…" through the
/// save panel, the "Save changes?" question on closing, and the Save item
/// that tells whether there is anything to save.
///
/// GUI thread only; the document's file entry lives here.
class SaveFlow : public SaveTarget {
public:
    /// Answers of the "Save changes?" question, numbered left to right.
    enum SaveAnswer { kDontSave = 0, kSave = 1, kDontQuit = 2 };
    /// Asks the question for a window; the default shows the alert.
    using SaveQuestion = std::function<int(QuillexWindow*)>;

    /// window is the panel's parent and gets the title of a chosen file; it
    /// receives 'svfp' and 'save'. saveItem is the menu's Save item.
    SaveFlow(QWidget& window, MessageTarget& target, ChannelManager& manager, HistoryManager& history,
        QAction& saveItem);
    ~SaveFlow() override;
    SaveFlow(const SaveFlow&) = delete;
    SaveFlow& operator=(const SaveFlow&) = delete;

    /// "Save": writes to the file entry, or asks for one with the save panel
    /// when there is none. A failed write is reported on standard output.
    void Save();
    /// "Save As…": shows the save panel, made on first use.
    void ShowSavePanel();
    /// 'svfp': the panel's choice, a folder and a name. Ignored when either
    /// is missing or the folder does not exist; otherwise it becomes the
    /// file entry and the window's title, and 'save' is posted.
    void HandlePanelChoice(const Message& message);

    /// Writes the document as a WAV file and marks the history saved.
    status_t SaveFile(const std::filesystem::path& file);

    /// Asks about unsaved changes when there are any, saving when told to.
    /// False when the answer is not to close, or when the save it was told
    /// to make failed (reported like "Save").
    bool AgreeToClose(QuillexWindow* window);

    /// The "Save changes?" alert with its three buttons; returns the index of
    /// the button chosen.
    static int AskSaveChanges(QWidget* parent);
    /// Replaces the question asked on closing (null restores the alert).
    static void SetSaveQuestion(SaveQuestion question);

    const std::optional<std::filesystem::path>& FileEntry() const { return fileEntry_; }
    void SetFileEntry(std::optional<std::filesystem::path> entry) { fileEntry_ = std::move(entry); }
    /// The save panel; null before its first use.
    QFileDialog* SavePanel() const { return savePanel_.get(); }

    // SaveTarget
    ChannelManager* DocumentManager() override { return &manager_; }
    HistoryManager* DocumentHistory() override { return &history_; }
    void SetSaveItemEnabled(bool enabled) override;

private:
    void PanelChose(const QString& file);
    /// Saves to file; a failure prints "error writing file. (%s)\n".
    void SaveAndReport(const std::filesystem::path& file);
    /// An untitled document closes without a question, however much it was
    /// edited.
    bool IsDocumentSaved();

    QWidget& window_;
    MessageTarget& target_;
    ChannelManager& manager_;
    HistoryManager& history_;
    QAction& saveItem_;
    std::optional<std::filesystem::path> fileEntry_;
    std::unique_ptr<QFileDialog> savePanel_;
};

}  // namespace glimmet
