#pragma once

#include <QWidget>

#include "support/Message.h"

class QLabel;
class QLineEdit;

namespace glimmet {

class MessageTarget;

/// A labelled one-line text field that posts its message to a target when
/// the user has finished an entry (Enter, or leaving a changed field).
class TextControl : public QWidget {
    Q_OBJECT

public:
    TextControl(const QString& label, const QString& text, Message message, MessageTarget* target,
        QWidget* parent = nullptr);

    QString Text() const;
    void SetText(const QString& text);
    /// From now on only the characters of allowed can be typed or pasted.
    void AllowOnly(const QString& allowed);

    QLabel* Label() const { return label_; }
    QLineEdit* Field() const { return field_; }

private:
    void EntryFinished();
    void ShowStartUnlessEditing();

    QLabel* label_;
    QLineEdit* field_;
    Message message_;
    MessageTarget* target_;
};

}  // namespace glimmet
