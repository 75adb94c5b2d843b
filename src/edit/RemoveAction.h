#pragma once

#include "edit/Action.h"

namespace glimmet {

/// "Remove": deletes the range from every selected channel. The base
/// snapshot holds exactly the removed frames; the redo is the base one.
class RemoveAction : public Action {
public:
    using Action::Action;

    /// B_ERROR when not bound. Leaves no range and no selected channel when
    /// at least one channel was cut.
    status_t Go() override;
    /// Inserts the removed frames again and restores range and selection.
    status_t Undo() override;
    const char* Name() override;
};

}  // namespace glimmet
