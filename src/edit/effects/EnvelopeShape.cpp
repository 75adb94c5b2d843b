#include "edit/effects/EnvelopeShape.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <stdexcept>

#include "edit/effects/VectorClones.h"

namespace glimmet::effects {

namespace {

// Frames per block: the positions, the gains and the samples of a block stay
// in the first-level cache.
constexpr size_t kBlockFrames = 2048;

// positions[j] = double(first + j) / count. The index is formed as
// double(first) + j, exact for every index below 2^53, so it is the same
// double as double(first + j); written this way the loop vectorises.
GLIMMET_EFFECT_CLONES
void Positions(size_t first, double count, double* positions, size_t n)
{
    const double base = double(first);
    for (size_t j = 0; j < n; ++j) {
        positions[j] = (base + double(int32_t(j))) / count;
    }
}

// The gains of the frames at positions, all in piece k of the sweep.
GLIMMET_EFFECT_CLONES
void PieceGains(const SplineSweep& sweep, size_t k, const double* positions, double* gains, size_t n)
{
    const double x = sweep.KnotX(k);
    const double y = sweep.KnotY(k);
    const double b = sweep.Linear(k);
    const double c = sweep.Quadratic(k);
    const double d = sweep.Cubic(k);
    for (size_t j = 0; j < n; ++j) {
        // SplineSweep::Value, written out so that the loop vectorises.
        const double u = positions[j] - x;
        const double value = y + u * (b + u * (c + u * d));
        gains[j] = (1.0 - value) * 4.0;
    }
}

}  // namespace

EnvelopeGains::EnvelopeGains(const SplineCurve& curve, size_t n)
    : sweep_(curve.Knots()), count_(double(n)), positions_(kBlockFrames)
{
}

void EnvelopeGains::Compute(size_t first, std::span<double> gains)
{
    for (size_t done = 0; done < gains.size(); done += kBlockFrames) {
        const size_t n = std::min(kBlockFrames, gains.size() - done);
        double* positions = positions_.data();
        Positions(first + done, count_, positions, n);
        double* out = gains.data() + done;
        if (sweep_.Empty()) {
            // A curve without knots is 0 everywhere.
            std::fill(out, out + n, (1.0 - 0.0) * 4.0);
            continue;
        }
        size_t j = 0;
        while (j < n) {
            const size_t k = sweep_.PieceAt(positions[j]);
            size_t end = n;
            if (k < sweep_.LastPiece()) {
                // The frames up to the first one the search would move past:
                // the positions increase, so the test flips once.
                const double stop = sweep_.SearchStop(k);
                end = size_t(std::partition_point(positions + j, positions + n,
                                                  [stop](double t) { return !(stop < t); })
                             - positions);
            }
            PieceGains(sweep_, k, positions + j, out + j, end - j);
            j = end;
        }
    }
}

bool EnvelopeGains::AlwaysFinite() const
{
    if (sweep_.Empty())
        return true;
    // A position t in [0, 1) lies within |x| + 1 of any knot x, so a piece's
    // cubic there is at most this in magnitude; far below the largest double
    // the rounding of its evaluation cannot carry it to infinity.
    constexpr double kSafe = 1e300;
    for (size_t k = 0; k <= sweep_.LastPiece(); k++) {
        const double u = std::fabs(sweep_.KnotX(k)) + 1.0;
        const double bound = std::fabs(sweep_.KnotY(k))
            + u * (std::fabs(sweep_.Linear(k)) + u * (std::fabs(sweep_.Quadratic(k)) + u * std::fabs(sweep_.Cubic(k))));
        if (!(bound < kSafe))
            return false;
    }
    return true;
}

GLIMMET_EFFECT_CLONES
void ApplyGains(std::span<const double> gains, std::span<int16_t> samples)
{
    const double* gain = gains.data();
    int16_t* sample = samples.data();
    for (size_t i = 0; i < samples.size(); ++i) {
        // StoreOneSided: trunc(p) lies in [-32768, 32767] exactly when
        // -32769 < p < 32768, and then it is int32_t(p); anything else,
        // not-a-number included, is stored as 32767. Choosing the value before
        // converting it keeps the conversion defined, so the loop vectorises.
        const double product = gain[i] * double(sample[i]);
        const double stored = product > -32769.0 && product < 32768.0 ? product : 32767.0;
        sample[i] = int16_t(int32_t(stored));
    }
}

void ApplySplineEnvelope(std::span<int16_t> samples, const SplineCurve& curve)
{
    EnvelopeGains envelope(curve, samples.size());
    std::vector<double> gains(kBlockFrames);
    for (size_t first = 0; first < samples.size(); first += kBlockFrames) {
        const size_t n = std::min(kBlockFrames, samples.size() - first);
        const std::span<double> block(gains.data(), n);
        envelope.Compute(first, block);
        ApplyGains(block, samples.subspan(first, n));
    }
}

void ApplySplineEnvelopeTogether(std::span<const std::span<int16_t>> ranges, const SplineCurve& curve)
{
    if (ranges.empty()) {
        return;
    }
    const size_t count = ranges.front().size();
    for (const std::span<int16_t>& range : ranges) {
        if (range.size() != count) {
            throw std::invalid_argument("ApplySplineEnvelopeTogether: the ranges differ in length");
        }
    }
    EnvelopeGains envelope(curve, count);
    std::vector<double> gains(kBlockFrames);
    for (size_t first = 0; first < count; first += kBlockFrames) {
        const size_t n = std::min(kBlockFrames, count - first);
        const std::span<double> block(gains.data(), n);
        envelope.Compute(first, block);
        for (const std::span<int16_t>& range : ranges) {
            ApplyGains(block, range.subspan(first, n));
        }
    }
}

}  // namespace glimmet::effects
