#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace glimmet {

/// The words of one line of an editing script, and the numbers in them.
/// Kept apart from the window so that what users type can be tested and
/// fuzzed without one.
class ScriptLine {
public:
    using Words = std::vector<std::string>;

    /// Splits line into the command's name and its arguments: words part
    /// at blanks; a word that opens with a double quote runs to the next
    /// double quote, blanks included, and loses both quotes. False for a
    /// line of blanks only or a comment (first word starting with '#'),
    /// which a script skips.
    static bool Parse(const std::string& line, std::string* name, Words* arguments);

    /// The whole text as a decimal integer; false for anything else,
    /// including trailing characters, an empty text, or a number that does
    /// not fit 64 bits.
    static bool ParseInteger(const std::string& text, int64_t* value);

    /// What a range field's text stands for: read like strtol in base 10
    /// (leading blanks, a sign, digits, anything after them ignored, no
    /// digits read as 0), kept to its low 32 bits as a signed number and
    /// widened again.
    static int64_t RangeFieldNumber(const std::string& text);
};

}  // namespace glimmet
