#pragma once

#include <string>

namespace glimmet {

class BatchRunner;
class TextControl;

/// Script commands that place the range and the cursor the way a user
/// would, and say beforehand how the "Save changes?" question is answered:
/// range, cursor, answer.
class DocumentScriptCommands {
public:
    /// saveAnswer is where the runner keeps the answer; it outlives the
    /// runner's commands.
    static void AddTo(BatchRunner& runner, int* saveAnswer);

private:
    /// Types the text into the field key by key and ends it with Return, so
    /// the field validates it as it would a user's typing.
    static void TypeIntoField(TextControl* control, const std::string& text);
};

}  // namespace glimmet
