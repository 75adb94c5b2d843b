#pragma once

#include <cstddef>
#include <string>

#include "SoakChannelRules.h"

namespace glimmet {
class Channel;
}

namespace glimmet::test {

/// Compares a channel of the document with the model's, reading the
/// channel span by span as the mixer and the views read it, so that a
/// channel of billions of silent frames is compared without being written
/// out anywhere.
class SoakComparison {
public:
    /// Empty when they agree, else the first difference in words.
    static std::string Difference(size_t index, Channel* channel, const SoakChannelState& expected);

private:
    /// The index of the first sample that differs, or -1.
    static int64_t FirstDifferentSample(Channel* channel, const SoakSamples& expected);
};

}  // namespace glimmet::test
