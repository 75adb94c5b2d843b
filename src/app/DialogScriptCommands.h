#pragma once

#include <cstdio>

namespace glimmet {

class BatchRunner;
class CurveParameterWindow;
class QuillexWindow;
class TSParameterWindow;

/// Script commands for the parameter dialog a window has open, worked
/// through input events on its widgets as a user would work it:
///   dialog                       prints the dialog as one line of JSON
///   curve click X Y              primary click at the normalised point
///   curve drag X0 Y0 X1 Y1       press, move in small steps, release
///   curve rightclick X Y         secondary click
///   passes N                     types N into "Filter passes:"
///   field LABEL VALUE            types VALUE into the text field labelled
///                                LABEL (quoted when it has blanks)
///   ok, cancel, close            the two buttons and the close box; after
///                                "ok" on a time stretch the script goes on
///                                once the stretch has been written back
///   dialogshot PATH              the dialog as PNG
/// Every command but `dialog` is a bad line when no dialog is open.
class DialogScriptCommands {
public:
    static void AddTo(BatchRunner& runner, std::FILE* output);

    /// The window's visible parameter dialog (the latest if several), or
    /// null.
    static CurveParameterWindow* OpenDialog(QuillexWindow* window);
    /// The window's visible time stretch dialog, or null.
    static TSParameterWindow* OpenStretchDialog(QuillexWindow* window);
    /// Delivers events until no time stretch is being computed.
    static void WaitForStretches();

private:
    static void AddCurveCommand(BatchRunner& runner);
    static void AddButtonCommands(BatchRunner& runner);
    static void AddFieldCommands(BatchRunner& runner, std::FILE* output);
};

}  // namespace glimmet
