#include "app/ScriptCommandTable.h"

#include <algorithm>

#include "app/ScriptArguments.h"
#include "support/MessageCodes.h"
#include "support/ScriptLine.h"

namespace glimmet {

namespace {

/// The commands a script may post to the window by their four-character
/// code.
const std::vector<uint32_t>& WindowCodes()
{
    static const std::vector<uint32_t> codes = {
        kMsgFadeIn, kMsgFadeOut, kMsgMaximize, kMsgRevert, kMsgRevertPhases, kMsgFilter, kMsgDistort,
        kMsgCompressor, kMsgEnvelope, kMsgTimeStretch, kMsgCopy, kMsgCut, kMsgPaste, kMsgRemove, kMsgTruncate,
        kMsgAddChannel, kMsgRemoveChannel, kMsgUndo, kMsgRedo, kMsgClearHistory, kMsgSelectAll, kMsgSelectNone,
        kMsgZoomRange, kMsgShowAll, kMsgPlay, kMsgPlayFromCursor, kMsgTogglePlay, kMsgStop, kMsgPlayMode,
        kMsgLoop, kMsgActionGo, kMsgActionCancel, kMsgSetRangeStart, kMsgSetRangeEnd, kMsgOpen, kMsgAppend,
        kMsgSave, kMsgSaveAs, kMsgQuitRequested,
    };
    return codes;
}

}  // namespace

bool ScriptCommandTable::Parse(const std::string& line, std::string* name, Arguments* arguments)
{
    return ScriptLine::Parse(line, name, arguments);
}

bool ScriptCommandTable::WindowCode(const std::string& name, uint32_t* what)
{
    if (name.size() != 4)
        return false;
    bool known = false;
    for (const uint32_t candidate : WindowCodes()) {
        if (FourCharText(candidate) == name) {
            *what = candidate;
            known = true;
        }
    }
    return known;
}

void ScriptCommandTable::Add(const std::string& name, int minimum, int maximum, Command command)
{
    commands_[name] = Entry{minimum, maximum, std::move(command)};
}

bool ScriptCommandTable::CheckCount(const std::string& name, size_t arguments, std::string* reason) const
{
    const Entry& entry = commands_.at(name);
    const int count = int(arguments);
    if (count >= entry.minimum && (entry.maximum < 0 || count <= entry.maximum))
        return true;
    if (entry.minimum == entry.maximum)
        return ScriptArguments::Fail(reason, name + " takes " + ScriptArguments::Plural(entry.minimum, "argument"));
    return ScriptArguments::Fail(reason, name + " takes " + std::to_string(entry.minimum) + " to "
                                             + (entry.maximum < 0 ? std::string("any number of")
                                                                  : std::to_string(entry.maximum))
                                             + " arguments");
}

bool ScriptCommandTable::Run(const std::string& name, const Arguments& arguments, std::string* reason) const
{
    return commands_.at(name).run(arguments, reason);
}

}  // namespace glimmet
