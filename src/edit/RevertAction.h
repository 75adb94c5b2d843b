#pragma once

#include "edit/Action.h"

namespace glimmet {

/// "Revert": plays the range of every selected channel backwards. Undo and redo are the base ones.
class RevertAction : public Action {
public:
    using Action::Action;

    /// B_ERROR without touching anything when the action is not bound.
    status_t Go() override;
    const char* Name() override;

protected:
    bool RedoPutsResultBack() const override { return true; }
};

}  // namespace glimmet
