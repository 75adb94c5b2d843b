#include "edit/PieceTransformReader.h"

#include <algorithm>
#include <new>

#include "edit/RangeTransformer.h"
#include "sound/BlockBuilder.h"

namespace glimmet {

PieceTransformReader::PieceTransformReader(const SampleSlice& source)
    : source_(source), count_(source.Count()),
      piece_(new (std::nothrow) int16_t[size_t(BlockBuilder::kBlockSamples)])
{
}

void PieceTransformReader::Load(int64_t index)
{
    // Pieces start at multiples of the block length, so a forward walk meets
    // each piece once.
    first_ = index - index % BlockBuilder::kBlockSamples;
    length_ = std::min(BlockBuilder::kBlockSamples, count_ - first_);
    RangeTransformer::CopyPiece(source_, first_, length_, piece_.get());
}

bool PieceTransformReader::KnownSilence(int64_t index, int64_t count) const
{
    return RangeTransformer::PieceIsSilent(source_, index, count);
}

}  // namespace glimmet
