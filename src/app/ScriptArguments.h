#pragma once

#include <cstdint>
#include <string>

namespace glimmet {

class QuillexWindow;

/// Reads the arguments of script commands and words their complaints, so
/// that every command rejects a bad number or channel in the same terms.
class ScriptArguments {
public:
    /// The whole text as a decimal integer; false for anything else,
    /// including trailing characters or an empty text.
    static bool ParseInteger(const std::string& text, int64_t* value);
    /// Sets the reason and returns false, so a command can fail in one line.
    static bool Fail(std::string* reason, const std::string& text);
    /// "1 channel", "2 channels".
    static std::string Plural(int count, const char* noun);
    /// A channel index the window's document has; false with the reason.
    static bool ChannelIndex(const QuillexWindow* window, const std::string& text, int32_t* index,
        std::string* reason);
};

}  // namespace glimmet
