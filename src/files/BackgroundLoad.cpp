#include "files/BackgroundLoad.h"

#include <mutex>

#include "files/LoadTarget.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "support/MessageCodes.h"

namespace glimmet {

namespace {

constexpr const char* kTitlePrefix = "Glimmet - ";

std::mutex gHookLock;
BackgroundLoad::WorkerHook gHook;

BackgroundLoad::WorkerHook CurrentHook()
{
    std::lock_guard guard(gHookLock);
    return gHook;
}

}  // namespace

BackgroundLoad::BackgroundLoad(std::filesystem::path file, bool append, bool hasDocument, DoneHook whenDone)
    : file_(std::move(file)), append_(append), hasDocument_(hasDocument), whenDone_(std::move(whenDone)),
      loaded_(std::make_unique<ChannelManager>(nullptr))
{
    worker_ = std::thread([this, hook = CurrentHook()] { Run(hook); });
}

BackgroundLoad::~BackgroundLoad()
{
    progress_.Cancel();
    if (worker_.joinable())
        worker_.join();
}

void BackgroundLoad::SetWorkerHook(WorkerHook hook)
{
    std::lock_guard guard(gHookLock);
    gHook = std::move(hook);
}

void BackgroundLoad::Run(WorkerHook hook)
{
    LoadProgress::Scope scope(progress_);
    if (hook)
        hook(file_, progress_);
    if (!progress_.IsCancelled()) {
        // The private document stands in for the window's: the loader empties
        // it per audio track unless appending, exactly as it would the real
        // one, and the report says whether the real one is to be emptied.
        status_ = DocumentLoader::Load(file_, hasDocument_ ? loaded_.get() : nullptr, append_, &report_);
    }
    done_.store(true, std::memory_order_release);
    if (whenDone_)
        whenDone_();
}

status_t BackgroundLoad::Finish(LoadTarget& target)
{
    if (worker_.joinable())
        worker_.join();
    if (finished_ || progress_.IsCancelled())
        return B_ERROR;
    finished_ = true;
    // A file that could not be opened, or whose samples would not fit,
    // leaves the window as it was.
    if (!report_.opened || report_.refused)
        return status_;
    Hand(target.DocumentManager());
    if (report_.replacedDocument)
        target.DocumentReplaced();
    target.ReplaceFileEntry(report_.entry);
    const std::string name = report_.entry.filename().string();
    if (!append_ && !name.empty())
        target.SetWindowTitle(kTitlePrefix + name);
    for (int32_t track = 0; track < report_.decodedTracks; ++track)
        target.PostToSelf(kMsgShowAll);
    return status_;
}

void BackgroundLoad::Hand(ChannelManager* document)
{
    if (document == nullptr)
        return;
    // One step under the document lock: the mixer and every other reader
    // see the old channels or the new ones, never a mixture.
    std::lock_guard guard(document->DocumentLock());
    if (report_.replacedDocument) {
        while (document->RemoveChannelAt(0))
            continue;
    }
    while (loaded_->CountChannels() > 0)
        document->AddChannel(loaded_->RemoveChannel(loaded_->ChannelAt(0)));
}

}  // namespace glimmet
