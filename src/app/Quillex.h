#pragma once

#include <QPointer>
#include <QStringList>

#include <cstdint>
#include <filesystem>
#include <functional>
#include <memory>
#include <vector>

#include "app/QuillexWindow.h"
#include "edit/CopyBuffer.h"
#include "support/Handler.h"
#include "support/Locker.h"

namespace glimmet {

class BubbleHelper;
class SndFilePanel;

/// The application object: the list of open document windows, the open
/// panel, and the commands that concern the whole program. There is one per
/// process; Instance() finds it from anywhere in the GUI thread.
///
/// Everything here runs in the GUI thread. The window list has its own lock,
/// always taken before any window's lock.
class Quillex : public Handler {
    Q_OBJECT

public:
    /// Where the "Send Feedback" mail goes.
    static constexpr const char* kFeedbackAddress = "glimmet-feedback@lists.glimmet.org";

    Quillex();
    ~Quillex() override;
    Quillex(const Quillex&) = delete;
    Quillex& operator=(const Quillex&) = delete;

    /// The application object of this process, or null when there is none.
    static Quillex* Instance();

    /// Opens the command line's files, makes the empty window when none was
    /// opened, then runs the event loop until the application quits.
    int Run(const QStringList& arguments);

    /// Every argument after the program name is a file to open in a window
    /// of its own; a path that names nothing is skipped without a word.
    void ArgvReceived(const QStringList& arguments);
    /// Opens the files of the message's "refs" paths. The first goes into
    /// the window that asked for the open panel, if it is still there.
    void RefsReceived(const Message& message);
    /// Makes one empty window when no window exists.
    void ReadyToRun();

    /// Makes and shows a new document window; null if the list lock cannot
    /// be had.
    QuillexWindow* NewWindow();
    /// Takes the window out of the list and ends it; quits the application
    /// once the list is empty. False when the window is not in the list.
    bool DeleteWindow(QuillexWindow* window);
    /// Posts a copy of the message to every window, in list order.
    bool BroadcastMessage(const Message& message);
    /// True only when no window is left; otherwise every window is asked to
    /// close (each may ask about saving) and the answer is false.
    bool QuitRequested();

    void MessageReceived(const Message& message) override;

    /// Takes over the channel arrays as the new copy buffer; refused (the
    /// old buffer stays) for no channels or fewer than one frame.
    bool SetCopyBuffer(std::vector<CopyBuffer::Samples> channels, int64_t frames);
    /// The copied arrays, shared: valid until the next accepted copy.
    /// False, leaving the outputs alone, before anything was copied.
    bool GetCopyBuffer(std::vector<const int16_t*>& channels, int32_t& count, int64_t& frames) const;

    int32_t CountWindows();
    /// Null when index is out of range.
    QuillexWindow* WindowAt(int32_t index);
    /// The window whose "Open…" is waiting for the open panel, or null.
    QuillexWindow* OpenRequestingWindow() const { return openRequestingWindow_; }
    /// The open panel, made on first use; null before.
    SndFilePanel* OpenPanel() const { return openPanel_.get(); }
    bool IsBubbleHelpEnabled() const;
    /// The one bubble helper, handed to every window for its help texts.
    BubbleHelper* Helper() const { return bubbleHelper_.get(); }

    /// Opens a new About box, which ends itself.
    void AboutRequested();

    /// What ends the event loop once QuitRequested agrees; tests replace it
    /// so that their own event loops keep running.
    void SetQuitHook(std::function<void()> hook) { quitHook_ = std::move(hook); }

    /// The absolute form of path if it names an existing file system entry.
    static bool ResolvePath(const std::filesystem::path& path, std::filesystem::path* resolved);

private:
    /// Whether the pointer names a window of the list (it may come from a
    /// message that outlived its window).
    bool IsListed(QuillexWindow* window);
    void LoadInto(QuillexWindow* window, const std::filesystem::path& path);
    void ShowOpenPanel();
    void OpenPanelChose(const QStringList& files);
    void ToggleBubbleHelp();
    void SendFeedback();

    std::vector<QuillexWindow*> windows_;  // guarded by windowLock_
    Locker windowLock_;
    QPointer<QuillexWindow> openRequestingWindow_;
    std::unique_ptr<SndFilePanel> openPanel_;
    CopyBuffer copyBuffer_;
    std::unique_ptr<BubbleHelper> bubbleHelper_;
    std::function<void()> quitHook_;
};

}  // namespace glimmet
