#pragma once

#include <cstdint>
#include <memory>

#include "sound/SampleSlice.h"

namespace glimmet {

/// Reads the samples of a slice one at a time, a block-sized piece of it
/// copied out at a time, for the transforms whose next step depends on what
/// they have just read (a run of samples whose end is not known beforehand).
/// Reading forwards copies every piece once; a step back to an earlier piece
/// copies it again.
class PieceTransformReader {
public:
    /// source must outlive the reader.
    explicit PieceTransformReader(const SampleSlice& source);

    /// False when the piece buffer could not be had.
    bool Ok() const { return piece_ != nullptr; }
    int64_t Count() const { return count_; }

    /// Sample index of the slice (0 <= index < Count()).
    int16_t At(int64_t index)
    {
        if (index < first_ || index >= first_ + length_)
            Load(index);
        return piece_[size_t(index - first_)];
    }

    /// True when the count samples from index on are known silence: outside
    /// the slice's blocks or in the shared silence block; nothing is copied.
    bool KnownSilence(int64_t index, int64_t count) const;

private:
    void Load(int64_t index);

    const SampleSlice& source_;
    int64_t count_;
    std::unique_ptr<int16_t[]> piece_;
    int64_t first_ = 0;
    int64_t length_ = 0;
};

}  // namespace glimmet
