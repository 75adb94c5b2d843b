#include "app/QuillexWindow.h"

#include <QAction>
#include <QApplication>
#include <QCheckBox>
#include <QCloseEvent>
#include <QComboBox>
#include <QFileDialog>
#include <QFrame>
#include <QHBoxLayout>
#include <QLabel>
#include <QMenuBar>
#include <QMessageBox>
#include <QMimeData>
#include <QPushButton>
#include <QShortcut>
#include <QUrl>
#include <QVBoxLayout>

#include <cstdio>
#include <cstdlib>
#include <vector>

#include "app/MenuTable.h"
#include "app/Quillex.h"
#include "app/TextControl.h"
#include "edit/Action.h"
#include "edit/AddChannelAction.h"
#include "edit/CopyBuffer.h"
#include "edit/FadeInAction.h"
#include "edit/FadeOutAction.h"
#include "edit/HistoryManager.h"
#include "edit/MaximizeAction.h"
#include "edit/MoveSampleAction.h"
#include "edit/PasteAction.h"
#include "edit/RemoveAction.h"
#include "edit/RemoveChannelAction.h"
#include "edit/RevertAction.h"
#include "edit/RevertPhasesAction.h"
#include "edit/TruncateAction.h"
#include "files/DocumentLoader.h"
#include "files/DocumentSaver.h"
#include "playback/PlaybackController.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/MessageCodes.h"
#include "support/MessageEvent.h"
#include "views/ChannelContainerView.h"
#include "views/ZoomSlider.h"

