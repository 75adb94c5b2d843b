#pragma once

#include <string>

namespace glimmet {

class BatchRunner;
class Quillex;

/// Script commands that open, append and save files the way a user does:
/// through the open and save panels, or by dropping a file on the window.
/// open, append, save, saveas.
class FileScriptCommands {
public:
    /// The application owns the open panel; it outlives the runner.
    static void AddTo(BatchRunner& runner, Quillex& application);

private:
    /// Asks the window for the open panel and picks the file in it.
    static bool OpenThroughPanel(BatchRunner& runner, Quillex& application, const std::string& path,
        std::string* reason);
    /// Asks the window for the save panel and names the file in it.
    static bool SaveThroughPanel(BatchRunner& runner, const std::string& path, std::string* reason);
};

}  // namespace glimmet
