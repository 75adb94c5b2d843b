#include "edit/HistorySpill.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <unistd.h>
#include <unordered_map>
#include <unordered_set>

#include "sound/SpillFile.h"

namespace glimmet {

namespace {

/// How many references the history keeps to one block, and where the block
/// last turned up (how soon the history may need it back).
struct KeptBlock {
    const BlockRef* ref = nullptr;
    long references = 0;
    size_t order = 0;
};

}  // namespace

HistorySpill::HistorySpill() : budget_(DefaultBudget()) {}

HistorySpill::~HistorySpill()
{
    {
        std::lock_guard guard(lock_);
        stopping_ = true;
    }
    wake_.notify_all();
    if (worker_.joinable())
        worker_.join();
}

int64_t HistorySpill::DefaultBudget()
{
    if (const char* text = std::getenv("GLIMMET_HISTORY_BUDGET")) {
        char* end = nullptr;
        errno = 0;
        const long long bytes = std::strtoll(text, &end, 10);
        if (errno == 0 && end != text && *end == '\0' && bytes >= 0)
            return int64_t(bytes);
    }
    const long pages = ::sysconf(_SC_PHYS_PAGES);
    const long pageSize = ::sysconf(_SC_PAGE_SIZE);
    if (pages <= 0 || pageSize <= 0)
        return int64_t(1) << 30;
    return int64_t(pages) * pageSize / 4;
}

void HistorySpill::Trim(const std::vector<const BlockList*>& kept)
{
    // A run of references held by none but the history's lists is the
    // history's alone; blocks reach a channel or the copy buffer only
    // through runs of theirs, which their lists hold.
    std::unordered_map<const void*, long> runHolders;
    for (const BlockList* list : kept)
        list->ForEachRun([&runHolders](const void* run, long, const std::vector<BlockRef>&) { ++runHolders[run]; });
    std::unordered_map<const SampleBlock*, KeptBlock> counts;
    std::unordered_set<const void*> counted;
    size_t order = 0;
    for (const BlockList* list : kept) {
        list->ForEachRun([&](const void* run, long holders, const std::vector<BlockRef>& blocks) {
            // Each run holds one reference per place a block has in it,
            // however many lists share the run.
            const bool countHere = holders == runHolders[run] && counted.insert(run).second;
            for (const BlockRef& ref : blocks) {
                // A block kept by several entries is ranked by the nearest
                // of them, the one that will need it first.
                KeptBlock& entry = counts[ref.get()];
                entry.ref = &ref;
                entry.order = order++;
                entry.references += countHere ? 1 : 0;
            }
        });
    }
    // Blocks held by nothing but the history: a channel, the copy buffer, a
    // reader or the worker would each add a reference of their own.
    std::vector<const KeptBlock*> only;
    int64_t resident = 0;
    for (const auto& [block, entry] : counts) {
        if (entry.ref->use_count() == entry.references && block->IsResident()) {
            only.push_back(&entry);
            resident += block->Bytes();
        }
    }
    std::atomic_thread_fence(std::memory_order_acquire);
    std::sort(only.begin(), only.end(), [](const KeptBlock* a, const KeptBlock* b) { return a->order < b->order; });
    std::vector<BlockRef> toWrite;
    for (const KeptBlock* entry : only) {
        if (resident <= budget_)
            break;
        const SampleBlock& block = **entry->ref;
        if (!block.DropSamples())
            toWrite.push_back(*entry->ref);
        // Written blocks go at once; the others are on their way.
        resident -= block.Bytes();
    }
    residentHistory_ = 0;
    for (const KeptBlock* entry : only) {
        if ((*entry->ref)->IsResident())
            residentHistory_ += (*entry->ref)->Bytes();
    }
    Queue(std::move(toWrite));
}

void HistorySpill::Queue(std::vector<BlockRef> blocks)
{
    {
        std::lock_guard guard(lock_);
        if (blocks.empty()) {
            // Nothing to write, but blocks read back may have left space
            // to hand back: that is the worker's too, as it can be slow.
            if (file_ == nullptr || file_->UnpunchedBytes() == 0)
                return;
            punchWanted_ = true;
        }
        if (file_ == nullptr)
            file_ = SpillFile::Create();
        if (file_ == nullptr)
            return;
        for (BlockRef& block : blocks)
            queue_.push_back(std::move(block));
        if (!worker_.joinable())
            worker_ = std::thread([this] { Work(); });
    }
    wake_.notify_one();
}

void HistorySpill::Work()
{
    std::unique_lock guard(lock_);
    for (;;) {
        wake_.wait(guard, [this] { return stopping_ || !queue_.empty() || punchWanted_; });
        if (stopping_)
            return;
        busy_ = true;
        const bool wrote = !queue_.empty();
        while (!queue_.empty() && !stopping_) {
            WaitWhilePaused(guard);
            if (stopping_ || queue_.empty())
                break;
            BlockRef block = std::move(queue_.front());
            queue_.pop_front();
            std::shared_ptr<SpillFile> file = file_;
            guard.unlock();
            block->WriteCopy(file);
            // Let go of the block before the owner looks at it again, so
            // this thread's reference does not keep it out of the next Trim.
            block.reset();
            file.reset();
            guard.lock();
        }
        WaitWhilePaused(guard);
        punchWanted_ = false;
        if (std::shared_ptr<SpillFile> file = file_; file != nullptr && !stopping_) {
            // Space of blocks read back goes back to the disk here rather
            // than in the undo that read them: making a hole may first
            // write out what the space held.
            guard.unlock();
            file->PunchReleased();
            file.reset();
            guard.lock();
        }
        busy_ = false;
        idle_.notify_all();
        if (wrote && !stopping_) {
            guard.unlock();
            {
                // Held during the call, so that once SetWrittenCallback has
                // returned the old callback is never called again.
                std::lock_guard callbackGuard(callbackLock_);
                if (written_)
                    written_();
            }
            guard.lock();
        }
    }
}

void HistorySpill::WaitWhilePaused(std::unique_lock<std::mutex>& guard)
{
    wake_.wait(guard, [this] { return stopping_ || pauses_ == 0; });
}

void HistorySpill::Pause()
{
    std::lock_guard guard(lock_);
    ++pauses_;
}

void HistorySpill::Resume()
{
    {
        std::lock_guard guard(lock_);
        --pauses_;
    }
    wake_.notify_all();
}

void HistorySpill::SetWrittenCallback(std::function<void()> callback)
{
    std::lock_guard guard(callbackLock_);
    written_ = std::move(callback);
}

void HistorySpill::WaitUntilWritten()
{
    std::unique_lock guard(lock_);
    idle_.wait(guard, [this] { return stopping_ || (queue_.empty() && !busy_); });
}

void HistorySpill::ReleaseFile()
{
    std::deque<BlockRef> unwritten;
    {
        std::lock_guard guard(lock_);
        file_.reset();
        unwritten.swap(queue_);
    }
    residentHistory_ = 0;
}

int HistorySpill::FileDescriptor()
{
    std::lock_guard guard(lock_);
    return file_ != nullptr ? file_->Descriptor() : -1;
}

}  // namespace glimmet
