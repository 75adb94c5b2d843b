#pragma once

#include <atomic>
#include <filesystem>
#include <functional>
#include <memory>
#include <thread>

#include "files/DocumentLoader.h"
#include "files/LoadProgress.h"
#include "support/Status.h"

namespace glimmet {

class ChannelManager;
class LoadTarget;

/// Loads a sound file on a worker thread into a document of its own, so that
/// the window stays responsive while a long file decodes, and hands the
/// channels to the window's document in one step once they are complete.
///
/// The result is what DocumentLoader::Load(file, target) gives: the same
/// channels, the same file entry and title, the same 'shal' posts. Only the
/// moment differs: nothing reaches the target before Finish.
///
/// Made, finished and destroyed in the window's thread; the worker touches
/// only the private document and the progress. Destroying an unfinished load
/// cancels it and waits for the worker, which stops at the next packet.
class BackgroundLoad {
public:
    /// Runs in the worker before it opens the file; tests hold a load there.
    using WorkerHook = std::function<void(const std::filesystem::path&, const LoadProgress&)>;

    /// Runs in the worker once it has finished (IsDone() is then true), so
    /// that its owner can hand the result over without waiting for a poll.
    using DoneHook = std::function<void()>;

    /// Starts at once. append and hasDocument are the target's flag and
    /// whether it has a document, read now: a load into a window without a
    /// document skips the audio tracks, as the loader does. whenDone may be
    /// empty.
    BackgroundLoad(std::filesystem::path file, bool append, bool hasDocument, DoneHook whenDone = {});
    ~BackgroundLoad();
    BackgroundLoad(const BackgroundLoad&) = delete;
    BackgroundLoad& operator=(const BackgroundLoad&) = delete;

    const std::filesystem::path& File() const { return file_; }
    bool Appends() const { return append_; }
    /// True once the worker has finished decoding; any thread.
    bool IsDone() const { return done_.load(std::memory_order_acquire); }
    /// Asks the worker to stop; Finish then changes nothing.
    void Cancel() { progress_.Cancel(); }
    const LoadProgress& Progress() const { return progress_; }

    /// Waits for the worker and hands the result to target: under the
    /// document lock, its channels are replaced by (or, when appending,
    /// followed by) the loaded ones, then the file entry, the title and the
    /// 'shal' posts follow as after a direct load. Returns the loader's
    /// status; a cancelled load touches nothing and returns B_ERROR.
    status_t Finish(LoadTarget& target);

    /// The hook every later load runs in its worker (null for none).
    static void SetWorkerHook(WorkerHook hook);

private:
    void Run(WorkerHook hook);
    void Hand(ChannelManager* document);

    std::filesystem::path file_;
    bool append_;
    bool hasDocument_;
    DoneHook whenDone_;
    // Written by the worker only, read after it is joined.
    std::unique_ptr<ChannelManager> loaded_;
    LoadReport report_;
    status_t status_ = B_ERROR;
    LoadProgress progress_;
    std::atomic<bool> done_{false};
    bool finished_ = false;
    std::thread worker_;
};

}  // namespace glimmet