namespace glimmet {

namespace {

QuillexWindow::SaveQuestion& SaveQuestionHook()
{
    static QuillexWindow::SaveQuestion question;
    return question;
}

/// A range field's text as the number it stands for: read like strtol in
/// base 10, kept to 32 bits and widened again.
int64_t RangeFieldValue(const TextControl* field)
{
    const std::string text = field->Text().toStdString();
    return int64_t(int32_t(std::strtol(text.c_str(), nullptr, 10)));
}

QString TitleFor(const std::string& name)
{
    return QStringLiteral("Glimmet - ") + QString::fromStdString(name);
}

}  // namespace

QuillexWindow::QuillexWindow()
    : QMainWindow(nullptr),
      ownedManager_(std::make_unique<ChannelManager>(this)),
      ownedHistory_(std::make_unique<HistoryManager>()),
      manager_(ownedManager_.get()),
      history_(ownedHistory_.get())
{
    setAttribute(Qt::WA_QuitOnClose, false);
    setWindowTitle(QStringLiteral("Glimmet"));
    move(100, 100);
    resize(701, 301);

    zoomSlider_ = new ZoomSlider(this, 0, 0, 0);
    containerView_ = new ChannelContainerView(manager_, zoomSlider_, this);

    setMenuBar(CreateMenu());

    auto* background = new QFrame(this);
    background->setObjectName(QStringLiteral("Background"));
    background->setFrameStyle(QFrame::Panel | QFrame::Raised);
    auto* column = new QVBoxLayout(background);
    column->setContentsMargins(5, 5, 5, 5);
    column->setSpacing(0);
    column->addWidget(CreateControlRow());
    column->addSpacing(5);
    column->addWidget(containerView_, 1);
    setCentralWidget(background);

    playback_ = std::make_unique<PlaybackController>(manager_, this, this);
    playback_->SetUp();

    auto* playShortcut = new QShortcut(QKeySequence(Qt::CTRL | Qt::Key_Space), this);
    connect(playShortcut, &QShortcut::activated, this, [this] { PostMessage(kMsgTogglePlay); });

    setAcceptDrops(true);
    show();
}

QuillexWindow::~QuillexWindow()
{
    playback_->TearDown();
    playback_.reset();
    // The views point into the document; they go before it does.
    delete takeCentralWidget();
    pendingAction_.reset();
    supersededActions_.clear();
}

// ---------------------------------------------------------------------------
// Building

QMenuBar* QuillexWindow::CreateMenu()
{
    auto* bar = new QMenuBar(this);
    QMenu* menu = nullptr;
    for (const MenuEntry& entry : DocumentMenuTable()) {
        const QString title = QString::fromUtf8(entry.menu);
        if (menu == nullptr || menu->title() != title)
            menu = bar->addMenu(title);
        if (entry.label == nullptr) {
            menu->addSeparator();
            continue;
        }
        QAction* item = menu->addAction(QString::fromUtf8(entry.label));
        if (entry.key != 0) {
            const Qt::KeyboardModifiers modifiers =
                entry.shift ? (Qt::ControlModifier | Qt::ShiftModifier) : Qt::ControlModifier;
            item->setShortcut(QKeySequence(QKeyCombination(modifiers, Qt::Key(entry.key))));
        }
        const Message message(entry.code);
        if (entry.toApplication)
            connect(item, &QAction::triggered, this, [this, message] { PostToApplication(message); });
        else
            connect(item, &QAction::triggered, this, [this, message] { PostMessage(message); });
        KeepMenuItem(entry.kept, item);
    }
    return bar;
}

void QuillexWindow::KeepMenuItem(KeptMenuItem which, QAction* item)
{
    switch (which) {
    case KeptMenuItem::None:
        break;
    case KeptMenuItem::Save:
        saveItem_ = item;
        break;
    case KeptMenuItem::Undo:
        undoItem_ = item;
        break;
    case KeptMenuItem::Redo:
        redoItem_ = item;
        break;
    case KeptMenuItem::DeleteHistory:
        deleteHistoryItem_ = item;
        break;
    case KeptMenuItem::ZoomRange:
        zoomRangeItem_ = item;
        break;
    case KeptMenuItem::BubbleHelp:
        bubbleHelpItem_ = item;
        // Only the application's broadcast marks the item; a click must
        // not toggle the mark by itself.
        item->setCheckable(true);
        connect(item, &QAction::triggered, item, [item](bool checked) { item->setChecked(!checked); });
        break;
    }
}

QAction* QuillexWindow::MenuItem(KeptMenuItem which) const
{
    switch (which) {
    case KeptMenuItem::Save:
        return saveItem_;
    case KeptMenuItem::Undo:
        return undoItem_;
    case KeptMenuItem::Redo:
        return redoItem_;
    case KeptMenuItem::DeleteHistory:
        return deleteHistoryItem_;
    case KeptMenuItem::ZoomRange:
        return zoomRangeItem_;
    case KeptMenuItem::BubbleHelp:
        return bubbleHelpItem_;
    case KeptMenuItem::None:
        break;
    }
    return nullptr;
}

QWidget* QuillexWindow::CreateControlRow()
{
    auto* row = new QWidget;
    auto* layout = new QHBoxLayout(row);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->setSpacing(0);

    layout->addWidget(CreatePlayModePopup());
    loopBox_ = new QCheckBox(QStringLiteral("Loop"), row);
    loopBox_->setChecked(true);
    connect(loopBox_, &QCheckBox::clicked, this, [this] { PostMessage(kMsgLoop); });
    layout->addWidget(loopBox_);

    layout->addStretch(1);

    const QString digits = QStringLiteral("0123456789-");
    rangeStartField_ = new TextControl(QStringLiteral("Range Start:"), QStringLiteral("-1"),
        Message(kMsgSetRangeStart), this, row);
    rangeStartField_->AllowOnly(digits);
    layout->addWidget(rangeStartField_);
    layout->addSpacing(15);
    rangeEndField_ = new TextControl(QStringLiteral("Range End:"), QStringLiteral("-1"),
        Message(kMsgSetRangeEnd), this, row);
    rangeEndField_->AllowOnly(digits);
    layout->addWidget(rangeEndField_);
    return row;
}

QWidget* QuillexWindow::CreatePlayModePopup()
{
    auto* popup = new QWidget;
    auto* layout = new QHBoxLayout(popup);
    layout->setContentsMargins(0, 0, 0, 0);
    auto* label = new QLabel(QStringLiteral("Play"), popup);
    playModePopup_ = new QComboBox(popup);
    playModePopup_->addItems({QStringLiteral("All"), QStringLiteral("Range"), QStringLiteral("Visible")});
    label->setBuddy(playModePopup_);
    connect(playModePopup_, &QComboBox::activated, this, [this] { PostMessage(kMsgPlayMode); });
    layout->addWidget(label);
    layout->addWidget(playModePopup_);
    return popup;
}

// ---------------------------------------------------------------------------
// Messages and locking

status_t QuillexWindow::PostMessage(const Message& message)
{
    QCoreApplication::postEvent(this, new MessageEvent(message));
    return B_OK;
}

bool QuillexWindow::LockWithTimeout(int64_t timeoutMicros)
{
    return windowLock_.LockWithTimeout(timeoutMicros);
}

void QuillexWindow::UnlockWindow()
{
    windowLock_.Unlock();
}

void QuillexWindow::LockWindow()
{
    windowLock_.Lock();
}

void QuillexWindow::GetVisibleFrames(int64_t* first, int64_t* last)
{
    *first = containerView_->FirstDisplayedFrame();
    *last = containerView_->LastDisplayedFrame();
}

void QuillexWindow::customEvent(QEvent* event)
{
    if (event->type() != MessageEvent::EventType()) {
        QMainWindow::customEvent(event);
        return;
    }
    windowLock_.Lock();
    MessageReceived(static_cast<MessageEvent*>(event)->message());
    windowLock_.Unlock();
}

void QuillexWindow::PostToApplication(const Message& message)
{
    if (Quillex* application = Quillex::Instance())
        application->PostMessage(message);
}

void QuillexWindow::MessageReceived(const Message& message)
{
    if (playback_->MessageReceived(message) || HandleViewCommand(message) || HandleEditCommand(message.what))
        return;
    switch (message.what) {
    case kMsgRangeStartChanged:
        HandleRangeStartChanged(message);
        break;
    case kMsgRangeEndChanged:
        HandleRangeEndChanged(message);
        break;
    case kMsgSetRangeStart:
        HandleSetRangeStart();
        break;
    case kMsgSetRangeEnd:
        HandleSetRangeEnd();
        break;
    case kMsgActionGo:
        HandleActionGo();
        break;
    case kMsgActionCancel:
        HandleActionCancel();
        break;
    case kMsgUndo:
        HandleUndo();
        break;
    case kMsgRedo:
        HandleRedo();
        break;
    case kMsgClearHistory:
        HandleClearHistory();
        break;
    case kMsgCopy:
        Copy();
        break;
    case kMsgSampleMoved:
        HandleSampleMoved(message);
        break;
    case kMsgToggleBubbleHelp:
        HandleBubbleHelpMark(message);
        break;
    case kMsgOpen:
        HandleOpen(message);
        break;
    case kMsgAppend:
        HandleAppend();
        break;
    case kMsgSave:
        HandleSave();
        break;
    case kMsgSaveAs:
        ShowSavePanel();
        break;
    case kMsgSavePanelChoice:
        HandleSavePanelChoice(message);
        break;
    case kMsgSimpleData:
        HandleDrop(message);
        break;
    case kMsgQuitRequested:
        QuitRequested();
        break;
    default:
        break;
    }
}

// ---------------------------------------------------------------------------
// Play controls and range fields

bool QuillexWindow::IsPlaying() const
{
    return playback_->IsPlaying();
}

void QuillexWindow::SetPlaymarkFrame(int64_t frame)
{
    containerView_->SetPlaymarkFrame(frame);
}

void QuillexWindow::SetPlaymarkToCursor()
{
    containerView_->SetPlaymarkToCursor();
}

void QuillexWindow::SetPlayModeButtonMode(int32_t mode)
{
    playModeButtonMode_ = mode;
}

int32_t QuillexWindow::MarkedPlayModeIndex()
{
    return int32_t(playModePopup_->currentIndex());
}

bool QuillexWindow::IsLoopChecked()
{
    return loopBox_->isChecked();
}

bool QuillexWindow::HandleViewCommand(const Message& message)
{
    switch (message.what) {
    case kMsgSelectAll:
        containerView_->SelectAll();
        return true;
    case kMsgSelectNone:
        containerView_->DeselectAll();
        return true;
    case kMsgZoomRange:
        containerView_->ZoomRange();
        return true;
    case kMsgShowAll:
        containerView_->ShowAll();
        return true;
    case kMsgSetDisplayRange: {
        int64_t first = 0;
        int64_t last = 0;
        if (message.FindInt64("first frame", &first) == B_OK && message.FindInt64("last frame", &last) == B_OK)
            containerView_->SetDisplayRange(first, last);
        return true;
    }
    default:
        return false;
    }
}

void QuillexWindow::HandleRangeStartChanged(const Message& message)
{
    int64_t frame = 0;
    if (message.FindInt64("range start", &frame) != B_OK)
        return;
    rangeStartField_->SetText(QString::number(frame));
    UpdateZoomRangeItem();
}

void QuillexWindow::HandleRangeEndChanged(const Message& message)
{
    int64_t frame = 0;
    if (message.FindInt64("range end", &frame) != B_OK)
        return;
    rangeEndField_->SetText(QString::number(frame));
    UpdateZoomRangeItem();
}

void QuillexWindow::HandleSetRangeStart()
{
    manager_->SetRangeStart(RangeFieldValue(rangeStartField_));
    containerView_->RangeChanged();
    UpdateZoomRangeItem();
}

void QuillexWindow::HandleSetRangeEnd()
{
    manager_->SetRangeEnd(RangeFieldValue(rangeEndField_));
    containerView_->RangeChanged();
    UpdateZoomRangeItem();
}

void QuillexWindow::UpdateZoomRangeItem()
{
    const bool noRange = RangeFieldValue(rangeStartField_) == -1 && RangeFieldValue(rangeEndField_) == -1;
    zoomRangeItem_->setEnabled(!noRange);
}

// ---------------------------------------------------------------------------
// Actions and history

void QuillexWindow::SetupAction(Action* action)
{
    // An action still waiting for its dialog stays alive (its dialog may yet
    // answer), but is no longer the one that runs.
    if (pendingAction_)
        supersededActions_.push_back(std::move(pendingAction_));
    pendingAction_.reset(action);
    if (action == nullptr)
        return;
    action->SetTo(manager_, containerView_);
    if (action->InitCheck() != B_OK) {
        pendingAction_.reset();
        return;
    }
    if (!action->SupportsConfiguration())
        PostMessage(kMsgActionGo);
}

void QuillexWindow::HandleActionGo()
{
    if (!pendingAction_ || pendingAction_->InitCheck() != B_OK)
        return;
    Action* action = pendingAction_.release();
    if (history_->AddAction(action) != B_OK) {
        // Not recorded: the window keeps it so that it is freed with it.
        supersededActions_.emplace_back(action);
    }
    action->Go();
    containerView_->UpdateAll();
    UpdateUndoMenu();
}

void QuillexWindow::HandleSampleMoved(const Message& message)
{
    Channel* channel = nullptr;
    void* view = nullptr;
    int64_t offset = 0;
    if (message.FindPointer("channel", &channel) != B_OK || message.FindPointer("sample view", &view) != B_OK
        || message.FindInt64("offset", &offset) != B_OK)
        return;
    auto action = std::make_unique<MoveSampleAction>(this);
    action->SetTo(manager_, channel, offset);
    // A move is bound to its channel rather than to the range, so it skips
    // the common setup and runs at once.
    if (action->InitCheck() != B_OK || action->SupportsConfiguration())
        return;
    if (pendingAction_)
        supersededActions_.push_back(std::move(pendingAction_));
    pendingAction_ = std::move(action);
    PostMessage(kMsgActionGo);
}

void QuillexWindow::HandleActionCancel()
{
    pendingAction_.reset();
}

void QuillexWindow::HandleUndo()
{
    const status_t status = history_->Undo();
    if (status != B_OK) {
        std::printf("Error doing undo: %s\n", StatusText(status));
        std::fflush(stdout);
        return;
    }
    containerView_->UpdateAll();
    UpdateUndoMenu();
}

void QuillexWindow::HandleRedo()
{
    const status_t status = history_->Redo();
    if (status != B_OK) {
        std::printf("Error doing redo: %s\n", StatusText(status));
        std::fflush(stdout);
        return;
    }
    containerView_->UpdateAll();
    UpdateUndoMenu();
}

void QuillexWindow::HandleClearHistory()
{
    history_->Clear();
    UpdateUndoMenu();
}

void QuillexWindow::UpdateUndoMenu()
{
    const char* undoName = history_->UndoName();
    const char* redoName = history_->RedoName();
    deleteHistoryItem_->setEnabled(false);
    if (undoName != nullptr) {
        undoItem_->setEnabled(true);
        deleteHistoryItem_->setEnabled(true);
        undoItem_->setText(QStringLiteral("Undo ") + QString::fromUtf8(undoName));
    } else {
        undoItem_->setEnabled(false);
        undoItem_->setText(QStringLiteral("Undo"));
    }
    if (redoName != nullptr) {
        redoItem_->setEnabled(true);
        deleteHistoryItem_->setEnabled(true);
        redoItem_->setText(QStringLiteral("Redo ") + QString::fromUtf8(redoName));
    } else {
        redoItem_->setEnabled(false);
        redoItem_->setText(QStringLiteral("Redo"));
    }
    saveItem_->setEnabled(!history_->IsSaved());
}

void QuillexWindow::Copy()
{
    manager_->Lock();
    std::vector<Channel*> selected;
    for (int32_t index = 0; Channel* channel = manager_->ChannelAt(index); ++index) {
        if (channel->IsSelected())
            selected.push_back(channel);
    }
    Quillex* application = Quillex::Instance();
    if (!selected.empty() && application != nullptr) {
        const int64_t start = manager_->RangeStart();
        const int64_t frames = manager_->RangeEnd() - start + 1;
        std::vector<CopyBuffer::Samples> channels;
        for (Channel* channel : selected) {
            CopyBuffer::Samples samples = Action::AllocateSamples(frames);
            // A range no array can hold copies nothing; the buffer refuses
            // an empty set of channels.
            if (!samples) {
                channels.clear();
                break;
            }
            channel->FillBuffer(samples.get(), start, frames);
            channels.push_back(std::move(samples));
        }
        application->SetCopyBuffer(std::move(channels), frames);
    }
    manager_->Unlock();
}

bool QuillexWindow::HandleEditCommand(uint32_t what)
{
    switch (what) {
    case kMsgCut:
        Copy();
        SetupAction(new RemoveAction(this));
        return true;
    case kMsgRemove:
        SetupAction(new RemoveAction(this));
        return true;
    case kMsgPaste:
        SetupAction(new PasteAction(this));
        return true;
    case kMsgTruncate:
        SetupAction(new TruncateAction(this));
        return true;
    case kMsgAddChannel:
        SetupAction(new AddChannelAction(this));
        return true;
    case kMsgRemoveChannel:
        SetupAction(new RemoveChannelAction(this));
        return true;
    case kMsgFadeIn:
        SetupAction(new FadeInAction(this));
        return true;
    case kMsgFadeOut:
        SetupAction(new FadeOutAction(this));
        return true;
    case kMsgMaximize:
        SetupAction(new MaximizeAction(this));
        return true;
    case kMsgRevert:
        SetupAction(new RevertAction(this));
        return true;
    case kMsgRevertPhases:
        SetupAction(new RevertPhasesAction(this));
        return true;
    default:
        return false;
    }
}

// ---------------------------------------------------------------------------
// Files

void QuillexWindow::HandleBubbleHelpMark(const Message& message)
{
    bool enable = false;
    if (message.FindBool("enable", &enable) != B_OK)
        return;
    bubbleHelpItem_->setChecked(enable);
}

void QuillexWindow::HandleOpen(const Message& message)
{
    appendOnLoad_ = false;
    Message request(message);
    request.AddPointer("window", this);
    PostToApplication(request);
}

void QuillexWindow::HandleAppend()
{
    appendOnLoad_ = true;
    Message request(kMsgOpen);
    request.AddPointer("window", this);
    PostToApplication(request);
}

void QuillexWindow::HandleDrop(const Message& message)
{
    std::filesystem::path first;
    if (message.FindPath("refs", &first) != B_OK)
        return;
    int32_t modifiers = 0;
    if (message.FindInt32("modifiers", &modifiers) != B_OK)
        modifiers = int32_t(QGuiApplication::keyboardModifiers().toInt());
    appendOnLoad_ = (modifiers & Qt::ShiftModifier) != 0;
    SetTo(first);
}

void QuillexWindow::dragEnterEvent(QDragEnterEvent* event)
{
    if (event->mimeData()->hasUrls())
        event->acceptProposedAction();
}

void QuillexWindow::dropEvent(QDropEvent* event)
{
    Message message(kMsgSimpleData);
    for (const QUrl& url : event->mimeData()->urls()) {
        if (url.isLocalFile())
            message.AddPath("refs", std::filesystem::path(url.toLocalFile().toStdString()));
    }
    // The modifiers of the drop itself, so that a Shift released right after
    // the drop still counts.
    message.AddInt32("modifiers", int32_t(event->modifiers().toInt()));
    event->acceptProposedAction();
    PostMessage(message);
}

void QuillexWindow::HandleSave()
{
    if (!fileEntry_) {
        ShowSavePanel();
        return;
    }
    const status_t status = SaveFile(*fileEntry_);
    if (status != B_OK) {
        std::printf("error writing file. (%s)\n", StatusText(status));
        std::fflush(stdout);
    }
}

void QuillexWindow::ShowSavePanel()
{
    if (!savePanel_) {
        savePanel_ = std::make_unique<QFileDialog>(this);
        savePanel_->setOption(QFileDialog::DontUseNativeDialog);
        savePanel_->setAcceptMode(QFileDialog::AcceptSave);
        savePanel_->setFileMode(QFileDialog::AnyFile);
        savePanel_->selectFile(QStringLiteral("sound.wav"));
        connect(savePanel_.get(), &QFileDialog::fileSelected, this, &QuillexWindow::SavePanelChose);
    } else {
        // Re-reads the folder, which may have changed since the last save.
        savePanel_->setDirectory(savePanel_->directory());
    }
    savePanel_->show();
    savePanel_->raise();
}

void QuillexWindow::SavePanelChose(const QString& file)
{
    const std::filesystem::path chosen(file.toStdString());
    Message message(kMsgSavePanelChoice);
    message.AddPath("directory", chosen.parent_path());
    message.AddString("name", chosen.filename().string());
    PostMessage(message);
}

void QuillexWindow::HandleSavePanelChoice(const Message& message)
{
    std::filesystem::path directory;
    std::string name;
    if (message.FindPath("directory", &directory) != B_OK || message.FindString("name", &name) != B_OK)
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
    setWindowTitle(TitleFor(name));
    PostMessage(kMsgSave);
}

status_t QuillexWindow::SetTo(const std::filesystem::path& file)
{
    return DocumentLoader::Load(file, *this);
}

status_t QuillexWindow::SaveFile(const std::filesystem::path& file)
{
    return DocumentSaver::SaveFile(file, *this);
}

void QuillexWindow::SetWindowTitle(const std::string& title)
{
    setWindowTitle(QString::fromStdString(title));
}

void QuillexWindow::SetSaveItemEnabled(bool enabled)
{
    saveItem_->setEnabled(enabled);
}

// ---------------------------------------------------------------------------
// Closing

bool QuillexWindow::IsDocumentSaved()
{
    // An untitled document closes without a question, however much it was
    // edited.
    return !fileEntry_ || history_->IsSaved();
}

void QuillexWindow::SetSaveQuestion(SaveQuestion question)
{
    SaveQuestionHook() = std::move(question);
}

int QuillexWindow::AskSaveChanges(QuillexWindow* window)
{
    QMessageBox alert(QMessageBox::Warning, QString(), QStringLiteral("Save changes?"), QMessageBox::NoButton,
        window);
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

bool QuillexWindow::QuitRequested()
{
    if (!IsDocumentSaved()) {
        const SaveQuestion& question = SaveQuestionHook();
        const int answer = question ? question(this) : AskSaveChanges(this);
        if (answer == kDontQuit)
            return false;
        if (answer == kSave && fileEntry_)
            SaveFile(*fileEntry_);
    }
    Message closing(kMsgDeleteWindow);
    closing.AddPointer("window", this);
    PostToApplication(closing);
    return false;
}

void QuillexWindow::Quit()
{
    quitting_ = true;
    windowLock_.Unlock();
    close();
    deleteLater();
}

void QuillexWindow::closeEvent(QCloseEvent* event)
{
    if (quitting_) {
        event->accept();
        return;
    }
    // The window's close box asks like "Close" does; the application ends
    // the window once closing is agreed.
    event->ignore();
    PostMessage(kMsgQuitRequested);
}

}  // namespace glimmet
