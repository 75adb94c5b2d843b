#pragma once

#include <cstdint>
#include <optional>

#include <QImage>
#include <QString>

#include "support/Message.h"
#include "views/MessageView.h"

namespace glimmet {

/// What the three transport buttons share: a fixed size, one picture taken
/// by name from the application's resources, and the press, track and
/// release of the mouse.
///
/// A press inside an enabled button starts tracking and shows the pushed
/// picture; while the button is held the picture follows the pointer in and
/// out of the bounds; the release ends tracking. What a press and a release
/// inside do beyond that is the subclass's (Pressed, ReleasedInside).
///
/// The picture is loaded at the next draw after anything that may change it
/// (enabled, pushed, mode); a picture that is not in the resources draws
/// nothing. GUI thread only.
class TransportButton : public MessageView {
    Q_OBJECT

public:
    ~TransportButton() override;

    /// When changed: stores it and redraws. A disabled button ignores the
    /// mouse and sends nothing.
    void SetEnabled(bool enabled);
    bool IsEnabled() const { return enabled_; }
    /// A press inside, the button still held.
    bool IsTracking() const { return tracking_; }
    /// The pushed picture is shown (held, pointer inside).
    bool IsPushed() const { return pushed_; }

    /// The resource name of the picture for the current state; empty when
    /// the state has none.
    virtual QString PictureName() const = 0;
    /// The picture the next draw shows, loaded now if it was dropped; a null
    /// image when the resources lack it.
    const QImage& CurrentPicture();

    /// A picture of the application's resources by name, or a null image.
    static QImage LoadPicture(const QString& name);
    /// The folder of the resources that holds the pictures.
    static QString PictureFolder();

    QSize sizeHint() const override { return fixedSize_; }
    QSize minimumSizeHint() const override { return fixedSize_; }

protected:
    /// target is not owned and may be null (nothing is sent).
    TransportButton(const char* name, MessageTarget* target, QSize size, QWidget* parent);

    /// Forgets the picture and schedules a redraw, after a state change.
    void DropPicture();
    /// Posts a copy of the template with "when", "source" and, when given,
    /// "mode" to the target; nothing while disabled or when the button sits
    /// in no window.
    void Send(const Message& templateMessage, std::optional<int32_t> mode = std::nullopt);

    /// The press that started tracking; buttons are those now held.
    virtual void Pressed(Qt::MouseButtons buttons);
    /// The last button came up inside an enabled button.
    virtual void ReleasedInside();

    void paintEvent(QPaintEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;
    void mouseMoveEvent(QMouseEvent* event) override;
    void mouseReleaseEvent(QMouseEvent* event) override;

private:
    bool enabled_ = true;
    bool tracking_ = false;
    bool pushed_ = false;
    QImage picture_;  // null: load at the next draw
    MessageTarget* target_;  // not owned
    QSize fixedSize_;
};

}  // namespace glimmet
