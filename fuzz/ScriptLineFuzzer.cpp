// Feeds arbitrary bytes, as the text of an editing script, through the
// script's line splitting and its number readers, and as the text of the
// window's range fields.

#include <cstdint>
#include <cstdlib>
#include <string>

#include "support/ScriptLine.h"

namespace {

using glimmet::ScriptLine;

void CheckLine(const std::string& line)
{
    std::string name;
    ScriptLine::Words arguments;
    if (!ScriptLine::Parse(line, &name, &arguments))
        return;
    for (const std::string& argument : arguments) {
        int64_t value = 0;
        ScriptLine::ParseInteger(argument, &value);
        const int64_t field = ScriptLine::RangeFieldNumber(argument);
        // What a range field stands for always fits 32 bits.
        if (field < INT32_MIN || field > INT32_MAX)
            std::abort();
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    size_t start = 0;
    while (start <= text.size()) {
        const size_t end = text.find('\n', start);
        CheckLine(text.substr(start, end == std::string::npos ? std::string::npos : end - start));
        if (end == std::string::npos)
            break;
        start = end + 1;
    }
    // Lines as a program might hand them over whole, newlines included.
    CheckLine(text);
    ScriptLine::RangeFieldNumber(text);
    return 0;
}
