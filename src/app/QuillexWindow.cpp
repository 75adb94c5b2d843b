#include "app/QuillexWindow.h"

#include <QAction>
#include <QApplication>
#include <QCheckBox>
#include <QCloseEvent>
#include <QComboBox>
#include <QFileDialog>
#include <QFrame>
#include <QMenuBar>
#include <QMimeData>
#include <QPalette>
#include <QShortcut>
#include <QUrl>
#include <QVBoxLayout>

#include <cstdlib>

#include "app/ActionRunner.h"
#include "app/BubbleHelper.h"
#include "app/ControlRow.h"
#include "app/EditCommands.h"
#include "app/HelpTexts.h"
#include "app/LoadQueue.h"
#include "app/MenuBuilder.h"
#include "app/MenuTable.h"
#include "app/Quillex.h"
#include "app/TextControl.h"
#include "edit/Action.h"
#include "edit/HistoryManager.h"
#include "files/DocumentLoader.h"
#include "playback/PlaybackController.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/MessageCodes.h"
#include "support/MessageEvent.h"
#include "support/MessageFields.h"
#include "support/ScriptLine.h"
#include "views/ChannelContainerView.h"
#include "views/PlayButton.h"
#include "views/PlayModeButton.h"
#include "views/StopButton.h"
#include "views/ViewColors.h"
#include "views/ZoomSlider.h"

