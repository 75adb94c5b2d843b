#pragma once

#include <QMainWindow>

#include <cstdint>
#include <filesystem>
#include <memory>
#include <optional>

#include "app/CommandTable.h"
#include "app/ControlRow.h"
#include "app/SaveFlow.h"
#include "files/LoadTarget.h"
#include "playback/PlaybackWindow.h"
#include "sound/DocumentWindow.h"
#include "support/Locker.h"
#include "support/Message.h"

class QAction;
class QCheckBox;
class QComboBox;
class QFileDialog;

namespace glimmet {

class Action;
class ActionRunner;
class ChannelContainerView;
class ChannelManager;
class CopyBuffer;
class EditCommands;
class HistoryManager;
class LoadQueue;
class MenuBuilder;
class PlayButton;
class PlaybackController;
class PlayModeButton;
class StopButton;
class TextControl;
class TransportButton;
class ZoomSlider;
enum class KeptMenuItem;

/// A document window: one open sound with its channels, history, views,
/// menus and controls. Every command reaches it as a Message; MessageReceived
/// is the program's main dispatch, through the window's command table.
///
/// The window only coordinates: the menus come from MenuBuilder, edits run
/// through EditCommands and ActionRunner, saving is SaveFlow's.
///
/// Widgets live in the GUI thread, so all dispatch runs there; the window
/// lock is held around each dispatch so that the audio thread's timed try
/// (visible play mode) knows when the view may be read.
class QuillexWindow : public QMainWindow,
                      public DocumentWindow,
                      public LoadTarget,
                      public PlaybackWindow {
    Q_OBJECT

public:
    using SaveAnswer = SaveFlow::SaveAnswer;
    using enum SaveFlow::SaveAnswer;
    using SaveQuestion = SaveFlow::SaveQuestion;

    /// copyBuffer is the application's, shared by every window; null
    /// (a window without an application) copies and pastes nothing.
    explicit QuillexWindow(CopyBuffer* copyBuffer = nullptr);
    ~QuillexWindow() override;

    // DocumentWindow: may be called from any thread.
    using DocumentWindow::PostMessage;
    status_t PostMessage(const Message& message) override;
    bool LockWithTimeout(int64_t timeoutMicros) override;
    void UnlockWindow() override;
    void GetVisibleFrames(int64_t* first, int64_t* last) override;

    void LockWindow();

    // LoadTarget: the window's thread, while it loads.
    ChannelManager* DocumentManager() override { return manager_; }
    bool IsAppendOnLoad() override { return appendOnLoad_; }
    void DocumentReplaced() override;
    void ReplaceFileEntry(const std::filesystem::path& entry) override;
    void SetWindowTitle(const std::string& title) override;
    status_t PostToSelf(uint32_t what) override { return PostMessage(what); }

    // PlaybackWindow: the window's thread, from the playback commands.
    void SetPlaymarkFrame(int64_t frame) override;
    void SetPlaymarkToCursor() override;
    void SetPlayModeButtonMode(int32_t mode) override;
    int32_t MarkedPlayModeIndex() override;
    bool IsLoopChecked() override;

    /// Handles one command; see the window's command table.
    void MessageReceived(const Message& message);

    /// Asks about saving when needed and, when closing is agreed, asks the
    /// application to delete the window. Always false: a window never ends
    /// itself.
    bool QuitRequested();
    /// Ends the window for good: releases the window lock the caller took,
    /// hides it and deletes it once control returns to the event loop.
    void Quit();

    /// Copies the range of every selected channel into the application's
    /// copy buffer; with no channel selected the buffer stays as it was.
    void Copy();
    /// Makes action the pending one, binds it and, unless it asks for
    /// parameters first, posts the command that runs it.
    void SetupAction(std::unique_ptr<Action> action);
    /// Relabels and enables the undo, redo, delete history and save items
    /// from the history.
    void UpdateUndoMenu();

    /// Loads a sound file: replaces the document's channels, or adds to them
    /// when append on load is set. The result of the reader.
    status_t SetTo(const std::filesystem::path& file);
    /// SetTo without waiting: the file decodes on a worker thread while the
    /// window shows how far it got, and the document takes its channels when
    /// they are complete. Files opened while one loads follow in order, each
    /// with the append flag of the moment it was opened.
    void OpenFile(const std::filesystem::path& file);
    /// Files opened with OpenFile that are not in the document yet.
    bool IsLoading() const;
    LoadQueue* Loads() const { return loads_.get(); }
    /// Writes the document as a WAV file and marks the history saved.
    status_t SaveFile(const std::filesystem::path& file);

    /// The "Save changes?" alert with its three buttons; returns the index of
    /// the button chosen.
    static int AskSaveChanges(QuillexWindow* window);
    /// Replaces the question asked on closing (null restores the alert).
    static void SetSaveQuestion(SaveQuestion question);

    ChannelManager* Manager() const { return manager_; }
    HistoryManager* History() const { return history_; }
    Action* PendingAction() const;
    /// The copy buffer the window copies into and pastes from.
    const CopyBuffer* SharedCopyBuffer() const;
    bool IsPlaying() const;
    /// The play mode button's mode: 0 while playback runs, 1 while it is
    /// stopped.
    int32_t PlayModeButtonMode() const;
    ChannelContainerView* ContainerView() const { return containerView_; }
    ZoomSlider* GetZoomSlider() const { return zoomSlider_; }
    PlaybackController* Playback() const { return playback_.get(); }
    bool AppendOnLoad() const { return appendOnLoad_; }
    void SetAppendOnLoad(bool append) { appendOnLoad_ = append; }
    const std::optional<std::filesystem::path>& FileEntry() const;
    void SetFileEntry(std::optional<std::filesystem::path> entry);
    QAction* MenuItem(KeptMenuItem which) const;
    TextControl* RangeStartField() const { return controls_->RangeStartField(); }
    TextControl* RangeEndField() const { return controls_->RangeEndField(); }
    QComboBox* PlayModePopup() const { return controls_->PlayModePopup(); }
    QCheckBox* LoopBox() const { return controls_->LoopBox(); }
    PlayButton* GetPlayButton() const { return controls_->Play(); }
    PlayModeButton* GetPlayModeButton() const { return controls_->PlayMode(); }
    StopButton* GetStopButton() const { return controls_->Stop(); }
    /// The transport button called name ("play", "play mode", "stop"), or
    /// null.
    TransportButton* TransportButtonNamed(const QString& name) const { return controls_->TransportButtonNamed(name); }
    /// The save panel, made on first use; null before.
    QFileDialog* SavePanel() const;

protected:
    void customEvent(QEvent* event) override;
    void closeEvent(QCloseEvent* event) override;
    void dragEnterEvent(QDragEnterEvent* event) override;
    void dropEvent(QDropEvent* event) override;

private:
    void PostToApplication(const Message& message);
    void FillCommandTable();

    // Rows of the command table that stay with the window.
    void HandleSetDisplayRange(const Message& message);
    void HandleRangeStartChanged(const Message& message);
    void HandleRangeEndChanged(const Message& message);
    void HandleSetRangeStart();
    void HandleSetRangeEnd();
    void HandleBubbleHelpMark(const Message& message);
    void HandleOpen(const Message& message);
    void HandleAppend();
    void HandleDrop(const Message& message);

    void UpdateZoomRangeItem();

    // Declared first so that they outlive everything that points into them.
    std::unique_ptr<ChannelManager> ownedManager_;
    std::unique_ptr<HistoryManager> ownedHistory_;

    ChannelManager* manager_;
    HistoryManager* history_;
    ZoomSlider* zoomSlider_ = nullptr;
    ChannelContainerView* containerView_ = nullptr;
    std::unique_ptr<MenuBuilder> menus_;
    std::unique_ptr<ActionRunner> actions_;
    std::unique_ptr<EditCommands> edits_;
    std::unique_ptr<SaveFlow> saving_;
    CommandTable commands_;
    /// Playing state, the play mark throttle and the playback graph.
    std::unique_ptr<PlaybackController> playback_;
    bool appendOnLoad_ = false;
    std::unique_ptr<LoadQueue> loads_;
    /// The transport buttons, the play mode popup, the loop box and the
    /// range fields.
    ControlRow* controls_ = nullptr;

    Locker windowLock_;
    bool quitting_ = false;
};

}  // namespace glimmet
