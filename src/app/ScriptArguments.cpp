#include "app/ScriptArguments.h"

#include "app/QuillexWindow.h"
#include "sound/ChannelManager.h"
#include "support/ScriptLine.h"

namespace glimmet {

bool ScriptArguments::ParseInteger(const std::string& text, int64_t* value)
{
    return ScriptLine::ParseInteger(text, value);
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
