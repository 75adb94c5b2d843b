#pragma once

#include <string>

namespace glimmet {

class CurveParameterWindow;
class QuillexWindow;
class SndFilePanel;
class TSParameterWindow;

/// The state of a document window as one line of JSON, for scripts that
/// drive the editor headless and check what it did:
///
///   {"title": ..., "frames": N, "range": [S, E], "cursor": C, "playmark": P,
///    "display": [FIRST, LAST], "playmode": "all"|"range"|"visible",
///    "loop": B, "transport": {"play mode": M, "play": M, "enabled": B},
///    "undo": NAME|null, "redo": NAME|null, "saved": B,
///    "channels": [{"first": F, "frames": N, "muted": B, "pan": P,
///                  "selected": B, "focused": B, "view": [X, Y, W, H]}, ...]}
///
/// "view" is the channel's sample view in window coordinates, the same
/// coordinates as a grab of the whole window.
class DocumentStateReport {
public:
    /// Reads the window under the document lock; no trailing newline.
    static std::string Json(QuillexWindow& window);
    /// Json, followed by what only a window on a screen has:
    ///   "screen": [X, Y] (the window's top left on the screen),
    ///   "active": B, "playing": B, "fields": [START TEXT, END TEXT],
    ///   "dialog": the open parameter dialog, on screen (see DialogJson),
    ///   "panel": the open panel (see PanelJson),
    ///   "buttons": {"play": [X, Y], "play mode": [X, Y], "stop": [X, Y]},
    ///   the centres of the transport buttons on the screen.
    static std::string LiveJson(QuillexWindow& window);
    /// The parameter dialog: {"title": T, "points": [[X, Y], ...],
    /// "passes": N (FIR only), "labels": [FIRST, SECOND]}, each number
    /// written so that it reads back as exactly the stored value, or
    /// {"title": null} for none. onScreen adds "area": the curve area's
    /// left, top, right and bottom on the screen, and "ok" and "cancel", the
    /// centres of the two buttons there.
    static std::string DialogJson(CurveParameterWindow* dialog, bool onScreen = false);
    /// The open panel while it is shown: {"title": T, "folder": PATH,
    /// "listed": [NAME, ...]}; null when it is not.
    static std::string PanelJson(SndFilePanel* panel);
    /// {"title": "Time Stretch", "fields": {label: text, ...}} in the
    /// fields' order.
    static std::string DialogJson(TSParameterWindow* dialog);
    /// The window's open dialog as above: the time stretch dialog when one
    /// is open, otherwise the curve dialog on screen (or null).
    static std::string OpenDialogJson(QuillexWindow& window);
    /// text as a JSON string literal, quotes included.
    static std::string Quoted(const std::string& text);
};

}  // namespace glimmet
