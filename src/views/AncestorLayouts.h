#pragma once

class QWidget;

namespace glimmet {

/// The layouts between a widget and its window, brought up to date at once
/// instead of from the layout-request events Qt has queued for them.
class AncestorLayouts {
public:
    /// Activates the layout of every ancestor of widget up to and including
    /// its window; a window that grows resizes widget on the way.
    static void Activate(QWidget* widget);
};

}  // namespace glimmet