namespace glimmet {

namespace {

/// A range field's text as the number it stands for.
int64_t RangeFieldValue(const TextControl* field)
{
    return ScriptLine::RangeFieldNumber(field->Text().toStdString());
}

}  // namespace

QuillexWindow::QuillexWindow(CopyBuffer* copyBuffer)
    : QMainWindow(nullptr),
      ownedManager_(std::make_unique<ChannelManager>(this)),
      ownedHistory_(std::make_unique<HistoryManager>()),
      manager_(ownedManager_.get()),
      history_(ownedHistory_.get())
{
    setAttribute(Qt::WA_QuitOnClose, false);
    setWindowTitle(QStringLiteral("Glimmet"));
    // The window's own views stand on the views' grey, not the style's.
    QPalette grey = palette();
    grey.setColor(QPalette::Window, ViewBackgroundColor());
    setPalette(grey);
    move(100, 100);
    resize(701, 301);

    zoomSlider_ = new ZoomSlider(this, 0, 0, 0);
    containerView_ = new ChannelContainerView(manager_, zoomSlider_, this);

    menus_ = std::make_unique<MenuBuilder>([this](const Message& message) { PostMessage(message); },
        [this](const Message& message) { PostToApplication(message); });
    setMenuBar(menus_->Build(this));
    actions_ = std::make_unique<ActionRunner>(*this, *manager_, *containerView_, *history_, *menus_);
    edits_ = std::make_unique<EditCommands>(*this, this, *manager_, *actions_, copyBuffer);
    saving_ = std::make_unique<SaveFlow>(*this, *this, *manager_, *history_, *menus_->Item(KeptMenuItem::Save));
    FillCommandTable();

    auto* background = new QFrame(this);
    background->setObjectName(QStringLiteral("Background"));
    background->setFrameStyle(QFrame::Panel | QFrame::Raised);
    auto* column = new QVBoxLayout(background);
    column->setContentsMargins(5, 5, 5, 5);
    column->setSpacing(0);
    controls_ = new ControlRow(this, background);
    column->addWidget(controls_);
    column->addSpacing(5);
    column->addWidget(containerView_, 1);
    setCentralWidget(background);

    BubbleHelper::RegisterHelp(containerView_, help::kChannelContainerView);
    BubbleHelper::RegisterHelp(PlayModePopup()->parentWidget(), help::kPlayModePopup);
    BubbleHelper::RegisterHelp(GetPlayButton(), help::kPlayButton);
    BubbleHelper::RegisterHelp(GetPlayModeButton(), help::kPlayModeButton);
    BubbleHelper::RegisterHelp(GetStopButton(), help::kStopButton);

    loads_ = std::make_unique<LoadQueue>(*this, windowLock_, containerView_);

    playback_ = std::make_unique<PlaybackController>(manager_, this, this);
    playback_->SetUp();

    auto* playShortcut = new QShortcut(QKeySequence(Qt::CTRL | Qt::Key_Space), this);
    connect(playShortcut, &QShortcut::activated, this, [this] { PostMessage(kMsgTogglePlay); });

    // The history writes old undo data out on a thread of its own; dropping
    // it from memory happens here, in the thread that edits the document.
    history_->SetSpillWrittenCallback([this] {
        QMetaObject::invokeMethod(this, [this] { history_->TrimMemory(); }, Qt::QueuedConnection);
    });

    setAcceptDrops(true);
    show();
}

QuillexWindow::~QuillexWindow()
{
    // A load still running is given up; its worker ends before the document
    // it would have filled goes.
    loads_.reset();
    history_->SetSpillWrittenCallback(nullptr);
    playback_->TearDown();
    playback_.reset();
    // The views point into the document; they go before it does.
    delete takeCentralWidget();
    actions_.reset();
}

// ---------------------------------------------------------------------------
// Building

QAction* QuillexWindow::MenuItem(KeptMenuItem which) const
{
    return menus_->Item(which);
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

void QuillexWindow::FillCommandTable()
{
    edits_->AddTo(commands_);
    commands_.Add(kMsgSelectAll, [this] { containerView_->SelectAll(); });
    commands_.Add(kMsgSelectNone, [this] { containerView_->DeselectAll(); });
    commands_.Add(kMsgZoomRange, [this] { containerView_->ZoomRange(); });
    commands_.Add(kMsgShowAll, [this] { containerView_->ShowAll(); });
    commands_.Add(kMsgSetDisplayRange, [this](const Message& message) { HandleSetDisplayRange(message); });
    commands_.Add(kMsgRangeStartChanged, [this](const Message& message) { HandleRangeStartChanged(message); });
    commands_.Add(kMsgRangeEndChanged, [this](const Message& message) { HandleRangeEndChanged(message); });
    commands_.Add(kMsgSetRangeStart, [this] { HandleSetRangeStart(); });
    commands_.Add(kMsgSetRangeEnd, [this] { HandleSetRangeEnd(); });
    commands_.Add(kMsgToggleBubbleHelp, [this](const Message& message) { HandleBubbleHelpMark(message); });
    commands_.Add(kMsgOpen, [this](const Message& message) { HandleOpen(message); });
    commands_.Add(kMsgAppend, [this] { HandleAppend(); });
    commands_.Add(kMsgSave, [this] { saving_->Save(); });
    commands_.Add(kMsgSaveAs, [this] { saving_->ShowSavePanel(); });
    commands_.Add(kMsgSavePanelChoice, [this](const Message& message) { saving_->HandlePanelChoice(message); });
    commands_.Add(kMsgSimpleData, [this](const Message& message) { HandleDrop(message); });
    commands_.Add(kMsgQuitRequested, [this] { QuitRequested(); });
}

void QuillexWindow::MessageReceived(const Message& message)
{
    // The playback commands come first; a code nobody handles is dropped.
    if (!playback_->MessageReceived(message))
        commands_.Dispatch(message);
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
    controls_->PlayMode()->SetMode(mode);
}

int32_t QuillexWindow::PlayModeButtonMode() const
{
    return controls_->PlayMode()->Mode();
}

int32_t QuillexWindow::MarkedPlayModeIndex()
{
    return int32_t(controls_->PlayModePopup()->currentIndex());
}

bool QuillexWindow::IsLoopChecked()
{
    return controls_->LoopBox()->isChecked();
}

void QuillexWindow::HandleSetDisplayRange(const Message& message)
{
    int64_t first = 0;
    int64_t last = 0;
    if (message.FindInt64(kFieldFirstFrame, &first) == B_OK && message.FindInt64(kFieldLastFrame, &last) == B_OK)
        containerView_->SetDisplayRange(first, last);
}

void QuillexWindow::HandleRangeStartChanged(const Message& message)
{
    int64_t frame = 0;
    if (message.FindInt64(kFieldRangeStart, &frame) != B_OK)
        return;
    RangeStartField()->SetText(QString::number(frame));
    UpdateZoomRangeItem();
}

void QuillexWindow::HandleRangeEndChanged(const Message& message)
{
    int64_t frame = 0;
    if (message.FindInt64(kFieldRangeEnd, &frame) != B_OK)
        return;
    RangeEndField()->SetText(QString::number(frame));
    UpdateZoomRangeItem();
}

void QuillexWindow::HandleSetRangeStart()
{
    manager_->SetRangeStart(RangeFieldValue(RangeStartField()));
    containerView_->RangeChanged();
    UpdateZoomRangeItem();
}

void QuillexWindow::HandleSetRangeEnd()
{
    manager_->SetRangeEnd(RangeFieldValue(RangeEndField()));
    containerView_->RangeChanged();
    UpdateZoomRangeItem();
}

void QuillexWindow::UpdateZoomRangeItem()
{
    const bool noRange = RangeFieldValue(RangeStartField()) == -1 && RangeFieldValue(RangeEndField()) == -1;
    menus_->Item(KeptMenuItem::ZoomRange)->setEnabled(!noRange);
}

// ---------------------------------------------------------------------------
// Edits

void QuillexWindow::SetupAction(std::unique_ptr<Action> action)
{
    actions_->SetupAction(std::move(action));
}

Action* QuillexWindow::PendingAction() const
{
    return actions_->PendingAction();
}

void QuillexWindow::UpdateUndoMenu()
{
    actions_->UpdateUndoMenu();
}

void QuillexWindow::Copy()
{
    edits_->Copy();
}

const CopyBuffer* QuillexWindow::SharedCopyBuffer() const
{
    return edits_->SharedCopyBuffer();
}

// ---------------------------------------------------------------------------
// Files

void QuillexWindow::HandleBubbleHelpMark(const Message& message)
{
    bool enable = false;
    if (message.FindBool(kFieldEnable, &enable) != B_OK)
        return;
    menus_->Item(KeptMenuItem::BubbleHelp)->setChecked(enable);
}

void QuillexWindow::HandleOpen(const Message& message)
{
    appendOnLoad_ = false;
    Message request(message);
    request.AddPointer(kFieldWindow, this);
    PostToApplication(request);
}

void QuillexWindow::HandleAppend()
{
    appendOnLoad_ = true;
    Message request(kMsgOpen);
    request.AddPointer(kFieldWindow, this);
    PostToApplication(request);
}

void QuillexWindow::HandleDrop(const Message& message)
{
    std::filesystem::path first;
    if (message.FindPath(kFieldRefs, &first) != B_OK)
        return;
    int32_t modifiers = 0;
    if (message.FindInt32(kFieldModifiers, &modifiers) != B_OK)
        modifiers = int32_t(QGuiApplication::keyboardModifiers().toInt());
    appendOnLoad_ = (modifiers & Qt::ShiftModifier) != 0;
    OpenFile(first);
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
            message.AddPath(kFieldRefs, std::filesystem::path(url.toLocalFile().toStdString()));
    }
    // The modifiers of the drop itself, so that a Shift released right after
    // the drop still counts.
    message.AddInt32(kFieldModifiers, int32_t(event->modifiers().toInt()));
    event->acceptProposedAction();
    PostMessage(message);
}

status_t QuillexWindow::SetTo(const std::filesystem::path& file)
{
    return DocumentLoader::Load(file, *this);
}

void QuillexWindow::OpenFile(const std::filesystem::path& file)
{
    loads_->Open(file, appendOnLoad_, manager_ != nullptr);
}

bool QuillexWindow::IsLoading() const
{
    return loads_->IsLoading();
}

status_t QuillexWindow::SaveFile(const std::filesystem::path& file)
{
    return saving_->SaveFile(file);
}

QFileDialog* QuillexWindow::SavePanel() const
{
    return saving_->SavePanel();
}

const std::optional<std::filesystem::path>& QuillexWindow::FileEntry() const
{
    return saving_->FileEntry();
}

void QuillexWindow::SetFileEntry(std::optional<std::filesystem::path> entry)
{
    saving_->SetFileEntry(std::move(entry));
}

// Opening a file into the window starts a new document: the old one's
// actions could only write its samples over the new file's.
// A window with no history yet keeps its menu items as built.
void QuillexWindow::DocumentReplaced()
{
    if (history_->UndoName() != nullptr || history_->RedoName() != nullptr)
        actions_->DeleteHistory();
}

void QuillexWindow::ReplaceFileEntry(const std::filesystem::path& entry)
{
    saving_->SetFileEntry(entry);
}

void QuillexWindow::SetWindowTitle(const std::string& title)
{
    setWindowTitle(QString::fromStdString(title));
}

// ---------------------------------------------------------------------------
// Closing

void QuillexWindow::SetSaveQuestion(SaveQuestion question)
{
    SaveFlow::SetSaveQuestion(std::move(question));
}

int QuillexWindow::AskSaveChanges(QuillexWindow* window)
{
    return SaveFlow::AskSaveChanges(window);
}

bool QuillexWindow::QuitRequested()
{
    if (!saving_->AgreeToClose(this))
        return false;
    Message closing(kMsgDeleteWindow);
    closing.AddPointer(kFieldWindow, this);
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
