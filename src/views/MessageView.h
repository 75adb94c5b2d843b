#pragma once

#include <QWidget>

#include "support/MessageTarget.h"
#include "views/ViewRect.h"

namespace glimmet {

/// A widget that takes Messages like a handler and is placed with the
/// inclusive, float rectangles the views compute their layout in.
///
/// PostMessage queues the message through Qt's event loop (any thread, never
/// blocks); MessageReceived runs later in the GUI thread. Messages still
/// queued when the widget is deleted are dropped with it.
class MessageView : public QWidget, public MessageTarget {
    Q_OBJECT

public:
    explicit MessageView(QWidget* parent = nullptr);

    using MessageTarget::PostMessage;
    status_t PostMessage(const Message& message) override;
    virtual void MessageReceived(const Message& message);

    /// The widget's own rectangle: (0, 0, width - 1, height - 1).
    ViewRect Bounds() const;
    /// The widget's rectangle in its parent's coordinates.
    ViewRect Frame() const;

protected:
    /// Moves and resizes the widget to cover the rectangle, its edges
    /// rounded to whole pixels.
    void PlaceAt(const ViewRect& frame);

    void customEvent(QEvent* event) override;
};

}  // namespace glimmet
