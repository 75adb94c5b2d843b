#include "support/ScriptLine.h"

#include <algorithm>
#include <charconv>
#include <cstdlib>

namespace glimmet {

namespace {

// One set of blanks for skipping and for splitting: a line that is not
// skipped always has a first word.
constexpr const char* kBlanks = " \t\r\n\v\f";

ScriptLine::Words SplitWords(const std::string& line)
{
    ScriptLine::Words words;
    size_t at = 0;
    while (true) {
        at = line.find_first_not_of(kBlanks, at);
        if (at == std::string::npos)
            return words;
        if (line[at] == '"') {
            const size_t close = line.find('"', at + 1);
            const size_t end = close == std::string::npos ? line.size() : close;
            words.push_back(line.substr(at + 1, end - at - 1));
            at = close == std::string::npos ? end : close + 1;
            continue;
        }
        const size_t end = std::min(line.find_first_of(kBlanks, at), line.size());
        words.push_back(line.substr(at, end - at));
        at = end;
    }
}

}  // namespace

bool ScriptLine::Parse(const std::string& line, std::string* name, Words* arguments)
{
    const size_t first = line.find_first_not_of(kBlanks);
    if (first == std::string::npos || line[first] == '#')
        return false;
    Words words = SplitWords(line);
    *name = words.front();
    words.erase(words.begin());
    *arguments = std::move(words);
    return true;
}

bool ScriptLine::ParseInteger(const std::string& text, int64_t* value)
{
    const char* begin = text.data();
    const char* end = begin + text.size();
    const auto [stop, error] = std::from_chars(begin, end, *value);
    return error == std::errc() && stop == end && !text.empty();
}

int64_t ScriptLine::RangeFieldNumber(const std::string& text)
{
    // strtol saturates at the long's ends; the low 32 bits of that are what
    // the field stands for.
    const long value = std::strtol(text.c_str(), nullptr, 10);
    return int64_t(int32_t(uint32_t(uint64_t(value))));
}

}  // namespace glimmet
