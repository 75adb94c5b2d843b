#include "app/MenuTable.h"

#include "support/MessageCodes.h"

namespace glimmet {

namespace {

constexpr bool kShift = true;
constexpr bool kApp = true;
constexpr bool kWin = false;

MenuEntry Item(const char* menu, const char* label, uint32_t code, int key = 0, bool shift = false,
    bool toApplication = kWin, KeptMenuItem kept = KeptMenuItem::None)
{
    return MenuEntry{menu, label, code, key, shift, toApplication, kept};
}

MenuEntry Separator(const char* menu)
{
    return MenuEntry{menu, nullptr, 0, 0, false, false, KeptMenuItem::None};
}

std::vector<MenuEntry> BuildTable()
{
    // Two pairs share a shortcut on purpose: "Open…" and "Fade Out" (Ctrl+O),
    // "Envelope…" and "Show All" (Ctrl+E).
    return {
        Item("File", "New", kMsgNewWindow, Qt::Key_N, false, kApp),
        Item("File", "Open\u2026", kMsgOpen, Qt::Key_O),
        Item("File", "Append\u2026", kMsgAppend, Qt::Key_O, kShift),
        Separator("File"),
        Item("File", "Save", kMsgSave, Qt::Key_S, false, kWin, KeptMenuItem::Save),
        Item("File", "Save As\u2026", kMsgSaveAs, Qt::Key_S, kShift),
        Separator("File"),
        Item("File", "About", kMsgAboutRequested, 0, false, kApp),
        Separator("File"),
        Item("File", "Close", kMsgQuitRequested, Qt::Key_W),
        Item("File", "Quit", kMsgQuitRequested, Qt::Key_Q, false, kApp),

        Item("Edit", "Undo", kMsgUndo, Qt::Key_Z, false, kWin, KeptMenuItem::Undo),
        Item("Edit", "Redo", kMsgRedo, Qt::Key_Z, kShift, kWin, KeptMenuItem::Redo),
        Item("Edit", "Delete History", kMsgClearHistory, 0, false, kWin, KeptMenuItem::DeleteHistory),
        Separator("Edit"),
        Item("Edit", "Select All", kMsgSelectAll, Qt::Key_A),
        Item("Edit", "Select None", kMsgSelectNone),
        Separator("Edit"),
        Item("Edit", "Cut", kMsgCut, Qt::Key_X),
        Item("Edit", "Copy", kMsgCopy, Qt::Key_C),
        Item("Edit", "Paste", kMsgPaste, Qt::Key_V),
        Separator("Edit"),
        Item("Edit", "Remove", kMsgRemove),
        Item("Edit", "Truncate", kMsgTruncate),

        Item("Channel", "Add", kMsgAddChannel),
        Item("Channel", "Remove", kMsgRemoveChannel),

        Item("Tools", "Fade In", kMsgFadeIn, Qt::Key_I),
        Item("Tools", "Fade Out", kMsgFadeOut, Qt::Key_O),
        Item("Tools", "Maximize", kMsgMaximize, Qt::Key_M),
        Item("Tools", "Envelope\u2026", kMsgEnvelope, Qt::Key_E),
        Separator("Tools"),
        Item("Tools", "Revert", kMsgRevert),
        Item("Tools", "Revert Phases", kMsgRevertPhases),
        Separator("Tools"),
        Item("Tools", "FIR Filter\u2026", kMsgFilter),
        Item("Tools", "Distort\u2026", kMsgDistort),
        Item("Tools", "Peak Distort\u2026", kMsgCompressor),

        Item("View", "Zoom Range", kMsgZoomRange, Qt::Key_R, false, kWin, KeptMenuItem::ZoomRange),
        Item("View", "Show All", kMsgShowAll, Qt::Key_E),

        Item("Help", "Index", kMsgHelp, Qt::Key_H, false, kApp),
        Item("Help", "Send Feedback", kMsgFeedback, 0, false, kApp),
        Item("Help", "Bubble Help", kMsgToggleBubbleHelp, 0, false, kApp, KeptMenuItem::BubbleHelp),
    };
}

}  // namespace

const std::vector<MenuEntry>& DocumentMenuTable()
{
    static const std::vector<MenuEntry> table = BuildTable();
    return table;
}

}  // namespace glimmet
