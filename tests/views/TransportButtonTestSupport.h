#pragma once

#include <gtest/gtest.h>

#include <QApplication>
#include <QFile>
#include <QImage>
#include <QMouseEvent>
#include <QPalette>
#include <QTest>
#include <QWidget>

#include <cstdint>
#include <memory>
#include <vector>

#include "ViewTestSupport.h"
#include "support/MessageFields.h"
#include "views/TransportButton.h"

namespace glimmet::test {

/// A colour no picture uses, so that a button that draws nothing shows it.
inline QRgb HostColour()
{
    return qRgb(20, 190, 40);
}

/// A window of a plain colour for a button to sit in, at (10, 5).
class ButtonHost : public QWidget {
public:
    ButtonHost()
    {
        QPalette palette;
        palette.setColor(QPalette::Window, QColor(HostColour()));
        setPalette(palette);
        setAutoFillBackground(true);
        resize(80, 40);
    }

    void Show()
    {
        show();
        EXPECT_TRUE(QTest::qWaitForWindowExposed(this));
    }

    /// What the button shows: the host drawn with its children, cut to the
    /// button's rectangle.
    QImage Shown(QWidget* button)
    {
        QCoreApplication::processEvents();
        return grab().toImage().convertToFormat(QImage::Format_RGB32).copy(button->geometry());
    }
};

/// Our uncompressed 24-bit TGA files read byte by byte, independently of
/// the image plugin the buttons load them through. A null image for any
/// other kind of file.
inline QImage DecodeTga(const QByteArray& bytes)
{
    if (bytes.size() < 18 || bytes[2] != 2 || uint8_t(bytes[16]) != 24)
        return {};
    const int idLength = uint8_t(bytes[0]);
    const int width = uint8_t(bytes[12]) | (uint8_t(bytes[13]) << 8);
    const int height = uint8_t(bytes[14]) | (uint8_t(bytes[15]) << 8);
    const bool topDown = (uint8_t(bytes[17]) & 0x20) != 0;
    if (bytes.size() < 18 + idLength + width * height * 3)
        return {};
    QImage image(width, height, QImage::Format_RGB32);
    const char* pixel = bytes.constData() + 18 + idLength;
    for (int row = 0; row < height; ++row) {
        const int y = topDown ? row : height - 1 - row;
        for (int x = 0; x < width; ++x, pixel += 3)
            image.setPixel(x, y, qRgb(uint8_t(pixel[2]), uint8_t(pixel[1]), uint8_t(pixel[0])));
    }
    return image;
}

/// The picture of the resources called name, decoded by the test; null when
/// there is none.
inline QImage ResourcePicture(const QString& name)
{
    QFile file(TransportButton::PictureFolder() + name);
    if (!file.open(QIODevice::ReadOnly))
        return {};
    return DecodeTga(file.readAll());
}

/// An image of the size filled with the host's colour.
inline QImage HostOnly(QSize size)
{
    QImage image(size, QImage::Format_RGB32);
    image.fill(HostColour());
    return image;
}

/// Mouse events as the windowing system delivers them to a button.
struct ButtonMouse {
    QWidget* button;

    void Send(QEvent::Type type, QPoint at, Qt::MouseButton which, Qt::MouseButtons held) const
    {
        const QPointF local(at);
        QMouseEvent event(type, local, local, QPointF(button->mapToGlobal(at)), which, held, Qt::NoModifier);
        QApplication::sendEvent(button, &event);
    }
    void Press(QPoint at, Qt::MouseButton which = Qt::LeftButton, Qt::MouseButtons held = {}) const
    {
        Send(QEvent::MouseButtonPress, at, which, held | which);
    }
    void Move(QPoint at, Qt::MouseButtons held = Qt::LeftButton) const
    {
        Send(QEvent::MouseMove, at, Qt::NoButton, held);
    }
    void Release(QPoint at, Qt::MouseButton which = Qt::LeftButton, Qt::MouseButtons held = {}) const
    {
        Send(QEvent::MouseButtonRelease, at, which, held);
    }
    void Click(QPoint at, Qt::MouseButton which = Qt::LeftButton) const
    {
        Press(at, which);
        Release(at, which);
    }
    QPoint Inside() const { return button->rect().center(); }
    QPoint Outside() const { return QPoint(button->width() + 5, button->height() / 2); }
};

inline int32_t ModeOf(const Message& message)
{
    int32_t mode = -1;
    message.FindInt32(kFieldMode, &mode);
    return mode;
}

inline void* SourceOf(const Message& message)
{
    void* source = nullptr;
    message.FindPointer(kFieldSource, &source);
    return source;
}

}  // namespace glimmet::test
