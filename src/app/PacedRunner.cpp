#include "app/PacedRunner.h"

#include <QScreen>

#include <algorithm>
#include <cmath>

namespace glimmet {

PacedRunner::PacedRunner(int64_t framePeriodMicros) : framePeriodMicros_(framePeriodMicros)
{
    timer_.setTimerType(Qt::PreciseTimer);
    QObject::connect(&timer_, &QTimer::timeout, [this] {
        if (deliver_)
            deliver_(what_);
    });
}

int64_t PacedRunner::FramePeriodFor(const QScreen* screen)
{
    const double rate = screen != nullptr ? screen->refreshRate() : 0.0;
    if (!(rate > 1.0))
        return kShortestFrameMicros;
    return std::max(kShortestFrameMicros, int64_t(std::llround(1e6 / rate)));
}

void PacedRunner::Replace(uint32_t what, int64_t intervalMicros)
{
    what_ = what;
    const int64_t micros = std::max(intervalMicros, framePeriodMicros_);
    timer_.start(int((micros + 500) / 1000));
}

}  // namespace glimmet
