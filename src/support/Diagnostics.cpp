#include "support/Diagnostics.h"

#include <cstdio>

#include "support/DiagnosticsCapture.h"

namespace glimmet {

void Diagnostics::Print(const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    Emit(Channel::Output, format, arguments);
    va_end(arguments);
}

void Diagnostics::PrintError(const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    Emit(Channel::Error, format, arguments);
    va_end(arguments);
}

void Diagnostics::Emit(Channel channel, const char* format, va_list arguments)
{
    if (DiagnosticsCapture::AnyLive()) {
        va_list copy;
        va_copy(copy, arguments);
        const bool passOn = DiagnosticsCapture::Collect(channel, format, copy);
        va_end(copy);
        if (!passOn)
            return;
    }
    std::FILE* stream = channel == Channel::Error ? stderr : stdout;
    std::vfprintf(stream, format, arguments);
    std::fflush(stream);
}

}  // namespace glimmet
