#pragma once

#include <cstdint>

#include "edit/EditContext.h"

namespace glimmet {

/// An edit position held as plain values, for editing a document that no
/// view shows (scripts, tools, engine tests).
class EditPosition : public EditContext {
public:
    EditPosition() = default;
    EditPosition(int64_t cursor, int32_t focus) : cursor_(cursor), focus_(focus) {}

    int64_t CursorFrame() override { return cursor_; }
    int32_t FocusIndex() override { return focus_; }

    void SetCursorFrame(int64_t frame) { cursor_ = frame; }
    /// -1: no channel has the focus.
    void SetFocusIndex(int32_t index) { focus_ = index; }

private:
    int64_t cursor_ = 0;
    int32_t focus_ = -1;
};

}  // namespace glimmet
