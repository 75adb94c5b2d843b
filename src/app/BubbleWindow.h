#pragma once

#include <QColor>
#include <QString>
#include <QStringList>
#include <QWidget>

namespace glimmet {

/// The bubble of bubble help: a small floating window without a frame that
/// shows a text in black on pale yellow. It never takes the focus and lets
/// mouse events through, so it cannot disturb what the user points at.
///
/// The window's title is the text it shows; nothing draws the title, but it
/// tells accessibility tools and test scripts what the bubble says.
class BubbleWindow : public QWidget {
    Q_OBJECT

public:
    static QColor Background() { return QColor(240, 240, 100); }
    static QColor TextColor() { return QColor(0, 0, 0); }
    /// The margin between the window's edge and the text.
    static constexpr int kInset = 2;

    BubbleWindow();

    void SetText(const QString& text);
    QString Text() const { return text_; }
    /// The height of all lines together.
    int TextHeight() const;
    /// The width of the widest line; 0 when there are no lines.
    int MaxLineWidth() const;

protected:
    void paintEvent(QPaintEvent* event) override;

private:
    QString text_;
    QStringList lines_;
};

}  // namespace glimmet
