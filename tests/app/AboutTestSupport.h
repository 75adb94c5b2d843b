#pragma once

#include <QImage>
#include <QString>

#include <cstdint>

#include "app/AnimationRunner.h"

namespace glimmet::test {

/// What an AboutView asked of its runner; the test fires it when it wants
/// time to pass.
struct RunnerLog {
    uint32_t what = 0;
    int64_t intervalMicros = 0;
    int replacements = 0;
    AnimationRunner::Deliver deliver;

    /// Delivers the current code once, as the timer would.
    void Fire() const { deliver(what); }
};

/// A runner that only records, into a log the test owns.
class ManualRunner : public AnimationRunner {
public:
    explicit ManualRunner(RunnerLog* log) : log_(log) {}
    void SetTarget(Deliver deliver) override { log_->deliver = std::move(deliver); }
    void Replace(uint32_t what, int64_t intervalMicros) override
    {
        log_->what = what;
        log_->intervalMicros = intervalMicros;
        ++log_->replacements;
    }

private:
    RunnerLog* log_;
};

/// The About box's frame for a line at a smear width, worked out copy by
/// copy: the line rendered once, leaning back 20 degrees, each of the smear
/// + 1 copies adding grey * coverage / 255 at its own pixel offset, the sum
/// rounded and kept to white.
QImage ReferenceAboutFrame(const QString& text, int pixelSize, int smear, QSize size);

/// The number of pixels in which two frames differ (size mismatch counts
/// every pixel); the first difference goes to where when there is one.
int DifferingPixels(const QImage& a, const QImage& b, QString* where = nullptr);

}  // namespace glimmet::test
