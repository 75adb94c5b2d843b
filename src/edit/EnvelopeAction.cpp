#include "edit/EnvelopeAction.h"

#include <optional>
#include <memory>
#include <span>
#include <vector>

#include "edit/RangeTransformer.h"

#include "edit/effects/EnvelopeShape.h"

namespace glimmet {

namespace {

// The gain when the dialog cannot be read: a curve at 1 is a gain of 0.
double Silence(double)
{
    return 1.0;
}

// 0 when every gain of curve is finite, so that silence stays silence.
std::optional<int16_t> SilenceBecomes(const effects::SplineCurve& curve)
{
    if (effects::EnvelopeGains(curve, 1).AlwaysFinite())
        return int16_t(0);
    return std::nullopt;
}

}  // namespace

status_t EnvelopeAction::Go()
{
    if (InitCheck() != B_OK || Dialog() == nullptr)
        return B_ERROR;
    const std::optional<effects::SplineCurve> curve = HideAndReadCurve(*Dialog());
    if (!curve) {
        // A gain of 0 everywhere: every sample, silence included, becomes 0.
        return TransformSelectedRanges(PieceTransform{
            [](int16_t* samples, int64_t count, int64_t, int64_t) {
                effects::ApplyEnvelope(std::span<int16_t>(samples, size_t(count)), Silence);
            },
            int16_t(0)});
    }
    // The gains follow the range from its first frame to its last; each
    // channel's pass starts over at the first piece. A finite gain keeps
    // silence silent, so when the curve can give no other, pieces of silence
    // are not computed; otherwise (a gain that is not a number turns 0 into
    // 32767) they are computed like anything else, and those that come out
    // silent are still stored as shared silence.
    auto gains = std::make_shared<std::optional<effects::EnvelopeGains>>();
    auto buffer = std::make_shared<std::vector<double>>();
    // Shared, so that the sweep's reference to the curve stays valid.
    auto drawn = std::make_shared<const effects::SplineCurve>(*curve);
    return TransformSelectedRanges(PieceTransform{
        [gains, buffer, drawn](int16_t* samples, int64_t count, int64_t first, int64_t total) {
            if (first == 0 || !*gains)
                gains->emplace(*drawn, size_t(total));
            buffer->resize(size_t(count));
            const std::span<double> piece(buffer->data(), size_t(count));
            (*gains)->Compute(size_t(first), piece);
            effects::ApplyGains(piece, std::span<int16_t>(samples, size_t(count)));
        },
        SilenceBecomes(*curve)});
}

const char* EnvelopeAction::Name()
{
    return "Envelope";
}

}  // namespace glimmet
