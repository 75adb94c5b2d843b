#include "files/DecodedBlocks.h"

#include <algorithm>
#include <vector>

#include "files/FrameSpreader.h"
#include "sound/BlockBuilder.h"
#include "sound/SampleBlock.h"

namespace glimmet {

namespace {

constexpr int64_t kBlockFrames = BlockBuilder::kBlockSamples;
// Blocks are taken for each channel in runs of up to a huge page (32 blocks
// of 64 KiB), all channels together at most this much ahead of the decode.
constexpr int64_t kRunBytes = int64_t(8) << 20;
constexpr int64_t kLongestRun = 32;

}  // namespace

DecodedBlocks::DecodedBlocks(int32_t channels)
    : blocks_(size_t(std::max(0, channels))), spares_(blocks_.size()), lists_(blocks_.size())
{
}

DecodedBlocks::~DecodedBlocks() = default;

// A channel's blocks come from the pool in runs, so that they lie side by
// side: when the channel goes, the huge pages it filled come free whole and
// go back to the system whole, to be had again as huge pages. Taken one
// block at a time for all channels in turn, every huge page would hold both
// channels and none would come free while either lives.
bool DecodedBlocks::StartBlocks()
{
    const int64_t run = std::clamp<int64_t>(
        kRunBytes / (int64_t(blocks_.size()) * kBlockFrames * int64_t(sizeof(int16_t))), 1, kLongestRun);
    for (size_t k = 0; k < blocks_.size(); ++k) {
        std::vector<std::shared_ptr<SampleBlock>>& spare = spares_[k];
        if (spare.empty()) {
            for (int64_t i = 0; i < run; ++i) {
                std::shared_ptr<SampleBlock> block = SampleBlock::Allocate(kBlockFrames);
                if (block == nullptr)
                    break;
                spare.push_back(std::move(block));
            }
            // Taken from the back: the first allocated is used first.
            std::reverse(spare.begin(), spare.end());
        }
        if (spare.empty())
            return false;
        blocks_[k] = std::move(spare.back());
        spare.pop_back();
    }
    return true;
}

bool DecodedBlocks::Append(const int16_t* interleaved, int64_t frames)
{
    if (blocks_.empty() || closed_)
        return frames <= 0;
    while (frames > 0) {
        if (filled_ == 0 && !StartBlocks())
            return false;
        const int64_t part = std::min(frames, kBlockFrames - filled_);
        SpreadInto(interleaved, part);
        filled_ += part;
        frames_ += part;
        interleaved += part * int64_t(blocks_.size());
        frames -= part;
        if (filled_ == kBlockFrames) {
            for (size_t k = 0; k < blocks_.size(); ++k)
                lists_[k].Append(std::move(blocks_[k]));
            filled_ = 0;
        }
    }
    return true;
}

void DecodedBlocks::SpreadInto(const int16_t* interleaved, int64_t frames)
{
    const size_t channels = blocks_.size();
    if (channels == 1) {
        FrameSpreader::SpreadMono(interleaved, frames, blocks_[0]->MutableSamples() + filled_);
        return;
    }
    if (channels == 2) {
        FrameSpreader::SpreadStereo(interleaved, frames, blocks_[0]->MutableSamples() + filled_,
                                    blocks_[1]->MutableSamples() + filled_);
        return;
    }
    for (size_t k = 0; k < channels; ++k) {
        int16_t* to = blocks_[k]->MutableSamples() + filled_;
        for (int64_t frame = 0; frame < frames; ++frame)
            to[frame] = interleaved[size_t(frame) * channels + k];
    }
}

void DecodedBlocks::CloseBlocks()
{
    if (closed_)
        return;
    closed_ = true;
    // The streaming stores must be visible before another thread reads the
    // blocks (the window takes them from the loading thread).
    FrameSpreader::Finish();
    for (size_t k = 0; k < blocks_.size(); ++k) {
        if (filled_ > 0 && blocks_[k] != nullptr) {
            BlockRef cut = SampleBlock::CopyOf(blocks_[k]->Samples(), filled_);
            // A channel missing its last samples would be a wrong channel:
            // without memory for them it has none at all.
            if (cut == nullptr)
                lists_[k].Clear();
            else
                lists_[k].Append(std::move(cut));
        }
        blocks_[k].reset();
        spares_[k].clear();
    }
    filled_ = 0;
}

BlockList DecodedBlocks::Take(int32_t channel)
{
    CloseBlocks();
    if (channel < 0 || size_t(channel) >= lists_.size())
        return {};
    return std::move(lists_[size_t(channel)]);
}

}  // namespace glimmet
