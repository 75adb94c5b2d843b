#include "views/StopButton.h"

namespace glimmet {

StopButton::StopButton(const char* name, const Message& message, MessageTarget* target, QWidget* parent)
    : TransportButton(name, target, QSize(31, 21), parent), message_(message)
{
}

QString StopButton::PictureName() const
{
    if (!IsEnabled())
        return QStringLiteral("Stopbutton-disabled");
    return IsPushed() ? QStringLiteral("Stopbutton-pushed") : QStringLiteral("Stopbutton-plain");
}

void StopButton::ReleasedInside()
{
    Send(message_);
}

}  // namespace glimmet
