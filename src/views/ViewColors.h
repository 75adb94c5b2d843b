#pragma once

#include <QColor>

namespace glimmet {

/// The grey that every view of a document window stands on: the control
/// row, the window's border, the container's margins and empty areas.
inline QColor ViewBackgroundColor()
{
    return QColor(216, 216, 216);
}

}  // namespace glimmet
