#include "edit/PeakDistortPass.h"

#include <algorithm>

#include "edit/PieceTransformReader.h"
#include "edit/PieceTransformWriter.h"
#include "sound/BlockBuilder.h"

namespace glimmet {

namespace {

constexpr int64_t kPiece = BlockBuilder::kBlockSamples;

// The walk of the array algorithm over a stream. Scaling a run also scales
// the sample after it, which the next run may start with; that one sample's
// new value is kept aside (changed_) until it is written.
class Walk {
public:
    Walk(const SampleSlice& source, const effects::PeakGains& gains)
        : scan_(source), read_(source), gains_(gains), count_(source.Count())
    {
    }

    bool Ok() const { return scan_.Ok() && read_.Ok() && out_.Ok(); }

    void Run()
    {
        int64_t i = 0;
        while (i < count_ && out_.Ok())
            i = Step(i);
    }

    BlockList Finish() { return out_.Finish(); }

private:
    int16_t At(PieceTransformReader& reader, int64_t index)
    {
        return index == changedAt_ ? changed_ : reader.At(index);
    }

    // One turn of the loop from i; returns where the next one starts.
    int64_t Step(int64_t i)
    {
        if (i % kPiece == 0) {
            const int64_t n = std::min(kPiece, count_ - i);
            if (scan_.KnownSilence(i, n)) {
                out_.PutRepeated(0, n);  // zeros start no run
                return i + n;
            }
        }
        const int16_t first = At(scan_, i);
        if (first == 0) {
            out_.Put(0);
            return i + 1;
        }
        int64_t u = i;
        if (first >= 1)
            u = Run<true>(i);
        int64_t after = u;
        if (u < count_ && At(scan_, u) <= -1)
            after = Run<false>(u);
        // The sample after the negative run is written as it stands and
        // starts nothing.
        if (after < count_)
            out_.Put(At(read_, after));
        return after + 1;
    }

    // Writes the run of one sign from begin (scaled when it has two or more
    // samples) and returns the index just past it.
    template <bool kPositive>
    int64_t Run(int64_t begin)
    {
        int16_t peak = 0;
        int64_t end = begin;
        for (; end < count_; end++) {
            const int16_t s = At(scan_, end);
            if (kPositive ? s < 1 : s > -1)
                break;
            peak = kPositive ? std::max(peak, s) : std::min(peak, s);
        }
        if (end - begin < 2) {
            for (int64_t j = begin; j < end; j++)
                out_.Put(At(read_, j));
            return end;
        }
        const double gain = gains_.Of(peak);
        for (int64_t j = begin; j < end; j++)
            out_.Put(effects::ScaledSample(At(read_, j), gain));
        if (end < count_) {
            const int16_t next = effects::ScaledSample(At(read_, end), gain);
            changedAt_ = end;
            changed_ = next;
        }
        return end;
    }

    PieceTransformReader scan_;
    PieceTransformReader read_;
    PieceTransformWriter out_;
    const effects::PeakGains& gains_;
    int64_t count_;
    int64_t changedAt_ = -1;
    int16_t changed_ = 0;
};

}  // namespace

bool PeakDistortPass::Run(const SampleSlice& source, SampleSlice* result) const
{
    Walk walk(source, gains_);
    if (!walk.Ok())
        return false;
    walk.Run();
    if (!walk.Ok())
        return false;
    *result = SampleSlice();
    result->blocks = walk.Finish();
    return walk.Ok();
}

}  // namespace glimmet
