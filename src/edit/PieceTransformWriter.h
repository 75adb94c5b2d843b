#pragma once

#include <cstdint>
#include <memory>

#include "sound/BlockBuilder.h"
#include "sound/SampleBlock.h"

namespace glimmet {

/// Collects the output of a transform a sample at a time into blocks. A
/// block that comes out all one value is stored as one shared block of that
/// value (the shared silence block for 0), so that a long constant result, a
/// transform's answer to a long stretch of silence or of one repeated value,
/// costs references rather than samples.
class PieceTransformWriter {
public:
    PieceTransformWriter();

    /// False once memory ran out; the result is then incomplete.
    bool Ok() const { return ok_ && builder_.Ok(); }

    void Put(int16_t sample)
    {
        if (pendingCount_ == BlockBuilder::kBlockSamples)
            Flush();
        if (pending_ != nullptr)
            pending_->MutableSamples()[pendingCount_++] = sample;
    }

    /// count copies of sample, whole blocks of it shared.
    void PutRepeated(int16_t sample, int64_t count);

    /// Everything put so far; the writer starts over.
    BlockList Finish();

private:
    void Flush();
    /// A full block of value, made once per value in a row.
    const BlockRef& Repeated(int16_t value);

    BlockBuilder builder_;
    std::shared_ptr<SampleBlock> pending_;
    int64_t pendingCount_ = 0;
    BlockRef repeated_;
    bool ok_ = true;
};

}  // namespace glimmet
