#pragma once

#include <memory>

#include "SoakModel.h"
#include "SoakRunner.h"
#include "edit/Action.h"

namespace glimmet::test {

/// The effects that ask for parameters, made with fake dialogs holding
/// what a random step drew: the window would show the dialog, the user
/// would draw and type, and "Ok" would record and run the action.
class SoakDialogs {
public:
    /// The parameters step draws for an effect of kind: a curve for the
    /// curve effects (the filter's always readable: it reads it once), a
    /// tap count for the filter, a factor for the stretch.
    static SoakRecord Draw(SoakRecord::Kind kind, const SoakStep& step);
    /// The action of record's kind with a fake dialog giving its
    /// parameters; record.dialog then names the fake while the action
    /// keeps it (the effects that read it again at every redo).
    static std::unique_ptr<Action> Make(SoakRecord& record);
    /// Changes what the kept dialog of record gives from now on, as a user
    /// drawing again in the hidden dialog before a redo.
    static void Redraw(SoakRecord& record, const SoakCurve& curve);
    static SoakCurve DrawCurve(uint64_t bits);
};

}  // namespace glimmet::test
