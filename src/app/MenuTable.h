#pragma once

#include <Qt>

#include <cstdint>
#include <vector>

namespace glimmet {

/// The menu items a document window keeps a handle on, to relabel, enable or
/// mark them later.
enum class KeptMenuItem { None, Save, Undo, Redo, DeleteHistory, ZoomRange, BubbleHelp };

/// One row of a document window's menu bar: an item, or a separator when
/// label is null. The shortcut is key with Ctrl (and Shift when shift is
/// set); a key of 0 means no shortcut.
struct MenuEntry {
    const char* menu;
    const char* label;
    uint32_t code;
    int key;
    bool shift;
    bool toApplication;
    KeptMenuItem kept;
};

/// Every menu item of a document window, menu by menu in the order the
/// menus stand in the bar (File, Edit, Channel, Tools, View, Help).
const std::vector<MenuEntry>& DocumentMenuTable();

}  // namespace glimmet
