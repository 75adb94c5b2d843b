#pragma once

#include <cstdio>

namespace glimmet {

class BatchRunner;

/// Script commands that let a script's caller see the document: print (the
/// state report as JSON on the output) and samples (one channel's samples
/// to a file).
class ReportScriptCommands {
public:
    /// output is where print writes; it outlives the runner.
    static void AddTo(BatchRunner& runner, std::FILE* output);
};

}  // namespace glimmet
