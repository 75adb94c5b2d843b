#pragma once

#include <cstdint>
#include <ostream>
#include <vector>

namespace glimmet::test {

/// A channel's samples as the model keeps them: pieces that are either
/// literal samples or a count of zeros. Undoing some edits gives back
/// channels of billions of frames that are nearly all silence (what lies
/// past a channel's data reads as zeros); kept as counts they cost a few
/// bytes, as the engine's shared silence does. Neighbouring pieces of the
/// same kind are always merged, so the pieces alternate.
class SoakSamples {
public:
    struct Piece {
        /// Frames of the piece; for a literal piece, literal.size().
        int64_t count = 0;
        /// Empty for a run of zeros.
        std::vector<int16_t> literal;

        bool IsZeros() const { return literal.empty(); }
    };

    SoakSamples() = default;
    explicit SoakSamples(const std::vector<int16_t>& samples);
    static SoakSamples Zeros(int64_t count);

    int64_t Size() const { return size_; }
    bool Empty() const { return size_ == 0; }
    const std::vector<Piece>& Pieces() const { return pieces_; }

    /// The sample at index; 0 outside the samples.
    int16_t At(int64_t index) const;
    /// count samples from from on; what lies outside the samples is zeros.
    SoakSamples Slice(int64_t from, int64_t count) const;
    /// Slice written out as plain samples: only for counts that fit memory.
    std::vector<int16_t> Read(int64_t from, int64_t count) const;
    std::vector<int16_t> ToVector() const { return Read(0, size_); }

    void Append(const SoakSamples& more);
    void AppendZeros(int64_t count);
    /// Puts more before the sample at at (0..Size()).
    void Insert(int64_t at, const SoakSamples& more);
    /// Takes out the samples from from up to, not including, to.
    void Erase(int64_t from, int64_t to);
    /// Cuts the end off or pads it with zeros.
    void Resize(int64_t size);

    /// The index of the first of count samples from offset on that differs
    /// from data, or -1 when they all agree.
    int64_t FirstDifference(int64_t offset, const int16_t* data, int64_t count) const;

    bool AllZeros() const;
    bool operator==(const SoakSamples& other) const;

private:
    void AppendPiece(Piece piece);
    /// The piece holding index and the index its piece starts at.
    size_t PieceAt(int64_t index, int64_t* pieceStart) const;

    std::vector<Piece> pieces_;
    int64_t size_ = 0;
};

std::ostream& operator<<(std::ostream& out, const SoakSamples& samples);

}  // namespace glimmet::test
