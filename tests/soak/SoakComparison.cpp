#include "SoakComparison.h"

#include <sstream>

#include "sound/BlockBuilder.h"
#include "sound/Channel.h"
#include "sound/SampleBlock.h"

namespace glimmet::test {

int64_t SoakComparison::FirstDifferentSample(Channel* channel, const SoakSamples& expected)
{
    int64_t found = -1;
    int64_t offset = 0;
    channel->ReadSpans(0, channel->FrameCount(), [&](const SampleSpan& span) {
        if (found < 0) {
            // A span of the shared silence against zeros in the model needs
            // no look at its samples.
            const bool bothSilent
                = BlockBuilder::IsSilence(span.block) && expected.Slice(offset, span.count).AllZeros();
            const int64_t k = bothSilent ? -1 : expected.FirstDifference(offset, span.samples, span.count);
            if (k >= 0)
                found = offset + k;
        }
        offset += span.count;
    });
    return found;
}

std::string SoakComparison::Difference(size_t index, Channel* channel, const SoakChannelState& expected)
{
    std::ostringstream out;
    out << "channel " << index << ": ";
    const int64_t first = channel->FirstFrame();
    const int64_t frames = channel->FrameCount();
    if (first != expected.first || frames != expected.samples.Size()) {
        out << "first frame " << first << ", " << frames << " frames; expected " << expected.first << ", "
            << expected.samples.Size();
        return out.str();
    }
    const int64_t at = FirstDifferentSample(channel, expected.samples);
    if (at >= 0) {
        int16_t seen = 0;
        channel->ReadSpans(at, 1, [&seen](const SampleSpan& span) { seen = span.samples[0]; });
        out << "sample " << at << " is " << seen << ", expected " << expected.samples.At(at);
        return out.str();
    }
    if (channel->IsSelected() != expected.selected || channel->IsMuted() != expected.muted
        || channel->PanPosition() != expected.pan) {
        out << "flags" << (channel->IsSelected() ? " selected" : "") << (channel->IsMuted() ? " muted" : "") << " pan "
            << int(channel->PanPosition()) << "; expected" << (expected.selected ? " selected" : "")
            << (expected.muted ? " muted" : "") << " pan " << int(expected.pan);
        return out.str();
    }
    return {};
}

}  // namespace glimmet::test
