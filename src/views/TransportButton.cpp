#include "views/TransportButton.h"

#include <QMouseEvent>
#include <QPainter>

#include "support/MessageFields.h"
#include "support/SystemTime.h"

// The pictures are compiled into this static library; a reference to their
// initialiser keeps the linker from dropping them from a program that only
// uses the buttons. It must be called from outside any namespace.
static void InitTransportPictures()
{
    Q_INIT_RESOURCE(TransportPictures);
}

namespace glimmet {

TransportButton::TransportButton(const char* name, MessageTarget* target, QSize size, QWidget* parent)
    : MessageView(parent), target_(target), fixedSize_(size)
{
    static const bool initialised = (InitTransportPictures(), true);
    (void)initialised;
    setObjectName(QString::fromUtf8(name));
    setFixedSize(size);
    setFocusPolicy(Qt::TabFocus);
    // Where a picture is missing the row's grey shows through.
    setAttribute(Qt::WA_NoSystemBackground);
}

TransportButton::~TransportButton() = default;

QString TransportButton::PictureFolder()
{
    return QStringLiteral(":/pictures/");
}

QImage TransportButton::LoadPicture(const QString& name)
{
    if (name.isEmpty())
        return {};
    // Named without a suffix, so the format is given.
    return QImage(PictureFolder() + name, "TGA");
}

const QImage& TransportButton::CurrentPicture()
{
    if (picture_.isNull())
        picture_ = LoadPicture(PictureName());
    return picture_;
}

void TransportButton::SetEnabled(bool enabled)
{
    if (enabled == enabled_)
        return;
    enabled_ = enabled;
    DropPicture();
}

void TransportButton::DropPicture()
{
    picture_ = QImage();
    update();
}

void TransportButton::Send(const Message& templateMessage, std::optional<int32_t> mode)
{
    // A button of no window has nobody to tell.
    if (!enabled_ || target_ == nullptr || parentWidget() == nullptr)
        return;
    Message message(templateMessage);
    message.AddInt64(kFieldWhen, system_time());
    message.AddPointer(kFieldSource, this);
    if (mode)
        message.AddInt32(kFieldMode, *mode);
    target_->PostMessage(message);
}

void TransportButton::Pressed(Qt::MouseButtons) {}

void TransportButton::ReleasedInside() {}

void TransportButton::paintEvent(QPaintEvent*)
{
    const QImage& picture = CurrentPicture();
    if (picture.isNull())
        return;
    QPainter painter(this);
    painter.drawImage(0, 0, picture);
}

// Only the first button of a press counts: further buttons pressed while
// one is held neither restart tracking nor send again.
void TransportButton::mousePressEvent(QMouseEvent* event)
{
    if (!enabled_ || tracking_ || !rect().contains(event->position().toPoint()))
        return;
    tracking_ = true;
    pushed_ = true;
    DropPicture();
    Pressed(event->buttons());
}

void TransportButton::mouseMoveEvent(QMouseEvent* event)
{
    if (!tracking_)
        return;
    const bool inside = rect().contains(event->position().toPoint());
    if (inside == pushed_)
        return;
    pushed_ = inside;
    DropPicture();
}

// The release that ends tracking is the one that leaves no button held.
void TransportButton::mouseReleaseEvent(QMouseEvent* event)
{
    if (!tracking_ || event->buttons() != Qt::NoButton)
        return;
    const bool inside = rect().contains(event->position().toPoint());
    tracking_ = false;
    // A release outside may come without a move out before it; the
    // pushed picture must not stay behind.
    if (pushed_) {
        pushed_ = false;
        DropPicture();
    }
    if (inside && enabled_)
        ReleasedInside();
}

}  // namespace glimmet
