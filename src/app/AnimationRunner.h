#pragma once

#include <cstdint>
#include <functional>

namespace glimmet {

/// The one timer behind an animation: it delivers one code again and again
/// at an interval until it is told another code and interval. Tests use a
/// runner of their own, so that they decide when time passes.
class AnimationRunner {
public:
    using Deliver = std::function<void(uint32_t what)>;

    virtual ~AnimationRunner() = default;

    /// Where the codes go.
    virtual void SetTarget(Deliver deliver) = 0;
    /// Stops the code sent so far and sends what every intervalMicros from
    /// now on.
    virtual void Replace(uint32_t what, int64_t intervalMicros) = 0;
};

}  // namespace glimmet
