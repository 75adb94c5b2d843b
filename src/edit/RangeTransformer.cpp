#include "edit/RangeTransformer.h"

#include <algorithm>
#include <cstring>
#include <new>

#include "sound/BlockBuilder.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

namespace {

// Channels hold at most 2^32 - 1 samples; no range can need more.
constexpr int64_t kLargestRange = int64_t(UINT32_MAX);

// Pieces are as long as the blocks they become, so every piece but the
// range's last is one whole block and no samples are copied twice.
constexpr int64_t kPiece = BlockBuilder::kBlockSamples;

void FillZeros(int16_t* destination, int64_t count)
{
    if (count > 0)
        std::memset(destination, 0, size_t(count) * sizeof(int16_t));
}

bool IsAllZeros(const int16_t* piece)
{
    const BlockRef& silence = BlockBuilder::Silence();
    return silence != nullptr && std::memcmp(piece, silence->Samples(), size_t(kPiece) * sizeof(int16_t)) == 0;
}

}  // namespace

RangeTransformer::RangeTransformer(ChannelManager* manager, int64_t start, int64_t end)
    : manager_(manager), start_(start), end_(end), count_(end - start + 1)
{
    // A range that ends before it starts has no frames: every channel
    // operation refuses it and nothing changes.
    if (count_ < 1 || !AnySelected())
        return;
    if (count_ > kLargestRange) {
        status_ = B_NO_MEMORY;
        return;
    }
    held_.leading = count_;
}

RangeTransformer::~RangeTransformer() = default;

bool RangeTransformer::AnySelected() const
{
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (channel->IsSelected())
            return true;
    }
    return false;
}

bool RangeTransformer::Ready() const
{
    return status_ == B_OK && count_ >= 1 && held_.Count() == count_;
}

void RangeTransformer::TransformSelected(const Transform& transform)
{
    if (!Ready())
        return;
    if (buffer_ == nullptr) {
        buffer_ = Channel::Allocate(count_);
        if (buffer_ == nullptr) {
            status_ = B_NO_MEMORY;
            return;
        }
        held_.CopyTo(buffer_.get());
    }
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        channel->FillBuffer(buffer_.get(), start_, count_);
        transform(buffer_.get(), count_);
        channel->ReplaceFrames(buffer_.get(), count_, start_, end_);
    }
}

bool RangeTransformer::ReadSource(Channel* channel, SampleSlice* source)
{
    const status_t read = channel->ReadSlice(start_, count_, source);
    if (read == B_NO_MEMORY) {
        status_ = B_NO_MEMORY;
        return false;
    }
    if (read != B_OK)
        *source = held_;
    return true;
}

void RangeTransformer::TransformSelected(const PieceTransform& transform)
{
    if (!Ready())
        return;
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        SampleSlice source;
        SampleSlice result;
        if (!ReadSource(channel, &source) || !TransformSlice(source, transform, &result)) {
            status_ = B_NO_MEMORY;
            return;
        }
        channel->ReplaceFrames(result, start_, end_);
        held_ = std::move(result);
    }
}

void RangeTransformer::TransformSelected(const SliceTransform& transform)
{
    // History is only kept for transforms that leave their input alone.
    const bool lookBehindAllowed = transform.lookBehind == 0 || transform.keepsSource;
    if (!Ready() || transform.lookBehind < 0 || transform.lookBehind > kLargestRange || !lookBehindAllowed)
        return;
    const int64_t length = count_ + transform.lookBehind;
    // What a failed copy finds: silence before any channel was read.
    SampleSlice held;
    held.leading = transform.keepsSource ? length : 0;
    if (!transform.keepsSource)
        held = held_;
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        SampleSlice source;
        const status_t read = channel->ReadSlice(start_ - transform.lookBehind, length, &source);
        if (read == B_NO_MEMORY) {
            status_ = B_NO_MEMORY;
            return;
        }
        if (read != B_OK)
            source = held;
        SampleSlice result;
        if (!transform.build(source, count_, &result) || result.Count() != count_) {
            status_ = B_NO_MEMORY;
            return;
        }
        channel->ReplaceFrames(result, start_, end_);
        held = transform.keepsSource ? std::move(source) : result;
        held_ = std::move(result);
    }
}

void RangeTransformer::InspectSelected(const Inspector& inspector, bool skipSilence)
{
    if (!Ready())
        return;
    std::unique_ptr<int16_t[]> piece(new (std::nothrow) int16_t[size_t(kPiece)]);
    if (piece == nullptr) {
        status_ = B_NO_MEMORY;
        return;
    }
    for (int32_t i = 0; Channel* channel = manager_->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        SampleSlice source;
        if (!ReadSource(channel, &source))
            return;
        for (int64_t first = 0; first < count_; first += kPiece) {
            const int64_t count = std::min(kPiece, count_ - first);
            if (skipSilence && PieceIsSilent(source, first, count))
                continue;
            CopyPiece(source, first, count, piece.get());
            inspector(piece.get(), count);
        }
        held_ = std::move(source);
    }
}

bool RangeTransformer::TransformSlice(const SampleSlice& source, const PieceTransform& transform, SampleSlice* result)
{
    BlockBuilder builder;
    BlockRef silenceResult;
    if (transform.silenceBecomes) {
        silenceResult = BlockBuilder::RepeatedBlock(*transform.silenceBecomes);
        if (silenceResult == nullptr)
            return false;
    }
    for (int64_t first = 0; first < count_ && builder.Ok(); first += kPiece) {
        const int64_t count = std::min(kPiece, count_ - first);
        const int64_t from = transform.mirrored ? count_ - first - count : first;
        if (silenceResult != nullptr && PieceIsSilent(source, from, count)) {
            builder.AppendRepeated(*transform.silenceBecomes, count, silenceResult);
            continue;
        }
        std::shared_ptr<SampleBlock> block = SampleBlock::Allocate(count);
        if (block == nullptr)
            return false;
        CopyPiece(source, from, count, block->MutableSamples());
        transform.apply(block->MutableSamples(), count, first, count_);
        if (count == kPiece && IsAllZeros(block->Samples()))
            builder.AppendZeros(count);  // shared, not kept twice
        else
            builder.AppendFresh(std::move(block));
    }
    if (!builder.Ok())
        return false;
    *result = SampleSlice();
    result->blocks = builder.Finish();
    return true;
}

bool RangeTransformer::PieceIsSilent(const SampleSlice& source, int64_t index, int64_t count)
{
    const int64_t from = std::max(index, source.leading) - source.leading;
    const int64_t to = std::min(index + count, source.leading + source.blocks.Count()) - source.leading;
    bool silent = true;
    if (from < to) {
        source.blocks.ForEachSpan(from, to - from, [&silent](const SampleSpan& span) {
            silent = silent && BlockBuilder::IsSilence(span.block);
        });
    }
    return silent;
}

void RangeTransformer::CopyPiece(const SampleSlice& source, int64_t index, int64_t count, int16_t* destination)
{
    const int64_t from = std::max(index, source.leading);
    const int64_t to = std::min(index + count, source.leading + source.blocks.Count());
    if (from >= to) {
        FillZeros(destination, count);
        return;
    }
    FillZeros(destination, from - index);
    source.blocks.CopyOut(from - source.leading, to - from, destination + (from - index));
    FillZeros(destination + (to - index), index + count - to);
}

}  // namespace glimmet
