#include "SoakSamples.h"

#include <algorithm>

namespace glimmet::test {

SoakSamples::SoakSamples(const std::vector<int16_t>& samples)
{
    if (!samples.empty())
        AppendPiece(Piece{int64_t(samples.size()), samples});
}

SoakSamples SoakSamples::Zeros(int64_t count)
{
    SoakSamples zeros;
    zeros.AppendZeros(count);
    return zeros;
}

void SoakSamples::AppendPiece(Piece piece)
{
    if (piece.count <= 0)
        return;
    size_ += piece.count;
    if (!pieces_.empty() && pieces_.back().IsZeros() == piece.IsZeros()) {
        Piece& last = pieces_.back();
        last.count += piece.count;
        last.literal.insert(last.literal.end(), piece.literal.begin(), piece.literal.end());
        return;
    }
    pieces_.push_back(std::move(piece));
}

void SoakSamples::AppendZeros(int64_t count)
{
    AppendPiece(Piece{count, {}});
}

void SoakSamples::Append(const SoakSamples& more)
{
    for (const Piece& piece : more.pieces_)
        AppendPiece(piece);
}

size_t SoakSamples::PieceAt(int64_t index, int64_t* pieceStart) const
{
    int64_t start = 0;
    for (size_t i = 0; i < pieces_.size(); i++) {
        if (index < start + pieces_[i].count) {
            *pieceStart = start;
            return i;
        }
        start += pieces_[i].count;
    }
    *pieceStart = start;
    return pieces_.size();
}

int16_t SoakSamples::At(int64_t index) const
{
    if (index < 0 || index >= size_)
        return 0;
    int64_t start = 0;
    const Piece& piece = pieces_[PieceAt(index, &start)];
    return piece.IsZeros() ? int16_t(0) : piece.literal[size_t(index - start)];
}

SoakSamples SoakSamples::Slice(int64_t from, int64_t count) const
{
    SoakSamples slice;
    if (count <= 0)
        return slice;
    const int64_t end = from + count;
    // Before the samples and past them, zeros.
    slice.AppendZeros(std::min(end, int64_t(0)) - from);
    const int64_t inFrom = std::max<int64_t>(from, 0);
    const int64_t inEnd = std::min(end, size_);
    int64_t start = 0;
    for (size_t i = inFrom < inEnd ? PieceAt(inFrom, &start) : pieces_.size(); i < pieces_.size(); i++) {
        const Piece& piece = pieces_[i];
        const int64_t a = std::max(inFrom, start) - start;
        const int64_t b = std::min(inEnd, start + piece.count) - start;
        if (b <= a)
            break;
        if (piece.IsZeros())
            slice.AppendZeros(b - a);
        else
            slice.AppendPiece(Piece{b - a, std::vector<int16_t>(piece.literal.begin() + a, piece.literal.begin() + b)});
        start += piece.count;
    }
    slice.AppendZeros(end - std::max(std::max<int64_t>(from, 0), size_));
    return slice;
}

std::vector<int16_t> SoakSamples::Read(int64_t from, int64_t count) const
{
    std::vector<int16_t> samples;
    samples.reserve(size_t(std::max<int64_t>(count, 0)));
    for (const Piece& piece : Slice(from, count).pieces_) {
        if (piece.IsZeros())
            samples.resize(samples.size() + size_t(piece.count), 0);
        else
            samples.insert(samples.end(), piece.literal.begin(), piece.literal.end());
    }
    return samples;
}

void SoakSamples::Insert(int64_t at, const SoakSamples& more)
{
    SoakSamples joined = Slice(0, at);
    joined.Append(more);
    joined.Append(Slice(at, size_ - at));
    *this = std::move(joined);
}

void SoakSamples::Erase(int64_t from, int64_t to)
{
    SoakSamples kept = Slice(0, from);
    kept.Append(Slice(to, size_ - to));
    *this = std::move(kept);
}

void SoakSamples::Resize(int64_t size)
{
    if (size < size_)
        *this = Slice(0, size);
    else
        AppendZeros(size - size_);
}

int64_t SoakSamples::FirstDifference(int64_t offset, const int16_t* data, int64_t count) const
{
    int64_t k = 0;
    for (const Piece& piece : Slice(offset, count).pieces_) {
        for (int64_t i = 0; i < piece.count; i++, k++) {
            if (data[k] != (piece.IsZeros() ? int16_t(0) : piece.literal[size_t(i)]))
                return k;
        }
    }
    return -1;
}

bool SoakSamples::AllZeros() const
{
    for (const Piece& piece : pieces_) {
        if (std::any_of(piece.literal.begin(), piece.literal.end(), [](int16_t v) { return v != 0; }))
            return false;
    }
    return true;
}

bool SoakSamples::operator==(const SoakSamples& other) const
{
    // Merged pieces make the pieces of equal samples equal, except for
    // literal zeros, which are compared by value.
    if (size_ != other.size_)
        return false;
    if (pieces_.size() == other.pieces_.size()) {
        bool same = true;
        for (size_t i = 0; i < pieces_.size() && same; i++)
            same = pieces_[i].count == other.pieces_[i].count && pieces_[i].literal == other.pieces_[i].literal;
        if (same)
            return true;
    }
    int64_t offset = 0;
    for (const Piece& piece : other.pieces_) {
        if (piece.IsZeros()) {
            if (!Slice(offset, piece.count).AllZeros())
                return false;
        } else if (FirstDifference(offset, piece.literal.data(), piece.count) >= 0) {
            return false;
        }
        offset += piece.count;
    }
    return true;
}

std::ostream& operator<<(std::ostream& out, const SoakSamples& samples)
{
    out << samples.Size() << " samples:";
    size_t shown = 0;
    for (const SoakSamples::Piece& piece : samples.Pieces()) {
        if (shown >= 12)
            return out << " ...";
        if (piece.IsZeros()) {
            out << " [" << piece.count << " zeros]";
            shown++;
            continue;
        }
        for (size_t i = 0; i < piece.literal.size() && shown < 12; i++, shown++)
            out << ' ' << piece.literal[i];
    }
    return out;
}

}  // namespace glimmet::test
