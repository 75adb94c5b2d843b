#include "sound/SampleBlock.h"

#include <atomic>
#include <cstring>
#include <new>

namespace glimmet {

namespace {

uint64_t NextId()
{
    static std::atomic<uint64_t> next{1};
    return next.fetch_add(1, std::memory_order_relaxed);
}

}  // namespace

SampleBlock::SampleBlock(std::unique_ptr<int16_t[]> samples, int64_t count)
    : samples_(std::move(samples)), count_(count), id_(NextId())
{
}

SampleBlock::~SampleBlock() = default;

std::shared_ptr<SampleBlock> SampleBlock::Allocate(int64_t count)
{
    if (count < 1 || count > kMaxSamples)
        return nullptr;
    std::unique_ptr<int16_t[]> samples(new (std::nothrow) int16_t[size_t(count)]);
    if (samples == nullptr)
        return nullptr;
    return std::shared_ptr<SampleBlock>(new (std::nothrow) SampleBlock(std::move(samples), count));
}

std::shared_ptr<SampleBlock> SampleBlock::Adopt(std::unique_ptr<int16_t[]> samples, int64_t count)
{
    if (samples == nullptr || count < 1 || count > kMaxSamples)
        return nullptr;
    return std::shared_ptr<SampleBlock>(new (std::nothrow) SampleBlock(std::move(samples), count));
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

}  // namespace glimmet
