#include "app/Quillex.h"

#include <QApplication>
#include <QCoreApplication>
#include <QDesktopServices>
#include <QFileDialog>
#include <QUrl>

#include <algorithm>
#include <mutex>

#include "app/AboutWindow.h"
#include "app/BubbleHelper.h"
#include "app/QuillexWindow.h"
#include "files/panel/SndFilePanel.h"
#include "support/MessageCodes.h"
#include "support/MessageFields.h"

namespace glimmet {

namespace {

Quillex* gApplication = nullptr;

}  // namespace

Quillex::Quillex()
    : bubbleHelper_(std::make_unique<BubbleHelper>()), quitHook_([] { QCoreApplication::exit(0); })
{
    windows_.reserve(10);
    bubbleHelper_->EnableHelp(false);
    gApplication = this;
}

Quillex::~Quillex()
{
    // Windows still open when the application object goes (a test, or an
    // event loop ended from outside) are ended with it.
    std::vector<QuillexWindow*> remaining;
    {
        std::lock_guard guard(windowLock_);
        remaining.swap(windows_);
    }
    for (QuillexWindow* window : remaining)
        delete window;
    // An About box ends itself when clicked; one still open ends here.
    for (QWidget* widget : QApplication::topLevelWidgets()) {
        if (qobject_cast<AboutWindow*>(widget) != nullptr)
            delete widget;
    }
    gApplication = nullptr;
}

Quillex* Quillex::Instance()
{
    return gApplication;
}

int Quillex::Run(const QStringList& arguments)
{
    ArgvReceived(arguments);
    ReadyToRun();
    return QCoreApplication::exec();
}

bool Quillex::ResolvePath(const std::filesystem::path& path, std::filesystem::path* resolved)
{
    std::error_code error;
    if (path.empty() || !std::filesystem::exists(path, error))
        return false;
    const std::filesystem::path absolute = std::filesystem::absolute(path, error);
    if (error)
        return false;
    *resolved = absolute.lexically_normal();
    return true;
}

void Quillex::ArgvReceived(const QStringList& arguments)
{
    for (qsizetype index = 1; index < arguments.size(); ++index) {
        std::filesystem::path path;
        if (!ResolvePath(std::filesystem::path(arguments[index].toStdString()), &path))
            continue;
        if (QuillexWindow* window = NewWindow())
            LoadInto(window, path);
    }
}

void Quillex::RefsReceived(const Message& message)
{
    std::filesystem::path path;
    for (int32_t index = 0; message.FindPath(kFieldRefs, &path, index) == B_OK; ++index) {
        if (QuillexWindow* requesting = openRequestingWindow_.data()) {
            LoadInto(requesting, path);
            openRequestingWindow_ = nullptr;
        } else if (QuillexWindow* window = NewWindow()) {
            LoadInto(window, path);
        }
    }
}

void Quillex::LoadInto(QuillexWindow* window, const std::filesystem::path& path)
{
    window->LockWindow();
    window->OpenFile(path);
    window->UnlockWindow();
}

void Quillex::ReadyToRun()
{
    std::lock_guard guard(windowLock_);
    if (windows_.empty())
        NewWindow();
}

QuillexWindow* Quillex::NewWindow()
{
    std::lock_guard guard(windowLock_);
    auto* window = new QuillexWindow(&copyBuffer_);
    windows_.push_back(window);
    return window;
}

bool Quillex::DeleteWindow(QuillexWindow* window)
{
    std::lock_guard guard(windowLock_);
    const auto found = std::find(windows_.begin(), windows_.end(), window);
    if (window == nullptr || found == windows_.end())
        return false;
    windows_.erase(found);
    window->LockWindow();
    window->Quit();
    if (windows_.empty())
        PostMessage(kMsgQuitRequested);
    return true;
}

bool Quillex::BroadcastMessage(const Message& message)
{
    std::lock_guard guard(windowLock_);
    for (QuillexWindow* window : windows_)
        window->PostMessage(message);
    return true;
}

bool Quillex::QuitRequested()
{
    std::lock_guard guard(windowLock_);
    if (windows_.empty())
        return true;
    BroadcastMessage(Message(kMsgQuitRequested));
    return false;
}

bool Quillex::IsListed(QuillexWindow* window)
{
    std::lock_guard guard(windowLock_);
    return std::find(windows_.begin(), windows_.end(), window) != windows_.end();
}

int32_t Quillex::CountWindows()
{
    std::lock_guard guard(windowLock_);
    return int32_t(windows_.size());
}

QuillexWindow* Quillex::WindowAt(int32_t index)
{
    std::lock_guard guard(windowLock_);
    if (index < 0 || size_t(index) >= windows_.size())
        return nullptr;
    return windows_[size_t(index)];
}

bool Quillex::SetCopyBuffer(std::vector<CopyBuffer::Samples> channels, int64_t frames)
{
    return copyBuffer_.SetCopyBuffer(std::move(channels), frames);
}

bool Quillex::GetCopyBuffer(std::vector<const int16_t*>& channels, int32_t& count, int64_t& frames) const
{
    return copyBuffer_.GetCopyBuffer(channels, count, frames);
}

void Quillex::MessageReceived(const Message& message)
{
    switch (message.what) {
    case kMsgNewWindow:
        NewWindow();
        break;
    case kMsgOpen: {
        QuillexWindow* window = nullptr;
        if (message.FindPointer(kFieldWindow, &window) == B_OK && IsListed(window))
            openRequestingWindow_ = window;
        ShowOpenPanel();
        break;
    }
    case kMsgCancel:
        openRequestingWindow_ = nullptr;
        break;
    case kMsgRefsReceived:
        RefsReceived(message);
        break;
    case kMsgDeleteWindow: {
        QuillexWindow* window = nullptr;
        if (message.FindPointer(kFieldWindow, &window) == B_OK)
            DeleteWindow(window);
        break;
    }
    case kMsgToggleBubbleHelp:
        ToggleBubbleHelp();
        break;
    case kMsgFeedback:
        SendFeedback();
        break;
    case kMsgAboutRequested:
        AboutRequested();
        break;
    case kMsgQuitRequested:
        if (QuitRequested() && quitHook_)
            quitHook_();
        break;
    default:
        Handler::MessageReceived(message);
        break;
    }
}

void Quillex::ShowOpenPanel()
{
    if (!openPanel_) {
        openPanel_ = std::make_unique<SndFilePanel>();
        connect(openPanel_.get(), &QFileDialog::filesSelected, this, &Quillex::OpenPanelChose);
        connect(openPanel_.get(), &QFileDialog::rejected, this, [this] { PostMessage(kMsgCancel); });
    } else {
        // Re-reads the folder, which may have changed since last time.
        openPanel_->setDirectory(openPanel_->directory());
    }
    openPanel_->show();
    openPanel_->raise();
}

void Quillex::OpenPanelChose(const QStringList& files)
{
    Message refs(kMsgRefsReceived);
    for (const QString& file : files)
        refs.AddPath(kFieldRefs, std::filesystem::path(file.toStdString()));
    PostMessage(refs);
}

bool Quillex::IsBubbleHelpEnabled() const
{
    return bubbleHelper_->IsEnabled();
}

void Quillex::ToggleBubbleHelp()
{
    const bool enable = !bubbleHelper_->IsEnabled();
    bubbleHelper_->EnableHelp(enable);
    Message mark(kMsgToggleBubbleHelp);
    mark.AddBool(kFieldEnable, enable);
    BroadcastMessage(mark);
}

void Quillex::AboutRequested()
{
    new AboutWindow();
}

void Quillex::SendFeedback()
{
    QDesktopServices::openUrl(QUrl(QStringLiteral("mailto:") + QString::fromLatin1(kFeedbackAddress)));
}

}  // namespace glimmet
