#include "edit/PieceTransformWriter.h"

#include <algorithm>

namespace glimmet {

PieceTransformWriter::PieceTransformWriter() : pending_(SampleBlock::Allocate(BlockBuilder::kBlockSamples))
{
    ok_ = pending_ != nullptr;
}

const BlockRef& PieceTransformWriter::Repeated(int16_t value)
{
    if (repeated_ == nullptr || repeated_->Samples()[0] != value) {
        repeated_ = BlockBuilder::RepeatedBlock(value);
        ok_ = ok_ && repeated_ != nullptr;
    }
    return repeated_;
}

void PieceTransformWriter::Flush()
{
    if (pending_ == nullptr || pendingCount_ == 0)
        return;
    const int16_t* samples = pending_->Samples();
    const bool constant = std::all_of(samples, samples + pendingCount_, [&](int16_t s) { return s == samples[0]; });
    if (constant && pendingCount_ == BlockBuilder::kBlockSamples) {
        const int16_t value = samples[0];
        builder_.AppendRepeated(value, pendingCount_, Repeated(value));
    } else {
        builder_.AppendSamples(samples, pendingCount_);
    }
    pendingCount_ = 0;
}

void PieceTransformWriter::PutRepeated(int16_t sample, int64_t count)
{
    // Up to the next block boundary sample by sample, then whole blocks
    // shared, then the rest.
    while (count > 0 && pendingCount_ != 0 && pendingCount_ != BlockBuilder::kBlockSamples) {
        Put(sample);
        count--;
    }
    if (pendingCount_ == BlockBuilder::kBlockSamples)
        Flush();
    const int64_t whole = count - count % BlockBuilder::kBlockSamples;
    if (whole > 0) {
        builder_.AppendRepeated(sample, whole, Repeated(sample));
        count -= whole;
    }
    while (count-- > 0)
        Put(sample);
}

BlockList PieceTransformWriter::Finish()
{
    Flush();
    return builder_.Finish();
}

}  // namespace glimmet
