#pragma once

#include <condition_variable>
#include <cstdint>
#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

#include "sound/BlockList.h"
#include "sound/SampleBlock.h"

namespace glimmet {

class SpillFile;

/// Keeps the memory of the blocks only the history holds under a budget by
/// moving those the history is least likely to need soon to a scratch file.
///
/// Trim runs on the thread that edits documents, with the history lock
/// held; it is handed every block reference the history keeps. A block
/// whose every reference is one of those is out of every channel, the copy
/// buffer and any reader's hands, and stays so while the history lock is
/// held: nothing else can get a new reference. Only such blocks are
/// dropped, and only there. Writing the copies happens on a worker thread
/// of its own; a block written but not yet dropped is dropped by the next
/// Trim if it still qualifies. The worker also hands back the file space
/// of blocks read back, which may wait on the disk.
class HistorySpill {
public:
    HistorySpill();
    ~HistorySpill();
    HistorySpill(const HistorySpill&) = delete;
    HistorySpill& operator=(const HistorySpill&) = delete;

    /// GLIMMET_HISTORY_BUDGET (bytes) when set to a number, else a quarter
    /// of the machine's memory.
    static int64_t DefaultBudget();

    void SetBudget(int64_t bytes) { budget_ = bytes < 0 ? 0 : bytes; }
    int64_t Budget() const { return budget_; }

    /// kept holds every block list the history keeps, the entries farthest
    /// from the document's state first (repeats included; a block counts as
    /// where it last appears). Drops what is already written and queues more
    /// for writing until the history's resident blocks fit the budget.
    void Trim(const std::vector<const BlockList*>& kept);

    /// Called on the worker thread whenever it has written everything it
    /// was given, so the owner can have Trim run again on its own thread.
    void SetWrittenCallback(std::function<void()> callback);
    /// Blocks until the worker has written everything queued (and handed
    /// back the file space of blocks read back).
    void WaitUntilWritten();
    /// Lets go of the scratch file; blocks still stored there keep it open
    /// until they are freed or read back. For when the history is emptied.
    void ReleaseFile();

    /// Hold the worker back from the scratch file while the history reads
    /// blocks back (an undo or a redo), so those reads have the file and the
    /// disk to themselves: the worker would otherwise write out or punch
    /// the very blocks the read-back just let go of. Neither call blocks;
    /// every Pause is followed by one Resume on the same thread.
    void Pause();
    void Resume();

    /// The scratch file's descriptor, or -1 when there is none (for tests).
    int FileDescriptor();
    /// Bytes of history blocks resident after the last Trim.
    int64_t ResidentHistoryBytes() const { return residentHistory_; }

private:
    void Queue(std::vector<BlockRef> blocks);
    void Work();
    /// Returns, lock_ held, once no Pause is in force (or on stopping).
    void WaitWhilePaused(std::unique_lock<std::mutex>& guard);

    int64_t budget_;
    int64_t residentHistory_ = 0;

    std::mutex lock_;  // guards everything below
    std::condition_variable wake_;
    std::condition_variable idle_;
    std::deque<BlockRef> queue_;
    bool busy_ = false;
    bool punchWanted_ = false;  // space released in the file to hand back
    bool stopping_ = false;
    int pauses_ = 0;
    std::shared_ptr<SpillFile> file_;
    std::thread worker_;

    std::mutex callbackLock_;  // guards written_ and every call of it
    std::function<void()> written_;
};

}  // namespace glimmet
