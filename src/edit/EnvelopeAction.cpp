#include "edit/EnvelopeAction.h"

#include <mutex>
#include <optional>
#include <span>
#include <vector>

#include "edit/effects/EnvelopeShape.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"

namespace glimmet {

namespace {

// The gain when the dialog cannot be read: a curve at 1 is a gain of 0.
double Silence(double)
{
    return 1.0;
}

// Where every selected channel holds the whole range, the working buffer is
// never used: each channel's range is rewritten where it lies, and no channel
// sees another's samples. Shaping the channels side by side then gives the
// same samples, with each frame's gain computed once for all of them.
bool ShapeInPlace(ChannelManager* manager, int64_t start, int64_t end, const effects::SplineCurve& curve)
{
    std::lock_guard guard(manager->DocumentLock());
    const int64_t count = end - start + 1;
    if (count < 1)
        return false;
    std::vector<std::span<int16_t>> ranges;
    for (int32_t i = 0; Channel* channel = manager->ChannelAt(i); i++) {
        if (!channel->IsSelected())
            continue;
        const int64_t first = channel->FirstFrame();
        if (channel->Data() == nullptr || start < first || end >= first + channel->FrameCount())
            return false;
        ranges.emplace_back(channel->Data() + (start - first), size_t(count));
    }
    effects::ApplySplineEnvelopeTogether(ranges, curve);
    return true;
}

}  // namespace

status_t EnvelopeAction::Go()
{
    if (InitCheck() != B_OK || Dialog() == nullptr)
        return B_ERROR;
    const std::optional<effects::SplineCurve> curve = HideAndReadCurve(*Dialog());
    if (curve && ShapeInPlace(Manager(), RangeStart(), RangeEnd(), *curve))
        return B_OK;
    return TransformSelectedRanges([&curve](int16_t* samples, int64_t count) {
        const std::span<int16_t> range(samples, size_t(count));
        if (curve)
            effects::ApplySplineEnvelope(range, *curve);
        else
            effects::ApplyEnvelope(range, Silence);
    });
}

const char* EnvelopeAction::Name()
{
    return "Envelope";
}

}  // namespace glimmet
