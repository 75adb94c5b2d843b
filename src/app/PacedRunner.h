#pragma once

#include <QTimer>

#include "app/AnimationRunner.h"

class QScreen;

namespace glimmet {

/// An AnimationRunner on a Qt timer in the GUI thread. An animation may ask
/// for frames faster than anyone can see them; every interval shorter than
/// the frame period is stretched to it, so the animation keeps its number of
/// frames without keeping a processor busy.
class PacedRunner : public AnimationRunner {
public:
    /// The fastest pace: about 100 frames a second.
    static constexpr int64_t kShortestFrameMicros = 10000;

    explicit PacedRunner(int64_t framePeriodMicros = kShortestFrameMicros);

    /// One frame per refresh of the screen, but no more than the fastest
    /// pace; the fastest pace when the screen does not say.
    static int64_t FramePeriodFor(const QScreen* screen);

    void SetTarget(Deliver deliver) override { deliver_ = std::move(deliver); }
    void Replace(uint32_t what, int64_t intervalMicros) override;

    int64_t FramePeriodMicros() const { return framePeriodMicros_; }
    /// The interval the timer runs at now, in milliseconds.
    int IntervalMillis() const { return timer_.interval(); }

private:
    int64_t framePeriodMicros_;
    Deliver deliver_;
    uint32_t what_ = 0;
    QTimer timer_;
};

}  // namespace glimmet
