#pragma once

#include <QString>

#include <cstdint>

namespace glimmet {

class BatchRunner;
class QuillexWindow;

/// Script commands that act on channels as a user does in the channel
/// views: select, focus, move, and the context menu's mute and pan.
class ChannelScriptCommands {
public:
    static void AddTo(BatchRunner& runner);

private:
    static void AddSelectionCommands(BatchRunner& runner);
    static void AddMenuCommands(BatchRunner& runner);
    /// Triggers the channel's context menu item with that label, as a click
    /// on it would; false when the channel has no menu.
    static bool TriggerChannelMenuItem(QuillexWindow* window, int32_t index, const QString& label);
};

}  // namespace glimmet
