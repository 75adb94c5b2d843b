#pragma once

#include "edit/Action.h"

namespace glimmet {

/// "Fade Out": fades the range of every selected channel out, from full level at the range start to silence at its end. Undo and redo are the base ones.
class FadeOutAction : public Action {
public:
    using Action::Action;

    /// B_ERROR without touching anything when the action is not bound.
    status_t Go() override;
    const char* Name() override;

protected:
    bool RedoPutsResultBack() const override { return true; }
};

}  // namespace glimmet
