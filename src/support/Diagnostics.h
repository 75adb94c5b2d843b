#pragma once

#include <cstdarg>

namespace glimmet {

/// The one way the program reports what went wrong on the way (a refused
/// edit, a file that could not be written, how playback was connected).
///
/// Diagnostics are not the program's output: the user sees them only on a
/// terminal, and tests read them through a DiagnosticsCapture instead of
/// redirecting the process's file descriptors.
///
/// Any thread may print. Without a live capture a print costs what printf
/// and fflush cost: nothing is allocated and no lock of ours is taken, so the
/// audio thread behaves as it would calling printf itself.
class Diagnostics {
public:
    enum class Channel { Output, Error };

    Diagnostics() = delete;

    /// Writes to standard output and flushes, so that the text is not lost
    /// or reordered when the program dies or its output is a pipe.
    static void Print(const char* format, ...) __attribute__((format(printf, 1, 2)));
    /// The same, on standard error.
    static void PrintError(const char* format, ...) __attribute__((format(printf, 1, 2)));

private:
    static void Emit(Channel channel, const char* format, va_list arguments);
};

}  // namespace glimmet
