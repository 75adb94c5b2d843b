#pragma once

#include "edit/Action.h"

namespace glimmet {

/// "Revert Phases": turns the waveform of the range of every selected channel upside down. Undo and redo are the base ones.
class RevertPhasesAction : public Action {
public:
    using Action::Action;

    /// B_ERROR without touching anything when the action is not bound.
    status_t Go() override;
    const char* Name() override;

protected:
    bool RedoPutsResultBack() const override { return true; }
};

}  // namespace glimmet
