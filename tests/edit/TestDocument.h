#pragma once

#include <algorithm>
#include <cstdint>
#include <ostream>
#include <random>
#include <vector>

#include "DocumentMirror.h"
#include "edit/EditPosition.h"
#include "sound/Channel.h"
#include "sound/ChannelManager.h"
#include "sound/ChannelSamples.h"

namespace glimmet::test {

/// What a test can observe of one channel.
struct ChannelState {
    std::vector<int16_t> samples;
    int64_t first = 0;
    bool selected = false;
    bool muted = false;
    int8_t pan = 0;

    bool operator==(const ChannelState&) const = default;
};

/// What a test can observe of a whole document.
struct DocumentState {
    std::vector<ChannelState> channels;
    int64_t rangeStart = -1;
    int64_t rangeEnd = -1;

    bool operator==(const DocumentState&) const = default;
};

inline std::ostream& operator<<(std::ostream& out, const ChannelState& state)
{
    out << "{first " << state.first << (state.selected ? ", selected" : "") << (state.muted ? ", muted" : "")
        << ", pan " << int(state.pan) << ", " << state.samples.size()
        << " samples:";
    const size_t shown = std::min<size_t>(state.samples.size(), 12);
    for (size_t i = 0; i < shown; i++)
        out << ' ' << state.samples[i];
    return out << (shown < state.samples.size() ? " ...}" : "}");
}

inline std::ostream& operator<<(std::ostream& out, const DocumentState& state)
{
    out << "range " << state.rangeStart << ".." << state.rangeEnd;
    for (const ChannelState& channel : state.channels)
        out << "\n  " << channel;
    return out;
}

/// A document with channels made from plain vectors, an edit position, and
/// a mirror that follows the document's announcements, for testing actions
/// without widgets.
class TestDocument {
public:
    ChannelManager manager{nullptr};
    EditPosition position;
    DocumentMirror mirror{manager};

    Channel* AddChannel(const std::vector<int16_t>& samples, int64_t first = 0, bool selected = true)
    {
        auto* channel = new Channel();
        if (!samples.empty()) {
            auto* data = new int16_t[samples.size()];
            std::copy(samples.begin(), samples.end(), data);
            channel->SetTo(data, int64_t(samples.size()));
        }
        channel->SetStartFrameOffset(first);
        channel->SetSelected(selected);
        manager.AddChannel(std::unique_ptr<Channel>(channel));
        return channel;
    }

    void SetRange(int64_t start, int64_t end)
    {
        manager.SetRangeStart(start);
        manager.SetRangeEnd(end);
    }

    void Select(const std::vector<bool>& selected)
    {
        for (size_t i = 0; i < selected.size(); i++)
            manager.ChannelAt(int32_t(i))->SetSelected(selected[i]);
    }

    static ChannelState StateOf(Channel* channel)
    {
        ChannelState state;
        state.samples = SamplesOf(*channel);
        state.first = channel->FirstFrame();
        state.selected = channel->IsSelected();
        state.muted = channel->IsMuted();
        state.pan = channel->PanPosition();
        return state;
    }

    DocumentState State()
    {
        DocumentState state;
        for (int32_t i = 0; Channel* channel = manager.ChannelAt(i); i++)
            state.channels.push_back(StateOf(channel));
        state.rangeStart = manager.RangeStart();
        state.rangeEnd = manager.RangeEnd();
        return state;
    }
};

/// count samples counting up from from.
inline std::vector<int16_t> Ramp(int16_t from, size_t count)
{
    std::vector<int16_t> samples(count);
    for (size_t i = 0; i < count; i++)
        samples[i] = int16_t(from + int16_t(i));
    return samples;
}

/// Random samples that always hold the extremes and the values around 0.
inline std::vector<int16_t> RandomSamples(std::mt19937& random, size_t count)
{
    std::uniform_int_distribution<int> any(-32768, 32767);
    std::vector<int16_t> samples(count);
    for (int16_t& sample : samples)
        sample = int16_t(any(random));
    const int16_t special[] = {-32768, -1, 0, 1, 32767};
    for (size_t i = 0; i < 5 && i < count; i++)
        samples[i] = special[i];
    std::shuffle(samples.begin(), samples.end(), random);
    return samples;
}

}  // namespace glimmet::test
