#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <string>
#include <vector>

namespace glimmet {

/// The vocabulary of an editing script: how a line splits into a command
/// name and its arguments, the named commands with the number of arguments
/// each takes, and the four-character window codes a line may post as they
/// are. It knows no window; running a command is the command's business.
class ScriptCommandTable {
public:
    using Arguments = std::vector<std::string>;
    /// Runs one command; returns false with a reason for a bad argument.
    using Command = std::function<bool(const Arguments& arguments, std::string* reason)>;

    /// Splits a line at blanks into its command name and arguments; false
    /// for a blank line or a comment ('#'), which a script skips.
    static bool Parse(const std::string& line, std::string* name, Arguments* arguments);
    /// The window code a four-character name stands for; false when the
    /// name is none a script may post.
    static bool WindowCode(const std::string& name, uint32_t* what);

    /// Adds (or replaces) a command. minimum and maximum bound the number of
    /// arguments; a maximum of -1 takes any number.
    void Add(const std::string& name, int minimum, int maximum, Command command);
    bool Has(const std::string& name) const { return commands_.count(name) != 0; }
    /// Whether the named command takes that many arguments; false with the
    /// reason when not.
    bool CheckCount(const std::string& name, size_t count, std::string* reason) const;
    /// Runs the named command, which must be one the table has.
    bool Run(const std::string& name, const Arguments& arguments, std::string* reason) const;

private:
    struct Entry {
        int minimum;
        int maximum;
        Command run;
    };

    std::map<std::string, Entry> commands_;
};

}  // namespace glimmet
