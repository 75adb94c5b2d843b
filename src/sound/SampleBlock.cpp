#include "sound/SampleBlock.h"

#include <atomic>
#include <cstring>
#include <new>

#include "sound/BlockPool.h"
#include "sound/PoolWarmer.h"
#include "sound/SpillFile.h"

namespace glimmet {

namespace {

uint64_t NextId()
{
    static std::atomic<uint64_t> next{1};
    return next.fetch_add(1, std::memory_order_relaxed);
}

std::atomic<int64_t>& ResidentCounter()
{
    static std::atomic<int64_t> bytes{0};
    return bytes;
}

}  // namespace

SampleBlock::SampleBlock(int16_t* samples, bool pooled, int64_t count)
    : samples_(samples), pooled_(pooled), count_(count), id_(NextId())
{
    ResidentCounter().fetch_add(Bytes(), std::memory_order_relaxed);
}

SampleBlock::~SampleBlock()
{
    int16_t* samples = samples_.load(std::memory_order_relaxed);
    if (samples != nullptr) {
        ResidentCounter().fetch_sub(Bytes(), std::memory_order_relaxed);
        FreeSamples(samples, pooled_);
    }
    if (file_ != nullptr)
        file_->Release(fileOffset_, Bytes());
}

int64_t SampleBlock::ResidentBytes()
{
    return ResidentCounter().load(std::memory_order_relaxed);
}

int16_t* SampleBlock::NewSamples(int64_t count, bool* pooled)
{
    // Only full-size blocks are pooled: they are nearly all of a long
    // document's memory. Odd sizes (ends of edits and files) are few, and
    // rounding them up to a whole block could double what a short one costs.
    *pooled = size_t(count) * sizeof(int16_t) == BlockPool::kBlockBytes;
    if (*pooled)
        return static_cast<int16_t*>(BlockPool::Shared().Allocate());
    return new (std::nothrow) int16_t[size_t(count)];
}

void SampleBlock::FreeSamples(int16_t* samples, bool pooled)
{
    if (pooled)
        BlockPool::Shared().Free(samples);
    else
        delete[] samples;
}

std::shared_ptr<SampleBlock> SampleBlock::Allocate(int64_t count)
{
    if (count < 1 || count > kMaxSamples)
        return nullptr;
    bool pooled = false;
    int16_t* samples = NewSamples(count, &pooled);
    if (samples == nullptr)
        return nullptr;
    auto* block = new (std::nothrow) SampleBlock(samples, pooled, count);
    if (block == nullptr) {
        FreeSamples(samples, pooled);
        return nullptr;
    }
    return std::shared_ptr<SampleBlock>(block);
}

std::shared_ptr<SampleBlock> SampleBlock::Adopt(std::unique_ptr<int16_t[]> samples, int64_t count)
{
    if (samples == nullptr || count < 1 || count > kMaxSamples)
        return nullptr;
    auto* block = new (std::nothrow) SampleBlock(samples.get(), false, count);
    if (block == nullptr)
        return nullptr;
    samples.release();
    return std::shared_ptr<SampleBlock>(block);
}

std::shared_ptr<const SampleBlock> SampleBlock::CopyOf(const int16_t* samples, int64_t count)
{
    if (samples == nullptr)
        return nullptr;
    std::shared_ptr<SampleBlock> block = Allocate(count);
    if (block != nullptr)
        std::memcpy(block->MutableSamples(), samples, size_t(count) * sizeof(int16_t));
    return block;
}

std::shared_ptr<const BlockSummary> SampleBlock::Summary() const
{
    std::lock_guard guard(summaryLock_);
    return summary_;
}

void SampleBlock::SetSummary(std::shared_ptr<const BlockSummary> summary) const
{
    std::lock_guard guard(summaryLock_);
    summary_ = std::move(summary);
}

bool SampleBlock::HasFileCopy() const
{
    std::lock_guard guard(residencyLock_);
    return file_ != nullptr;
}

bool SampleBlock::MakeResident() const
{
    return IsResident() || SlowMakeResident();
}

/// A dropped block on its way back: where its copy lies, and the memory it
/// is read into.
struct SampleBlock::ReadBack {
    const SampleBlock* block = nullptr;
    std::shared_ptr<SpillFile> file;
    int64_t offset = -1;
    uint64_t drops = 0;
    int16_t* samples = nullptr;
    bool pooled = false;
};

bool SampleBlock::MakeResident(const std::vector<const SampleBlock*>& blocks)
{
    // Batches bound the memory read ahead of being handed to its block.
    constexpr size_t kBatch = 1024;
    // Faulting in the memory to read into costs about as much as the reading
    // itself; for a long read-back another core does it a batch ahead.
    constexpr size_t kWarmedFrom = 64;
    size_t pooled = 0;
    for (const SampleBlock* block : blocks)
        pooled += block != nullptr && !block->IsResident() && block->Bytes() == int64_t(BlockPool::kBlockBytes);
    PoolWarmer warmer(BlockPool::Shared(), pooled >= kWarmedFrom ? pooled : 0, kBatch);
    bool ok = true;
    std::vector<ReadBack> batch;
    for (const SampleBlock* block : blocks) {
        if (block == nullptr || block->IsResident())
            continue;
        ReadBack entry;
        {
            std::lock_guard guard(block->residencyLock_);
            if (block->samples_.load(std::memory_order_relaxed) != nullptr)
                continue;
            if (block->file_ == nullptr) {
                ok = false;
                continue;
            }
            entry.file = block->file_;
            entry.offset = block->fileOffset_;
            entry.drops = block->drops_;
        }
        entry.block = block;
        batch.push_back(std::move(entry));
        if (batch.size() == kBatch) {
            ok = ReadBatch(batch) && ok;
            batch.clear();
        }
    }
    if (!batch.empty())
        ok = ReadBatch(batch) && ok;
    return ok;
}

bool SampleBlock::ReadBatch(std::vector<ReadBack>& batch)
{
    // The same file for the whole batch nearly always; blocks of a file the
    // history let go of meanwhile are read one by one.
    const std::shared_ptr<SpillFile> file = batch.front().file;
    std::vector<SpillFile::Piece> pieces;
    pieces.reserve(batch.size());
    bool ok = true;
    for (ReadBack& entry : batch) {
        entry.samples = NewSamples(entry.block->count_, &entry.pooled);
        if (entry.samples == nullptr) {
            ok = false;
            continue;
        }
        if (entry.file != file) {
            if (!entry.file->Read(entry.offset, entry.samples, entry.block->Bytes())) {
                FreeSamples(entry.samples, entry.pooled);
                entry.samples = nullptr;
                ok = false;
            }
            continue;
        }
        pieces.push_back(SpillFile::Piece{entry.offset, entry.samples, entry.block->Bytes()});
    }
    if (!file->ReadMany(pieces)) {
        // Which piece failed is not known: those blocks go the slow way.
        for (ReadBack& entry : batch) {
            if (entry.samples != nullptr && entry.file == file) {
                FreeSamples(entry.samples, entry.pooled);
                entry.samples = nullptr;
            }
        }
        ok = false;
    }
    for (ReadBack& entry : batch) {
        const SampleBlock& block = *entry.block;
        bool installed = false;
        if (entry.samples != nullptr) {
            std::lock_guard guard(block.residencyLock_);
            installed = block.InstallLocked(entry.samples, entry.pooled, entry.drops);
        }
        if (!installed && entry.samples != nullptr)
            FreeSamples(entry.samples, entry.pooled);
        if (!block.IsResident() && !block.SlowMakeResident())
            ok = false;
    }
    return ok;
}

bool SampleBlock::InstallLocked(int16_t* samples, bool pooled, uint64_t drops) const
{
    if (samples_.load(std::memory_order_relaxed) != nullptr || file_ == nullptr || drops_ != drops)
        return false;
    ResidentCounter().fetch_add(Bytes(), std::memory_order_relaxed);
    pooled_ = pooled;
    samples_.store(samples, std::memory_order_release);
    // A block read back is usually headed for a channel, where it may live
    // long after the history is gone: its copy must not keep the file open.
    file_->Release(fileOffset_, Bytes());
    file_.reset();
    fileOffset_ = -1;
    return true;
}

bool SampleBlock::SlowMakeResident() const
{
    std::lock_guard guard(residencyLock_);
    if (samples_.load(std::memory_order_relaxed) != nullptr)
        return true;
    if (file_ == nullptr)
        return false;
    bool pooled = false;
    int16_t* samples = NewSamples(count_, &pooled);
    if (samples == nullptr)
        return false;
    if (!file_->Read(fileOffset_, samples, Bytes()) || !InstallLocked(samples, pooled, drops_)) {
        FreeSamples(samples, pooled);
        return false;
    }
    return true;
}

const int16_t* SampleBlock::LoadSamples() const
{
    // Readers that forgot MakeResident still see the right samples; a block
    // that cannot be read back reads as silence rather than as a null.
    static const int16_t kSilence[kMaxSamples] = {};
    if (!MakeResident())
        return kSilence;
    return samples_.load(std::memory_order_acquire);
}

bool SampleBlock::WriteCopy(const std::shared_ptr<SpillFile>& file) const
{
    {
        std::lock_guard guard(residencyLock_);
        if (file_ != nullptr)
            return true;
    }
    // Only DropSamples frees the samples, and it needs the copy made here,
    // so they stay put while they are written without the lock.
    const int16_t* samples = samples_.load(std::memory_order_acquire);
    if (samples == nullptr || file == nullptr)
        return false;
    const int64_t offset = file->Write(samples, Bytes());
    if (offset < 0)
        return false;
    std::lock_guard guard(residencyLock_);
    if (file_ != nullptr) {
        file->Release(offset, Bytes());
        return true;
    }
    file_ = file;
    fileOffset_ = offset;
    return true;
}

bool SampleBlock::DropSamples() const
{
    std::lock_guard guard(residencyLock_);
    int16_t* samples = samples_.load(std::memory_order_relaxed);
    if (file_ == nullptr || samples == nullptr)
        return false;
    samples_.store(nullptr, std::memory_order_release);
    drops_++;
    ResidentCounter().fetch_sub(Bytes(), std::memory_order_relaxed);
    FreeSamples(samples, pooled_);
    return true;
}

}  // namespace glimmet
