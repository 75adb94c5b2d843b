#pragma once

#include <string>

namespace glimmet {

class CurveParameterWindow;
class QuillexWindow;

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
    /// text as a JSON string literal, quotes included.
    static std::string Quoted(const std::string& text);
};

}  // namespace glimmet
