#include "app/ScriptArguments.h"

#include <charconv>

#include "app/QuillexWindow.h"
#include "sound/ChannelManager.h"

namespace glimmet {

bool ScriptArguments::ParseInteger(const std::string& text, int64_t* value)
{
    const char* begin = text.data();
    const char* end = begin + text.size();
    const auto [stop, error] = std::from_chars(begin, end, *value);
    return error == std::errc() && stop == end && !text.empty();
}

bool ScriptArguments::Fail(std::string* reason, const std::string& text)
{
    *reason = text;
    return false;
}

std::string ScriptArguments::Plural(int count, const char* noun)
{
    return std::to_string(count) + " " + noun + (count == 1 ? "" : "s");
}

bool ScriptArguments::ChannelIndex(const QuillexWindow* window, const std::string& text, int32_t* index,
    std::string* reason)
{
    int64_t value = 0;
    if (!ParseInteger(text, &value))
        return Fail(reason, "\"" + text + "\" is not a channel index");
    const int32_t count = window->Manager()->CountChannels();
    if (value < 0 || value >= count)
        return Fail(reason, "no channel " + text + " (the document has " + Plural(count, "channel") + ")");
    *index = int32_t(value);
    return true;
}

}  // namespace glimmet
