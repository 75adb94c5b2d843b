#pragma once

#include <cstdarg>
#include <string>

#include "support/Diagnostics.h"

namespace glimmet {

/// While alive, collects the text that Diagnostics prints on one channel,
/// from every thread, instead of letting it reach the stream (unless asked
/// to pass it on as well). Meant for tests.
///
/// Captures may nest or overlap: each live capture of a channel collects
/// everything printed on it while it lives.
class DiagnosticsCapture {
public:
    enum class PassOn { No, Yes };

    explicit DiagnosticsCapture(Diagnostics::Channel channel = Diagnostics::Channel::Output,
        PassOn passOn = PassOn::No);
    ~DiagnosticsCapture();
    DiagnosticsCapture(const DiagnosticsCapture&) = delete;
    DiagnosticsCapture& operator=(const DiagnosticsCapture&) = delete;

    /// What has been collected so far.
    std::string Text() const;
    /// Stops collecting (for good) and returns everything collected.
    std::string Finish();

private:
    friend class Diagnostics;

    /// Whether any capture lives; a lock-free check, so that printing
    /// without a capture never takes the captures' lock.
    static bool AnyLive();
    /// Formats the text into every live capture of the channel; true when
    /// the text should still reach the stream.
    static bool Collect(Diagnostics::Channel channel, const char* format, va_list arguments);

    const Diagnostics::Channel channel_;
    const PassOn passOn_;
    bool live_ = true;  // guarded by the captures' lock
    std::string text_;  // guarded by the captures' lock
};

}  // namespace glimmet
