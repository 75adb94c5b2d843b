#pragma once

#include <cstdint>

namespace glimmet {

/// Where the user is editing a document, as far as actions need to know:
/// the edit cursor and the channel with the keyboard focus. The view that
/// shows the document answers these; without a view, an EditPosition does.
/// Actions ask when they run, so a redo sees the position of its own time.
class EditContext {
public:
    virtual ~EditContext() = default;

    /// The edit cursor's frame.
    virtual int64_t CursorFrame() = 0;
    /// Index of the first channel whose view has the keyboard focus; -1 when
    /// none has.
    virtual int32_t FocusIndex() = 0;
};

}  // namespace glimmet
