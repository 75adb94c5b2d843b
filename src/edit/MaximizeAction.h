#pragma once

#include "edit/Action.h"

namespace glimmet {

/// "Maximize": scales the ranges of all selected channels by one common
/// factor so that the loudest sample among them reaches full scale, keeping
/// their relative levels. Undo and redo are the base ones; the factor comes
/// from the ranges' samples alone, so a redo puts back what Go made.
class MaximizeAction : public Action {
public:
    using Action::Action;

    /// B_ERROR without touching anything when the action is not bound.
    status_t Go() override;
    const char* Name() override;

protected:
    bool RedoPutsResultBack() const override { return true; }
};

}  // namespace glimmet
