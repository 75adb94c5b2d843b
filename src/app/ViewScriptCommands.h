#pragma once

namespace glimmet {

class BatchRunner;

/// Script commands for the playback controls and the window itself:
/// playmode, loop, press, wait, size and snapshot.
class ViewScriptCommands {
public:
    static void AddTo(BatchRunner& runner);

private:
    static void AddPlaybackCommands(BatchRunner& runner);
    static void AddWindowCommands(BatchRunner& runner);
};

}  // namespace glimmet
