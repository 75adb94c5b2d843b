#pragma once

#include <functional>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

#include "TransformReference.h"
#include "edit/FadeInAction.h"
#include "edit/FadeOutAction.h"
#include "edit/MaximizeAction.h"
#include "edit/RevertAction.h"
#include "edit/RevertPhasesAction.h"

namespace glimmet::test {

/// One of the in-place transforms with what the tests expect of it.
struct TransformCase {
    std::string name;
    status_t unboundStatus;
    std::function<std::unique_ptr<Action>()> make;
    /// Applies the reference to the ranges of the selected channels.
    std::function<void(std::vector<std::vector<int16_t>>&)> reference;
};

inline std::ostream& operator<<(std::ostream& out, const TransformCase& transform)
{
    return out << transform.name;
}

template <typename T>
std::function<std::unique_ptr<Action>()> Maker()
{
    return [] { return std::make_unique<T>(nullptr); };
}

inline std::function<void(std::vector<std::vector<int16_t>>&)> EachRange(
    std::vector<int16_t> (*transform)(std::vector<int16_t>))
{
    return [transform](std::vector<std::vector<int16_t>>& ranges) {
        for (auto& range : ranges)
            range = transform(range);
    };
}

inline std::vector<int16_t> RevertCopy(std::vector<int16_t> s)
{
    return TransformReference::Revert(s);
}

inline std::vector<TransformCase> AllTransforms()
{
    return {
        {"Fade In", B_NO_INIT, Maker<FadeInAction>(), EachRange(&TransformReference::FadeIn)},
        {"Fade Out", B_ERROR, Maker<FadeOutAction>(), EachRange(&TransformReference::FadeOut)},
        {"Maximize", B_ERROR, Maker<MaximizeAction>(), &TransformReference::Maximize},
        {"Revert", B_ERROR, Maker<RevertAction>(), EachRange(&RevertCopy)},
        {"Revert Phases", B_ERROR, Maker<RevertPhasesAction>(), EachRange(&TransformReference::RevertPhases)},
    };
}

/// The document state a transform should leave: the reference applied to
/// the range start..end of every selected channel. Every channel holds the
/// whole range.
inline DocumentState ExpectedAfter(const TransformCase& transform, DocumentState state, int64_t start, int64_t end)
{
    std::vector<std::vector<int16_t>> ranges;
    for (const ChannelState& channel : state.channels) {
        if (channel.selected)
            ranges.emplace_back(channel.samples.begin() + (start - channel.first),
                channel.samples.begin() + (end - channel.first + 1));
    }
    transform.reference(ranges);
    size_t next = 0;
    for (ChannelState& channel : state.channels) {
        if (channel.selected)
            std::copy(ranges[next].begin(), ranges[next].end(), channel.samples.begin() + (start - channel.first)),
                next++;
    }
    return state;
}

}  // namespace glimmet::test
