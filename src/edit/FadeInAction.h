#pragma once

#include "edit/Action.h"

namespace glimmet {

/// "Fade In": fades the range of every selected channel in, from silence at the range start to full level at its end. Undo and redo are the base ones.
class FadeInAction : public Action {
public:
    using Action::Action;

    /// B_NO_INIT without touching anything when the action is not bound.
    status_t Go() override;
    const char* Name() override;

protected:
    bool RedoPutsResultBack() const override { return true; }
};

}  // namespace glimmet
