#include "views/MessageView.h"

#include <algorithm>

#include <QCoreApplication>

#include "support/MessageEvent.h"
#include "views/PixelCanvas.h"

namespace glimmet {

MessageView::MessageView(QWidget* parent) : QWidget(parent) {}

status_t MessageView::PostMessage(const Message& message)
{
    QCoreApplication::postEvent(this, new MessageEvent(message));
    return B_OK;
}

void MessageView::MessageReceived(const Message&) {}

void MessageView::customEvent(QEvent* event)
{
    if (event->type() == MessageEvent::EventType())
        MessageReceived(static_cast<MessageEvent*>(event)->message());
    else
        QWidget::customEvent(event);
}

ViewRect MessageView::Bounds() const
{
    return {0, 0, float(width() - 1), float(height() - 1)};
}

ViewRect MessageView::Frame() const
{
    return ViewRect::FromQRect(geometry());
}

void MessageView::PlaceAt(const ViewRect& frame)
{
    setGeometry(PixelCanvas::RoundToPixel(frame.left), PixelCanvas::RoundToPixel(frame.top),
                std::max(0, PixelCanvas::RoundToPixel(frame.Width()) + 1),
                std::max(0, PixelCanvas::RoundToPixel(frame.Height()) + 1));
}

}  // namespace glimmet
